// Keeps the reflection records true while the source moves.
#include "engine/room_geometry.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "base/log.h"
#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "resources/hrir_grid.h"

namespace tessaly {

namespace {

constexpr int wallCount = 6;                          // the first records are the room's walls
constexpr double piShort = 3.14159265;                // as the angles were authored with
constexpr double perPiShort = 0.31830988654751274;    // 1 / 3.14159265, not quite 1 / pi
constexpr double perHalfTurn = 0.005555555555555556;  // 1 / 180
constexpr float perHalfTurnSingle = 0.0055555557f;    // 1 / 180
constexpr float noSuchPath = 1000000.0f;              // metres: a reflection that does not exist

float square(float value) noexcept { return std::pow(value, 2.0f); }

/// Arc cosine in degrees.
double degrees(float cosine) noexcept { return wide(std::acos(cosine) * 180.0f) * perPiShort; }

/// The source in the room: what all walls share.
struct Scene {
    float d;               // metres
    float cosDistance;     // metres to the front
    float sinDistance;     // metres to the positive side
    float heightDistance;  // metres up
    float absCos;
    float absSin;
    int phi;  // degrees
    float samplesPerMetre;
};

/// Extra length of a path by a wall at distance `wall`, parallel to the line from source to
/// listener.
float mirrorExcess(float wall, float d) noexcept {
    return 2.0f * std::sqrt(square(wall) + square(d * 0.5f)) - d;
}

void markOutside(ReflectionRecord& record) noexcept {
    record.wallDistance = -1.0f;
    record.reflectionDistance = noSuchPath;
}

/// Walls above and below. The elevation found here gives way to the preset's offset later on.
void reflectAtHeight(ReflectionRecord& record,
                     float wall,
                     const Scene& scene,
                     float sign) noexcept {
    const float r = mirrorExcess(wall, scene.d);
    record.theta = truncateToInt16(wide(sign) * degrees(scene.d / (scene.d + r)));
    record.delaySamples = truncateToInt16(scene.samplesPerMetre * r);
    record.reflectionDistance = std::fabs(r) + scene.d;
}

/// Angle off the listener's axis at which a wall across that axis reflects.
std::int16_t angleOffAxis(float wall, const Scene& scene) noexcept {
    const float y = scene.sinDistance;
    const float q = std::sqrt(square(wall) + square(y * 0.5f));
    return truncateToInt16(90.0 - degrees(y / ((2.0f * q - y) + y)));
}

void reflectAtFront(ReflectionRecord& record, float wall, const Scene& scene) noexcept {
    const float path = 2.0f * wall - scene.cosDistance;
    // The front wall's path goes without the source's own distance, unlike all others.
    record.reflectionDistance = std::fabs(path);
    record.delaySamples = truncateToInt16(std::fabs(scene.samplesPerMetre * path));
    record.phi = angleOffAxis(wall, scene);
}

void reflectAtBack(ReflectionRecord& record, float wall, const Scene& scene) noexcept {
    const float path = 2.0f * wall + scene.cosDistance;
    record.delaySamples = truncateToInt16(std::fabs(scene.samplesPerMetre * path));
    record.reflectionDistance = std::fabs(path) + scene.d;
    const std::int16_t b = angleOffAxis(wall, scene);
    record.phi = scene.phi > 0 ? wrapToInt16(180 - b) : wrapToInt16(-180 - b);
}

/// Side walls; `positive` is the side of positive `sinDistance`.
void reflectAtSide(ReflectionRecord& record,
                   float wall,
                   const Scene& scene,
                   bool positive) noexcept {
    const float r = mirrorExcess(wall, scene.d);
    const float a = single(degrees(scene.d / (scene.d + r)));
    const float v = a * (1.0f - scene.absSin) + scene.absSin * 90.0f;
    int phi = truncateToInt16(positive ? v : -v);
    if (std::abs(scene.phi) > 90) {
        phi = positive ? (90 - phi) * 2 + phi : phi - (phi * 2 + 180);
    }
    record.phi = wrapToInt16(phi);
    const bool sourceOnThisSide = positive ? scene.phi > 0 : scene.phi < 0;
    const float c = square(scene.absSin) * 2.0f * (sourceOnThisSide ? wall - scene.d : wall);
    const float u = c + square(scene.absCos) * r;
    record.reflectionDistance = std::fabs(u) + scene.d;
    record.delaySamples = truncateToInt16(std::fabs(scene.samplesPerMetre * u));
}

/// One wall of the shoebox, for a positive wall distance.
void reflectAtWall(ReflectionRecord& record, int k, float wall, const Scene& scene) noexcept {
    const float limits[wallCount] = {scene.heightDistance, -scene.heightDistance,
                                     scene.cosDistance,    -scene.cosDistance,
                                     scene.sinDistance,    -scene.sinDistance};
    if (wall <= limits[k]) {
        markOutside(record);
        const bool side = k >= 4;
        logTrace("Ref ", k, side ? " sinDistance = " : " cosDistance = ",
                 side ? scene.sinDistance : scene.cosDistance,
                 k == 2 ? " out of Room, ReflectionDistance set to 1000000!"
                        : " out of RoomWall  ReflectionDistance set to 1000000!");
        return;
    }
    switch (k) {
        case 0:
            reflectAtHeight(record, wall, scene, 1.0f);
            break;
        case 1:
            reflectAtHeight(record, wall, scene, -1.0f);
            break;
        case 2:
            reflectAtFront(record, wall, scene);
            break;
        case 3:
            reflectAtBack(record, wall, scene);
            break;
        default:
            reflectAtSide(record, wall, scene, k == 4);
            break;
    }
}

std::int16_t clampTo(int angle, int limit) noexcept {
    if (angle <= -limit) {
        return wrapToInt16(-limit);
    }
    return wrapToInt16(angle >= limit + 4 ? limit : angle);
}

std::int16_t limitPhiOf(int phi, int limitPhi) noexcept {
    const int turned = limitPhi == 180 ? turnedRound(phi) : phi;
    return turned != phi ? wrapToInt16(turned) : clampTo(phi, limitPhi);
}

std::int16_t limitThetaOf(int theta, int limitTheta) noexcept {
    if (limitTheta == 90) {
        if (theta < -steepestTheta) {
            return -steepestTheta;
        }
        if (theta > steepestTheta) {
            return steepestTheta;
        }
    }
    return clampTo(theta, limitTheta);
}

}  // namespace

void updateReflections(Reflections& reflections,
                       const SourceDirection& direction,
                       const DistanceLaw& law,
                       const LiveControls& controls,
                       const EffectiveSettings& switches,
                       std::int16_t earlyFlexRefPreset,
                       float samplesPerMetre) noexcept {
    const double a = direction.phi * perHalfTurn * piShort;
    const float cosPhi = single(std::cos(a));
    const float sinPhi = single(std::sin(a));
    const float sinTheta =
        single(std::sin(wide(static_cast<float>(direction.theta) * perHalfTurnSingle) * piShort));
    const float d = law.distance;
    const Scene scene{d,
                      d * cosPhi,
                      d * sinPhi,
                      d * sinTheta,
                      std::fabs(cosPhi),
                      std::fabs(sinPhi),
                      direction.phi,
                      samplesPerMetre};
    const float roomScale = (controls.roomSizeFactor + 1.0f) * 0.5f;
    const bool metric = earlyFlexRefPreset >= firstMetricPreset;
    const int count = std::min<int>(reflections.flexReflectionCount, Reflections::capacity);

    for (int k = 0; k < count; ++k) {
        ReflectionRecord& record = reflections.records[static_cast<std::size_t>(k)];
        if (switches.auralisation && k < wallCount) {
            // The floor does not scale with the room.
            const float wall =
                k == 1 ? controls.roomDistances[1]
                       : controls.roomDistances[static_cast<std::size_t>(k)] * roomScale;
            record.wallDistance = wall;
            if (wall > 0.0f) {
                reflectAtWall(record, k, wall, scene);
            }
            if (metric) {
                record.distanceGain = std::min(1.0f / record.reflectionDistance, 1.0f);
            }
            if (record.wallDistance < 0.0f) {
                continue;
            }
        }
        int phi = record.phi;
        if (!switches.auralisation || k < 2 || k >= wallCount) {
            phi = wrapToInt16(record.relativePhi + direction.phi);
        }
        if (!switches.auralisation && metric) {
            record.distanceGain = std::min(
                samplesPerMetre / (static_cast<float>(record.delaySamples) + samplesPerMetre * d),
                1.0f);
        }
        record.phi = limitPhiOf(phi, switches.limitPhi);
        record.indexPhi = phiToIndex(record.phi);
        record.theta =
            limitThetaOf(wrapToInt16(record.relativeTheta + direction.theta), switches.limitTheta);
        record.indexTheta = thetaToIndex(record.theta);
    }
}

}  // namespace tessaly
