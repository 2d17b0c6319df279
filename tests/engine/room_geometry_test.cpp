// Reflections that follow the source: preset offsets, and the six walls of a shoebox.
#include "engine/room_geometry.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <optional>
#include <sstream>
#include <string>
#include <vector>

namespace tessaly::test {
namespace {

constexpr double nan = std::numeric_limits<double>::quiet_NaN();
constexpr float infinity = std::numeric_limits<float>::infinity();
constexpr double outsidePath = 1000000.0;

/// What one call reads, and the records before it.
struct Room {
    int phi = 0;     // degrees
    int theta = 0;   // degrees
    float d = 1.0f;  // metres
    float size = 1.0f;
    std::array<float, 6> walls = {2.8f, 1.8f, 3.2f, 2.1f, 2.5f, 3.0f};
    int limitPhi = 180;
    int limitTheta = 90;
    int preset = 15;
    bool auralisation = true;
    int sampleRate = 48000;
    int count = 8;

    float samplesPerMetre() const { return static_cast<float>(sampleRate * 0.0029118863199580685); }
};

using Records = std::array<ReflectionRecord, Reflections::capacity>;

/// Records with a value of its own in every field, so that a field left alone is seen.
Records markedRecords() {
    constexpr std::array<int, 8> azimuths = {-5, 5, 10, -175, -70, 75, -90, 155};
    constexpr std::array<int, 8> elevations = {60, -30, 0, 0, 0, 5, -15, 10};
    Records records{};
    for (std::size_t k = 0; k < records.size(); ++k) {
        const auto mark = static_cast<std::int16_t>(k);
        ReflectionRecord& record = records[k];
        record.relativePhi = static_cast<std::int16_t>(azimuths[k % 8]);
        record.relativeTheta = static_cast<std::int16_t>(elevations[k % 8]);
        record.phi = static_cast<std::int16_t>(20 + mark);
        record.theta = static_cast<std::int16_t>(40 + mark);
        record.indexPhi = static_cast<std::int16_t>(1 + mark);
        record.indexTheta = static_cast<std::int16_t>(2 + mark);
        record.presetDelaySamples = static_cast<std::int16_t>(300 + mark);
        record.delaySamples = static_cast<std::int16_t>(500 + mark);
        record.distanceGain = 0.25f + 0.01f * static_cast<float>(k);
        record.gain = 0.05f * static_cast<float>(k);
        record.filterClass = static_cast<std::int16_t>(k < 6 ? 0 : 1);
        record.wallDistance = 9.0f;
        record.reflectionDistance = 3.5f + static_cast<float>(k);
    }
    return records;
}

Records run(const Room& room, const Records& before = markedRecords()) {
    Reflections reflections;
    reflections.records = before;
    reflections.flexReflectionCount = static_cast<std::int16_t>(room.count);
    SourceDirection direction;
    direction.phi = static_cast<std::int16_t>(room.phi);
    direction.theta = static_cast<std::int16_t>(room.theta);
    DistanceLaw law;
    law.distance = room.d;
    LiveControls controls;
    controls.roomSizeFactor = room.size;
    controls.roomDistances = room.walls;
    EffectiveSettings switches;
    switches.auralisation = room.auralisation;
    switches.limitPhi = static_cast<std::int16_t>(room.limitPhi);
    switches.limitTheta = static_cast<std::int16_t>(room.limitTheta);
    updateReflections(reflections, direction, law, controls, switches,
                      static_cast<std::int16_t>(room.preset), room.samplesPerMetre());
    return reflections.records;
}

// ---- The same once more, in double precision ----

/// One wall as it comes out before anything is made an integer. Empty: keeps its old value.
struct Wall {
    double distance = nan;
    bool closeCall = false;  ///< inside or outside by less than single precision can tell
    bool outside = false;
    std::optional<double> delay;
    std::optional<double> path;
    std::optional<double> phi;
};

double degreesOf(double cosine) { return std::acos(cosine) * 180.0 / 3.14159265; }

/// Extra way by a wall parallel to the line from source to listener.
double mirrorExcess(double wall, double d) {
    return 2.0 * std::sqrt(wall * wall + 0.25 * d * d) - d;
}

Wall wallOf(const Room& room, int k) {
    Wall wall;
    const double a = room.phi / 180.0 * 3.14159265;
    const double d = static_cast<double>(room.d);
    const double x = d * std::cos(a);
    const double y = d * std::sin(a);
    const double z = d * std::sin(room.theta / 180.0 * 3.14159265);
    const double metre = static_cast<double>(room.samplesPerMetre());
    const double scale = k == 1 ? 1.0 : (static_cast<double>(room.size) + 1.0) * 0.5;
    const double w = static_cast<double>(room.walls[static_cast<std::size_t>(k)]) * scale;
    wall.distance = w;
    if (!(w > 0.0)) {
        return wall;
    }
    const std::array<double, 6> ahead = {z, -z, x, -x, y, -y};
    const double gap = w - ahead[static_cast<std::size_t>(k)];
    wall.closeCall = std::abs(gap) < 1e-5 * w;
    if (gap <= 0.0) {
        wall.outside = true;
        wall.path = outsidePath;
        return wall;
    }
    const double r = mirrorExcess(w, d);
    const double q = std::sqrt(w * w + 0.25 * y * y);
    const double offAxis = 90.0 - degreesOf(y / (2.0 * q));
    const double sin2 = std::sin(a) * std::sin(a);
    const double cos2 = std::cos(a) * std::cos(a);
    switch (k) {
        case 0:
        case 1:
            wall.delay = metre * r;
            wall.path = std::abs(r) + d;
            break;
        case 2:
            wall.path = std::abs(2.0 * w - x);
            wall.delay = metre * *wall.path;
            wall.phi = offAxis;
            break;
        case 3:
            wall.delay = metre * std::abs(2.0 * w + x);
            wall.path = std::abs(2.0 * w + x) + d;
            wall.phi = offAxis;
            break;
        default: {
            const double s = std::abs(std::sin(a));
            const double v = degreesOf(d / (d + r)) * (1.0 - s) + s * 90.0;
            const bool here = k == 4 ? room.phi > 0 : room.phi < 0;
            const double u = sin2 * 2.0 * (here ? w - d : w) + cos2 * r;
            wall.phi = k == 4 ? v : -v;
            wall.delay = metre * std::abs(u);
            wall.path = std::abs(u) + d;
            break;
        }
    }
    return wall;
}

/// Whole values that a truncated number may take: two if it lies within a thousandth of a
/// boundary, where single and double precision may fall to different sides.
std::vector<int> wholes(double value) {
    const int low = static_cast<int>(value - 1e-3);
    const int high = static_cast<int>(value + 1e-3);
    return low == high ? std::vector<int>{low} : std::vector<int>{low, high};
}

/// What the walls behind and at the sides make of their whole angle.
int turned(const Room& room, int k, int angle) {
    if (k == 3) {
        return room.phi > 0 ? 180 - angle : -180 - angle;
    }
    if (k >= 4 && std::abs(room.phi) > 90) {
        return k == 4 ? 180 - angle : -angle - 180;
    }
    return angle;
}

int withinPhi(int phi, int limit) {
    if (limit == 180 && (phi <= -180 || phi > 180)) {
        return phi > 180 ? phi - 360 : phi + 360;
    }
    return phi <= -limit ? -limit : (phi >= limit + 4 ? limit : phi);
}

int withinTheta(int theta, int limit) {
    if (limit == 90 && std::abs(theta) > 75) {
        return theta > 0 ? 75 : -75;
    }
    return theta <= -limit ? -limit : (theta >= limit + 4 ? limit : theta);
}

/// The first difference of one record, or nothing.
class Comparison {
public:
    Comparison(const Room& room, int k, const ReflectionRecord& before, const ReflectionRecord& got)
        : room_(room), k_(k), before_(before), got_(got) {}

    std::string difference() {
        exactly("relativePhi", got_.relativePhi, before_.relativePhi);
        exactly("relativeTheta", got_.relativeTheta, before_.relativeTheta);
        exactly("presetDelaySamples", got_.presetDelaySamples, before_.presetDelaySamples);
        exactly("filterClass", got_.filterClass, before_.filterClass);
        nearly("gain", got_.gain, static_cast<double>(before_.gain));
        const bool metric = room_.preset >= 13;
        std::optional<double> gain;
        std::vector<int> phis = {before_.relativePhi + room_.phi};
        bool finished = false;
        if (room_.auralisation && k_ < 6) {
            const Wall wall = wallOf(room_, k_);
            if (wall.closeCall) {
                return {};
            }
            nearly("wallDistance", got_.wallDistance, wall.outside ? -1.0 : wall.distance);
            nearly("reflectionDistance", got_.reflectionDistance,
                   wall.path.value_or(static_cast<double>(before_.reflectionDistance)));
            oneOf("delaySamples", got_.delaySamples,
                  wall.delay ? wholes(*wall.delay) : std::vector<int>{before_.delaySamples});
            if (metric) {
                gain = 1.0 / wall.path.value_or(static_cast<double>(before_.reflectionDistance));
            }
            finished = wall.outside || wall.distance < 0.0;
            if (k_ >= 2) {
                phis = {before_.phi};
            }
            if (wall.phi) {
                phis = wholes(*wall.phi);
                for (int& phi : phis) {
                    phi = turned(room_, k_, phi);
                }
            }
        } else {
            nearly("wallDistance", got_.wallDistance, static_cast<double>(before_.wallDistance));
            exactly("delaySamples", got_.delaySamples, before_.delaySamples);
            nearly("reflectionDistance", got_.reflectionDistance,
                   static_cast<double>(before_.reflectionDistance));
        }
        if (metric && !room_.auralisation) {
            const double metre = static_cast<double>(room_.samplesPerMetre());
            gain = metre / (before_.delaySamples + metre * static_cast<double>(room_.d));
        }
        nearly("distanceGain", got_.distanceGain,
               gain ? std::min(*gain, 1.0) : static_cast<double>(before_.distanceGain));
        if (finished) {
            exactly("phi", got_.phi, before_.phi);
            exactly("theta", got_.theta, before_.theta);
            exactly("indexPhi", got_.indexPhi, before_.indexPhi);
            exactly("indexTheta", got_.indexTheta, before_.indexTheta);
            return text_.str();
        }
        for (int& phi : phis) {
            phi = withinPhi(phi, room_.limitPhi);
        }
        oneOf("phi", got_.phi, phis);
        exactly("theta", got_.theta,
                withinTheta(before_.relativeTheta + room_.theta, room_.limitTheta));
        exactly("indexPhi", got_.indexPhi, (got_.phi + 180) / 5);
        exactly("indexTheta", got_.indexTheta, (got_.theta + 90) / 5);
        return text_.str();
    }

private:
    void exactly(const char* field, int got, int expected) { oneOf(field, got, {expected}); }
    void oneOf(const char* field, int got, const std::vector<int>& expected) {
        if (std::find(expected.begin(), expected.end(), got) == expected.end()) {
            text_ << field << " is " << got << " instead of " << expected.front() << "; ";
        }
    }
    void nearly(const char* field, float got, double expected) {
        // Differences of nearly equal lengths cancel: a few roundings of the longest length.
        const double longest = std::max(1.0, static_cast<double>(room_.d));
        if (!(std::abs(static_cast<double>(got) - expected) <=
              2e-6 * std::max(longest, std::abs(expected)))) {
            text_ << field << " is " << got << " instead of " << expected << "; ";
        }
    }

    const Room& room_;
    int k_;
    const ReflectionRecord& before_;
    const ReflectionRecord& got_;
    std::ostringstream text_;
};

std::string nameOf(const Room& room, int k) {
    std::ostringstream text;
    text << "record " << k << ", phi " << room.phi << ", theta " << room.theta << ", d " << room.d
         << ", size " << room.size << ", wall " << room.walls[static_cast<std::size_t>(k % 6)]
         << ", limits " << room.limitPhi << "/" << room.limitTheta << ", preset " << room.preset
         << (room.auralisation ? ", auralised, " : ", ") << room.sampleRate << " Hz";
    return text.str();
}

/// Compares all records in use and that the one behind them is left alone.
/// @return differences found; the first few are reported
int compare(const Room& room) {
    static const Records before = markedRecords();
    const Records got = run(room, before);
    int differences = 0;
    for (int k = 0; k < room.count; ++k) {
        const auto i = static_cast<std::size_t>(k);
        const std::string text = Comparison(room, k, before[i], got[i]).difference();
        if (!text.empty()) {
            ++differences;
            ADD_FAILURE() << nameOf(room, k) << ": " << text;
        }
    }
    const auto behind = static_cast<std::size_t>(room.count);
    EXPECT_EQ(got[behind].phi, before[behind].phi);
    EXPECT_EQ(got[behind].distanceGain, before[behind].distanceGain);
    return differences;
}

constexpr std::array<std::array<float, 6>, 5> rooms = {{
    {2.8f, 1.8f, 3.2f, 2.1f, 2.5f, 3.0f},
    {27.2f, 1.8f, 56.1f, 60.1f, 35.4f, 34.8f},
    {-1.0f, 1.8f, 8.28f, -1.0f, 14.2f, -1.0f},
    {0.0f, 0.0f, 0.0f, 0.0f, 0.0f, 0.0f},
    {0.6f, 0.4f, 0.5f, 0.9f, 1.0f, 0.25f},
}};
constexpr std::array<float, 6> sizes = {1.0f, 0.4f, 0.0f, -0.5f, -1.0f, 2.0f};
constexpr std::array<float, 6> distances = {0.0f, 0.1f, 0.9f, 2.5f, 7.0f, 20.0f};
constexpr std::array<std::array<int, 2>, 4> limits = {{{180, 90}, {90, 0}, {45, 30}, {175, 75}}};

/// Every combination of one room's grid, one rate after the other.
void compareGrid(bool auralisation, int preset) {
    int calls = 0;
    for (const auto& walls : rooms) {
        for (const float size : sizes) {
            for (const auto& limit : limits) {
                for (const float d : distances) {
                    for (int phi = -180; phi <= 180; phi += 12 + calls % 7) {
                        for (const int theta : {-90, -44, 0, 13, 60, 90}) {
                            Room room{phi, theta, d, size, walls, limit[0], limit[1]};
                            room.preset = preset;
                            room.auralisation = auralisation;
                            room.sampleRate = std::array{24000, 44100, 48000}[calls % 3u];
                            ++calls;
                            if (compare(room) > 0) {
                                return;
                            }
                        }
                    }
                }
            }
        }
    }
    EXPECT_GT(calls, 50000);
}

TEST(RoomGeometry, WallsOfAPresetThatFollowsThePath) { compareGrid(true, 13); }

TEST(RoomGeometry, WallsOfAPresetBelowThirteenKeepTheirGain) { compareGrid(true, 12); }

TEST(RoomGeometry, OffsetsOfAPresetThatFollowsThePath) { compareGrid(false, 13); }

TEST(RoomGeometry, OffsetsOfAPresetBelowThirteenKeepTheirGain) { compareGrid(false, 12); }

TEST(RoomGeometry, EveryDegreeInAnOrdinaryRoom) {
    for (int phi = -180; phi <= 180; ++phi) {
        for (const float d : {0.5f, 1.7f, 2.4f, 3.1f}) {
            Room room{phi, phi % 40, d};
            ASSERT_EQ(compare(room), 0);
        }
    }
}

// ---- Values that can be told by hand ----

TEST(RoomGeometry, SourceStraightAheadIsReflectedFromFrontAndBack) {
    const Records got = run(Room{});
    EXPECT_EQ(got[2].phi, 0);
    EXPECT_EQ(got[2].indexPhi, 36);
    EXPECT_EQ(got[3].phi, 180) << "-180 is turned round by the limits";
    EXPECT_EQ(got[3].indexPhi, 72);
    EXPECT_FLOAT_EQ(got[2].reflectionDistance, 5.4f) << "without the source's own distance";
    EXPECT_FLOAT_EQ(got[3].reflectionDistance, 6.2f) << "with it";
    EXPECT_EQ(got[2].delaySamples, 754);  // 5.4 m of 139.7705 samples
    EXPECT_EQ(got[3].delaySamples, 726);  // 5.2 m
    EXPECT_FLOAT_EQ(got[2].distanceGain, 1.0f / 5.4f);
    EXPECT_FLOAT_EQ(got[3].distanceGain, 1.0f / 6.2f);
}

TEST(RoomGeometry, BackWallStaysBehindUnderNarrowLimits) {
    Room room;
    room.limitPhi = 90;
    EXPECT_EQ(run(room)[3].phi, -90);
    room.phi = 1;
    EXPECT_EQ(run(room)[3].phi, 90);
    room.limitPhi = 180;
    EXPECT_EQ(run(room)[3].phi, 180);
}

TEST(RoomGeometry, SourceAtTheSideHearsThatSideAtNinety) {
    Room room;
    room.phi = 90;
    room.d = 1.5f;
    Records got = run(room);
    EXPECT_EQ(got[4].phi, 90);
    EXPECT_EQ(got[5].phi, -90);
    EXPECT_FLOAT_EQ(got[4].reflectionDistance, 3.5f);  // 2 * (2.5 - 1.5), and the way itself
    EXPECT_FLOAT_EQ(got[5].reflectionDistance, 7.5f);  // 2 * 3 and the way itself
    room.phi = -90;
    got = run(room);
    EXPECT_EQ(got[4].phi, 90);
    EXPECT_EQ(got[5].phi, -90);
    EXPECT_FLOAT_EQ(got[4].reflectionDistance, 6.5f);
    EXPECT_FLOAT_EQ(got[5].reflectionDistance, 4.5f);
}

TEST(RoomGeometry, SideWallsOfASourceBehindLieBehind) {
    Room room;
    room.phi = 180;
    const Records got = run(room);
    // A wall 2.5 m off and 1 m of way: acos(1 / 5.099) = 78.69 degrees, mirrored to the back.
    EXPECT_EQ(got[4].phi, 180 - 78);
    // 3 m: acos(1 / 6.083) = 80.54.
    EXPECT_EQ(got[5].phi, -180 + 80);
}

TEST(RoomGeometry, ElevationOfAWallAboveIsThePresetsOffset) {
    Room room;
    room.theta = 20;
    const Records got = run(room);
    EXPECT_EQ(got[0].theta, 75) << "60 + 20, limited";
    EXPECT_EQ(got[1].theta, -10);
    EXPECT_EQ(got[0].phi, -5);
    EXPECT_EQ(got[1].phi, 5);
}

TEST(RoomGeometry, SourceAtOrBehindAWallHasNoReflectionThere) {
    const struct {
        int k;
        int phi;
        int theta;
        float d;
    } cases[] = {{0, 0, 90, 2.8f},  {1, 0, -90, 1.8f}, {2, 0, 0, 3.2f},   {2, 0, 0, 50.0f},
                 {3, 180, 0, 2.1f}, {4, 90, 0, 2.5f},  {5, -90, 0, 3.0f}, {5, -90, 0, 3.1f}};
    const Records before = markedRecords();
    for (const auto& c : cases) {
        Room room{c.phi, c.theta, c.d};
        const auto k = static_cast<std::size_t>(c.k);
        const Records got = run(room);
        EXPECT_EQ(got[k].wallDistance, -1.0f) << c.k;
        EXPECT_EQ(got[k].reflectionDistance, 1000000.0f);
        EXPECT_EQ(got[k].distanceGain, 0.000001f);
        EXPECT_EQ(got[k].delaySamples, before[k].delaySamples);
        EXPECT_EQ(got[k].phi, before[k].phi);
        EXPECT_EQ(got[k].theta, before[k].theta);
        EXPECT_EQ(got[k].indexPhi, before[k].indexPhi);
        EXPECT_EQ(got[k].indexTheta, before[k].indexTheta);
        room.preset = 12;
        EXPECT_EQ(run(room)[k].distanceGain, before[k].distanceGain);
    }
}

TEST(RoomGeometry, AWallJustBeyondTheSourceIsHeard) {
    Room room;
    room.d = std::nextafter(3.2f, 0.0f);
    const Records got = run(room);
    EXPECT_EQ(got[2].wallDistance, 3.2f);
    EXPECT_NEAR(static_cast<double>(got[2].reflectionDistance), 3.2, 1e-5);
}

TEST(RoomGeometry, RoomScalesButForItsFloor) {
    Room room;
    room.d = 0.1f;
    for (const auto& [size, scale] : std::vector<std::array<float, 2>>{
             {1.0f, 1.0f}, {0.0f, 0.5f}, {3.0f, 2.0f}, {-0.5f, 0.25f}}) {
        room.size = size;
        const Records got = run(room);
        for (std::size_t k = 0; k < 6; ++k) {
            EXPECT_EQ(got[k].wallDistance, k == 1 ? 1.8f : room.walls[k] * scale) << k;
        }
    }
}

TEST(RoomGeometry, SmallestRoomKeepsWhatTheWallsHad) {
    Room room;
    room.size = -1.0f;
    room.phi = 30;
    const Records before = markedRecords();
    const Records got = run(room);
    for (const std::size_t k : {0u, 2u, 3u, 4u, 5u}) {
        EXPECT_EQ(got[k].wallDistance, 0.0f) << k;
        EXPECT_EQ(got[k].delaySamples, before[k].delaySamples);
        EXPECT_EQ(got[k].reflectionDistance, before[k].reflectionDistance);
        EXPECT_EQ(got[k].distanceGain, 1.0f / before[k].reflectionDistance);
        EXPECT_EQ(got[k].theta, before[k].relativeTheta) << "its elevation still follows";
        EXPECT_EQ(got[k].phi, k == 0 ? 25 : before[k].phi);
    }
    EXPECT_NE(got[1].delaySamples, before[1].delaySamples) << "the floor stays where it is";
}

TEST(RoomGeometry, MissingWallIsFinishedWithItsGain) {
    Room room;
    room.walls[0] = -1.0f;
    const Records before = markedRecords();
    const Records got = run(room);
    EXPECT_EQ(got[0].wallDistance, -1.0f);
    EXPECT_EQ(got[0].reflectionDistance, before[0].reflectionDistance);
    EXPECT_EQ(got[0].distanceGain, 1.0f / before[0].reflectionDistance);
    EXPECT_EQ(got[0].phi, before[0].phi);
    room.auralisation = false;
    EXPECT_EQ(run(room)[0].phi, -5) << "without auralisation the wall is not looked at";
    EXPECT_EQ(run(room)[0].wallDistance, before[0].wallDistance);
}

TEST(RoomGeometry, AWallThatComesBackIsHeardAgain) {
    Room room;
    room.d = 5.0f;
    const Records outside = run(room);
    ASSERT_EQ(outside[2].wallDistance, -1.0f);
    room.d = 1.0f;
    const Records inside = run(room, outside);
    EXPECT_EQ(inside[2].wallDistance, 3.2f);
    EXPECT_EQ(inside[2].phi, 0);
    EXPECT_FLOAT_EQ(inside[2].distanceGain, 1.0f / 5.4f);
}

TEST(RoomGeometry, GainIsAtMostOne) {
    Room room;
    room.walls.fill(0.05f);
    room.d = 0.01f;
    const Records got = run(room);
    for (std::size_t k = 0; k < 6; ++k) {
        EXPECT_EQ(got[k].distanceGain, 1.0f) << k;
    }
    room.auralisation = false;
    Records near = markedRecords();
    near[0].delaySamples = 100;
    EXPECT_EQ(run(room, near)[0].distanceGain, 1.0f);
}

TEST(RoomGeometry, RecordsBehindTheWallsFollowThePresetRule) {
    Room room;
    room.phi = 170;
    room.theta = -70;
    const Records before = markedRecords();
    const Records got = run(room);
    EXPECT_EQ(got[6].phi, 80);
    EXPECT_EQ(got[6].theta, -75);
    EXPECT_EQ(got[6].indexTheta, 3);
    EXPECT_EQ(got[7].phi, 325 - 360);
    EXPECT_EQ(got[6].distanceGain, before[6].distanceGain) << "no wall, no path";
    EXPECT_EQ(got[6].wallDistance, before[6].wallDistance);
}

TEST(RoomGeometry, ElevationsStopFifteenDegreesFromThePoles) {
    Room room;
    room.auralisation = false;
    room.theta = 16;
    Records got = run(room);
    EXPECT_EQ(got[0].theta, 75);
    EXPECT_EQ(got[0].indexTheta, 33);
    room.theta = 15;
    EXPECT_EQ(run(room)[0].theta, 75);
    room.theta = 14;
    EXPECT_EQ(run(room)[0].theta, 74);
    room.theta = -90;
    got = run(room);
    EXPECT_EQ(got[1].theta, -75);
    EXPECT_EQ(got[1].indexTheta, 3);
    // Narrower limits give way up to three degrees above.
    room.limitTheta = 60;
    room.theta = 3;
    EXPECT_EQ(run(room)[0].theta, 63);
    room.theta = 4;
    EXPECT_EQ(run(room)[0].theta, 60);
}

TEST(RoomGeometry, CountsBeyondTheRecordsAreCut) {
    Room room;
    room.count = 32767;
    const Records got = run(room);
    EXPECT_EQ(got[19].phi, -175);
    room.count = 0;
    EXPECT_EQ(run(room)[0].phi, 20);
    room.count = -3;
    EXPECT_EQ(run(room)[0].phi, 20);
}

TEST(RoomGeometry, DelaysWrapInSixteenBits) {
    Room room;
    room.walls = {300.0f, 300.0f, 300.0f, 300.0f, 300.0f, 300.0f};
    const Records got = run(room);
    // 599 m and 601 m of 139.7705 samples.
    EXPECT_EQ(got[2].delaySamples, static_cast<std::int16_t>(83722 - 65536));
    EXPECT_EQ(got[3].delaySamples, static_cast<std::int16_t>(84002 - 65536));
    room.walls.fill(150.0f);
    // 299 m: 41791 samples do not fit either, and come out negative.
    EXPECT_EQ(run(room)[2].delaySamples, 41791 - 65536);
}

TEST(RoomGeometry, AbsurdValuesAreDefined) {
    constexpr float largest = std::numeric_limits<float>::max();
    const float odd[] = {
        std::numeric_limits<float>::quiet_NaN(),  infinity, -infinity, largest, -largest,
        std::numeric_limits<float>::denorm_min(), -0.0f};
    for (const float value : odd) {
        for (const int phi : {-32768, -180, 0, 91, 180, 32767}) {
            for (const int field : {0, 1, 2}) {
                for (const bool auralisation : {false, true}) {
                    Room room;
                    room.phi = phi;
                    room.theta = phi;
                    room.auralisation = auralisation;
                    (field == 0 ? room.d : field == 1 ? room.size : room.walls[3]) = value;
                    if (field == 2) {
                        room.walls.fill(value);
                    }
                    const Records got = run(room);
                    for (std::size_t k = 0; k < 8; ++k) {
                        EXPECT_EQ(got[k].relativePhi, markedRecords()[k].relativePhi);
                        EXPECT_EQ(got[k].filterClass, k < 6 ? 0 : 1);
                        EXPECT_FALSE(got[k].distanceGain > 1.0f);
                        EXPECT_GE(got[k].theta, -75);
                        EXPECT_LE(got[k].theta, 75);
                    }
                }
            }
        }
    }
}

TEST(RoomGeometry, EndlessAndUnknownDistancesLeaveTheDirectionInTheTable) {
    for (const float d : {std::numeric_limits<float>::quiet_NaN(), infinity, 1e30f}) {
        Room room;
        room.d = d;
        room.phi = 33;
        for (const ReflectionRecord& record : run(room)) {
            EXPECT_GE(record.indexPhi, 0);
            EXPECT_LE(record.indexPhi, 72);
            EXPECT_GE(record.indexTheta, 0);
            EXPECT_LE(record.indexTheta, 36);
        }
    }
}

}  // namespace
}  // namespace tessaly::test
