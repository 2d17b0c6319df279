// Reverberation time and balance of rooms, measured on what comes out of the library.
#include <fmt/format.h>
#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "data/tail_analysis.h"
#include "data/tail_design.h"
#include "data/tail_level.h"
#include "render/rooms.h"
#include "tools/render/scene_render_support.h"

namespace tessaly {
namespace {

constexpr int rate = 48000;
constexpr double settling = 0.25;  // seconds
constexpr double longDecay = 1.5;  // seconds: enough degrees of freedom for the close limit
// Stored tails keep 0.1 dB; the input filters then weigh direct sound and tail a little apart.
constexpr double directToTailDb = 0.2;
constexpr double directToRoomDb = 2.5;  // of the target

class RoomAcoustics : public SceneRender {
protected:
    // What an impulse from 1 m ahead brings to both ears.
    static std::vector<float> responseOf(int room,
                                         const data::TailDesign& design,
                                         const std::vector<const char*>& silenced) {
        SceneSource impulse = source("impulse", {0.0, 0.0, 1.0});
        impulse.room = room;
        for (const char* part : silenced) {
            impulse.parameters.push_back(constantParameter(part, -96.0));
        }
        // The input filters reach their state within the first blocks.
        impulse.start = settling;
        const double seconds = static_cast<double>(data::storedTailFrames(design, rate)) / rate;
        std::vector<float> stereo = render(sceneWith({impulse}, settling + seconds)).stereo;
        stereo.erase(stereo.begin(), stereo.begin() + std::lround(2.0 * settling * rate));
        return stereo;
    }

    static double middleEnergyOf(const std::vector<float>& stereo) {
        return data::middleEnergy(std::vector<double>(stereo.begin(), stereo.end()), rate);
    }
};

double decayTolerance(std::size_t octave, bool isLong) {
    if (isLong || octave >= 2) {
        return 0.12;
    }
    return octave == 1 ? 0.25 : 0.4;
}

// A small stone room, a concert hall and a cathedral.
TEST_F(RoomAcoustics, RenderedRoomsDecayAndBalanceAsDesigned) {
    for (const int preset : {15, 16, 25}) {
        const data::TailDesign& design = data::tailDesign(preset);
        const std::optional<int> room = roomFromText(design.name);
        ASSERT_TRUE(room.has_value()) << design.name;
        ASSERT_EQ(roomAt(*room).preset, preset);

        const std::vector<float> all = responseOf(*room, design, {});
        const data::OctaveTimes times = data::measuredTimes(all, rate, design);
        const data::OctaveTimes designed = data::designedTimes(all.size() / 2, rate, design);
        std::string told = fmt::format("{}: reverberation time re design", design.name);
        for (std::size_t octave = 0; octave < times.size(); ++octave) {
            const double hertz = data::lowestDecayHertz * std::exp2(static_cast<double>(octave));
            const double relative = times[octave] / designed[octave] - 1.0;
            told += fmt::format(" {:+.1f} %", 100.0 * relative);
            EXPECT_LE(std::abs(relative), decayTolerance(octave, design.decay.mid() >= longDecay))
                << design.name << " at " << hertz << " Hz: " << times[octave] << " s";
        }

        const double direct = middleEnergyOf(responseOf(*room, design, {"Early", "Reverb"}));
        const double late = middleEnergyOf(responseOf(*room, design, {"Direct"}));
        const double tail = middleEnergyOf(responseOf(*room, design, {"Direct", "Early"}));
        const double directToTail = 10.0 * std::log10(direct / tail);
        const double directToRoom = 10.0 * std::log10(direct / late);
        told += fmt::format(
            "; direct to tail {:.2f} dB (rule {:.2f}), to the room {:.2f} (target "
            "{:.2f})",
            directToTail, design.directToTail(), directToRoom, design.directToReverb);
        fmt::print("{}\n", told);
        EXPECT_NEAR(directToTail, design.directToTail(), directToTailDb) << told;
        EXPECT_NEAR(directToRoom, design.directToReverb, directToRoomDb) << told;
    }
}

}  // namespace
}  // namespace tessaly
