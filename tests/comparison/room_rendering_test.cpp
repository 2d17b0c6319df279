// Every room of the menu with the measured data set, heard through the built library until its
// tail has run out, against the reference.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <ostream>
#include <sstream>
#include <string>
#include <vector>

#include "comparison/deviation.h"
#include "comparison/hosted_source.h"
#include "comparison/measured_game.h"

namespace tessaly::test {
namespace {

using namespace parameter;

constexpr int burstBlocks = 6;
constexpr float noisePeak = 0.5f;

/// Without a room; reflections alone, of a preset below 13; the two shortest tails, with and
/// without a low-pass; an ordinary room; records without filters; no ceiling; the longest tail.
constexpr std::array<int, 8> chosenRooms = {0, 2, 27, 28, 20, 30, 32, 31};
constexpr int longestRoom = 31;

#if defined(TESSALY_FEW_ROOMS)
constexpr bool fewRooms = true;
#else
constexpr bool fewRooms = false;
#endif

double largestOfAll = 0.0;

class TellsTheLargest : public ::testing::Environment {
public:
    void TearDown() override {
        std::printf("[ DEVIATION] %.2e of full scale at most in all rooms played\n", largestOfAll);
    }
};
const ::testing::Environment* const tellsTheLargest =
    ::testing::AddGlobalTestEnvironment(new TellsTheLargest);

struct RoomCase {
    int room = 0;
    int sampleRate = 48000;
    int blockLength = 1024;
};

std::ostream& operator<<(std::ostream& out, const RoomCase& one) {
    return out << "room " << one.room << " at " << one.sampleRate << "/" << one.blockLength;
}

/// All rooms in the usual format. Under the sanitizers the eight: the others take the same steps
/// with other numbers.
std::vector<RoomCase> roomsOfTheMenu() {
    std::vector<RoomCase> cases;
    if (fewRooms) {
        for (const int room : chosenRooms) {
            cases.push_back({room});
        }
        return cases;
    }
    for (int room = 0; room < roomCount; ++room) {
        cases.push_back({room});
    }
    return cases;
}

/// The eight in other formats; the longest tail once a rate and once a block length, and under the
/// sanitizers those two formats only.
std::vector<RoomCase> roomsInOtherFormats() {
    std::vector<RoomCase> cases;
    for (const int rate : {24000, 44100, 48000}) {
        for (const int blockLength : {256, 512, 1024}) {
            const bool onceEach =
                (rate == 24000 && blockLength == 256) || (rate == 44100 && blockLength == 512);
            if ((rate == 48000 && blockLength == 1024) || (fewRooms && !onceEach)) {
                continue;
            }
            for (const int room : chosenRooms) {
                if (room != longestRoom || onceEach) {
                    cases.push_back({room, rate, blockLength});
                }
            }
        }
    }
    return cases;
}

class RoomRendering : public ::testing::TestWithParam<RoomCase> {
protected:
    void SetUp() override {
        if (!measuredSetThere()) {
            GTEST_SKIP() << "no data set";
        }
        takeRooms(one_.handler());
        set(roomSelection, static_cast<float>(GetParam().room));
        ASSERT_TRUE(measuredGame().pathTaken);
        ASSERT_EQ(measuredGame().library.getErrorState(), 1);
    }

    void TearDown() override {
        if (IsSkipped()) {
            return;
        }
        std::ostringstream largest;
        largest << deviation.largest();
        RecordProperty("largestDeviation", largest.str());
        std::ostringstream name;
        name << GetParam();
        std::printf("[ DEVIATION] %s: %.2e of full scale in %zu samples, peak %.3f\n",
                    name.str().c_str(), deviation.largest(), deviation.samples(), deviation.peak());
        largestOfAll = std::max(largestOfAll, deviation.largest());
        EXPECT_LE(deviation.largest(), tolerance);
        EXPECT_GT(deviation.peak(), 0.05) << "silence was compared with silence";
        EXPECT_LT(deviation.peak(), 1.0) << "beyond the full scale that the tolerance is told of";
        EXPECT_EQ(measuredGame().library.getErrorState(), 1);
    }

    /// Blocks of noise on the way.
    void play(int blocks) {
        one_.noisePeak = noisePeak;
        for (int k = 0; k < blocks; ++k, ++block_) {
            walk(one_, block_);
            one_.source.position.z += away;
            ASSERT_TRUE(one_.play(deviation)) << what;
        }
    }

    /// Blocks of noise, then silence until the response of the engine in use has run out, with a
    /// step every third block: where nothing moves the reference need not transform anew.
    void playOut() {
        play(burstBlocks);
        one_.noisePeak = 0.0f;
        const int rest = one_.handler().engine()->partitions() + 1;
        for (int k = 0; k < rest; ++k) {
            if (k % 3 == 0) {
                walk(one_, block_++);
            }
            ASSERT_TRUE(one_.play(deviation)) << what;
        }
    }

    void set(int index, float value) { one_.set(index, value); }

    double away = 0.0;  ///< metres added to the walk
    const char* what = "";
    Deviation deviation;

private:
    int block_ = 0;
    HostedSource one_{measuredGame(), GetParam().sampleRate, GetParam().blockLength};
};

TEST_P(RoomRendering, MovingSourceUntilTheTailHasRunOut) { playOut(); }

TEST_P(RoomRendering, WallsReverbAndDistanceChange) {
    what = "walls of the room";
    set(auralization, 1.0f);
    play(4);
    what = "walls of the game";
    setWalls({2.5f, 1.7f, 6.0f, 4.0f, 5.0f, 3.0f});
    play(4);
    what = "source behind walls";
    setWalls({0.2f, 1.8f, 0.4f, 7.0f, 0.3f, -1.0f});
    play(5);
    what = "reverb disabled among walls";
    set(reverbDisable, 1.0f);
    setWalls({3.0f, 1.8f, 9.0f, 11.0f, 4.0f, 6.0f});
    playOut();
    what = "reverb disabled";
    set(auralization, 0.0f);
    playOut();
    what = "reverb back";
    set(reverbDisable, 0.0f);
    play(2);
    for (const double metres : {12.0, 25.0, 36.0, 45.0}) {
        what = "far away";
        away = metres;
        play(1);
    }
    away = 0.0;
    what = "smaller room";
    set(roomSize, 70.0f);
    play(2);
}

std::string nameOf(const ::testing::TestParamInfo<RoomCase>& info) {
    return "Room" + std::to_string(info.param.room) + "At" + std::to_string(info.param.sampleRate) +
           "By" + std::to_string(info.param.blockLength);
}

INSTANTIATE_TEST_SUITE_P(Menu, RoomRendering, ::testing::ValuesIn(roomsOfTheMenu()), nameOf);
INSTANTIATE_TEST_SUITE_P(Formats,
                         RoomRendering,
                         ::testing::ValuesIn(roomsInOtherFormats()),
                         nameOf);

}  // namespace
}  // namespace tessaly::test
