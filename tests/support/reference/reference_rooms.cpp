// Rooms of the reference: rows of the tests' own lists, tails, and the walls of a shoebox.
#include "support/reference/reference_rooms.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <ios>

#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "support/room_tables.h"

namespace tessaly::reference {

namespace {

constexpr double pi8 = 3.14159265;  // the system's angles know no more digits
constexpr float nowhere = 1000000.0f;

float squared(float value) { return value * value; }

double arcCosine(float cosine) { return wide(std::acos(cosine) * 180.0f) * 0.31830988654751274; }

/// From the wall's nearest point to the azimuth it is heard from; `offset` is the source's way
/// along the wall.
std::int16_t mirrorAngle(float wall, float offset) {
    const float half = std::sqrt(squared(wall) + squared(offset * 0.5f));
    return truncateToInt16(90.0 - arcCosine(offset / ((2.0f * half - offset) + offset)));
}

void reflectAtSide(ReflectionRecord& record,
                   bool positive,
                   float wall,
                   float excess,
                   float sine,
                   float cosine,
                   const WallScene& scene) {
    const float d = scene.distance;
    const float oblique = single(arcCosine(d / (d + excess)));
    const float angle = oblique * (1.0f - sine) + sine * 90.0f;
    int phi = truncateToInt16(positive ? angle : -angle);
    if (std::abs(scene.phi) > 90) {
        phi = (positive ? 180 : -180) - phi;
    }
    record.phi = wrapToInt16(phi);
    const bool near = positive ? scene.phi > 0 : scene.phi < 0;
    const float across = squared(sine) * 2.0f * (near ? wall - d : wall);
    const float path = across + squared(cosine) * excess;
    record.reflectionDistance = std::abs(path) + d;
    record.delaySamples = truncateToInt16(std::abs(scene.samplesPerMetre * path));
}

void reflectInside(ReflectionRecord& record,
                   int k,
                   float wall,
                   float ahead,
                   float aside,
                   float cosine,
                   float sine,
                   const WallScene& scene) {
    const float d = scene.distance;
    const float excess = 2.0f * std::sqrt(squared(wall) + squared(d * 0.5f)) - d;
    if (k >= 4) {
        reflectAtSide(record, k == 4, wall, excess, sine, cosine, scene);
        return;
    }
    const float path = k < 2 ? excess : 2.0f * wall - ahead;
    record.delaySamples = truncateToInt16(k < 2 ? scene.samplesPerMetre * path
                                                : std::abs(scene.samplesPerMetre * path));
    record.reflectionDistance = k == 2 ? std::abs(path) : std::abs(path) + d;
    if (k >= 2) {
        const int angle = mirrorAngle(wall, aside);
        record.phi = wrapToInt16(k == 2 ? angle : (scene.phi > 0 ? 180 : -180) - angle);
    }
}

}  // namespace

PresetRow presetRowOf(int preset) {
    PresetRow row;
    for (const test::RoomLine& line : test::readRoomLines()) {
        if (line.preset != preset) {
            continue;
        }
        row.phi = line.azimuths;
        row.theta = line.elevations;
        row.delay = line.delays;
        row.gain = line.gains;
        row.filterClass = line.classes;
        row.earlyFlexFirSize = line.firSize;
        row.earlyPresetGain = line.gain;
        std::copy_n(line.walls.begin(), row.roomDistances.size(), row.roomDistances.begin());
        row.reflectionLP_Fc = line.cutOffs[0];
        row.reflectionLP2_Fc = line.cutOffs[1];
        row.reverbLP_Fc = line.cutOffs[2];
        row.presetUsesFilters = line.filtersRecords;
        row.hasReverbLowPass = line.filtersTail;
    }
    return row;
}

Tail tailOf(int preset, int sampleRate, const std::function<float(int, int, int)>& sample) {
    Tail tail;
    for (const test::TailLine& line : test::readTailLines()) {
        if (line.preset != preset) {
            continue;
        }
        tail.presetGain = line.gain;
        const int frames = line.frames[sampleRate == 24000 ? 0 : sampleRate == 44100 ? 1 : 2];
        for (int i = 0; i < 2 * frames; ++i) {
            tail.pairs.push_back(line.length48000 > 0 ? sample(preset, i / 2, i % 2) : 0.0f);
        }
    }
    return tail;
}

Tail packedTailOf(const std::string& directory, int preset, int sampleRate) {
    constexpr std::streamoff indexAt = 2;
    constexpr std::streamoff samplesAt = 242;
    const char* digit = sampleRate == 44100 ? "0" : sampleRate == 48000 ? "1" : "2";
    std::ifstream file(directory + "/TSLdata51" + digit + ".dat", std::ios::binary);
    std::int32_t start = 0;
    file.seekg(indexAt + 4 * (preset - 1));
    file.read(reinterpret_cast<char*>(&start), sizeof start);
    file.seekg(samplesAt + 8 * static_cast<std::streamoff>(start));
    // Frames and ears are asked for in the order of the file.
    return tailOf(preset, sampleRate, [&file](int, int, int) {
        float sample = 0.0f;
        file.read(reinterpret_cast<char*>(&sample), sizeof sample);
        return file ? sample : 0.0f;
    });
}

bool reflectAtWall(ReflectionRecord& record, int k, const WallScene& scene) {
    const double turn = scene.phi * 0.005555555555555556 * pi8;
    const float cosine = single(std::cos(turn));
    const float sine = single(std::sin(turn));
    const float rise =
        single(std::sin(wide(static_cast<float>(scene.theta) * 0.0055555557f) * pi8));
    const float x = scene.distance * cosine;
    const float y = scene.distance * sine;
    const float z = scene.distance * rise;
    const std::array<float, 6> ahead{z, -z, x, -x, y, -y};

    const float scale = k == 1 ? 1.0f : (scene.roomSizeFactor + 1.0f) * 0.5f;
    const float wall = scene.roomDistances[static_cast<std::size_t>(k)] * scale;
    record.wallDistance = wall;
    if (wall > 0.0f && wall <= ahead[static_cast<std::size_t>(k)]) {
        record.wallDistance = -1.0f;
        record.reflectionDistance = nowhere;
    } else if (wall > 0.0f) {
        reflectInside(record, k, wall, ahead[static_cast<std::size_t>(k)], y, std::abs(cosine),
                      std::abs(sine), scene);
    }
    if (scene.earlyFlexRefPreset >= 13) {
        const float gain = 1.0f / record.reflectionDistance;
        record.distanceGain = gain > 1.0f ? 1.0f : gain;
    }
    return !(record.wallDistance < 0.0f);
}

}  // namespace tessaly::reference
