// A source that keeps moving: its convolver keeps no spectra of what changes in every block.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>

#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

constexpr int block = 256;  // frames

class Moving : public EngineFixture {
protected:
    Moving() : rig_(directory_.path(), 48000, block) {
        writePackedHrirSet(directory_.path(), 48000);
        rig_.settings.qvTrackDirection = 1;
        rig_.settings.fading = 1;
        rig_.settings.alwaysUpdateFilter = 0;
    }

    void play() {
        for (std::size_t i = 0; i < rig_.input.size(); i += 2) {
            rig_.input[i] = static_cast<float>(random_() >> 8) * (1.0f / 16777216.0f) - 0.5f;
        }
        rig_.run();
    }
    void move() {
        rig_.azimuth = static_cast<std::int16_t>(++moves_ * 45 % 360 - 180);
        play();
    }
    double energy() const {
        double sum = 0.0;
        for (const float sample : rig_.output) {
            sum += static_cast<double>(sample) * static_cast<double>(sample);
        }
        return sum;
    }

    const LogCapture quiet_;
    TempDirectory directory_;
    EngineRig rig_;
    std::mt19937 random_{3};
    int moves_ = 0;
};

TEST_F(Moving, OldResponsesOfARunGoOnFromTheLastResult) {
    for (const std::int16_t preset : {std::int16_t{0}, std::int16_t{25}}) {
        resetProcess();
        rig_.settings.earlyFlexRefPreset = preset;
        rig_.settings.qvFlexReflections = preset != 0 ? 1 : 0;
        rig_.build();
        const int early = rig_.state().sizes.fdlCount + 3;  // until all its input is of the run
        for (int n = 0; n < early; ++n) {
            move();
        }
        const ComplexBin kept = rig_.state().firstOLS->filterPartsL[0][9];
        for (int n = 0; n < 20; ++n) {
            move();
            EXPECT_TRUE(rig_.state().firstOLS->oldContinued()) << preset << ", " << n;
            EXPECT_EQ(rig_.state().firstOLS->filterPartsL[0][9].re, kept.re) << "no spectra are";
        }
        play();
        EXPECT_NE(rig_.state().firstOLS->filterPartsL[0][9].re, kept.re) << "now it is needed";
        move();
        EXPECT_FALSE(rig_.state().firstOLS->oldContinued()) << "there was a block without a move";
        rig_.engine.reset();
    }
}

TEST_F(Moving, AStopLeavesTheResponseWithTheConvolver) {
    rig_.build();
    for (int n = 0; n < 20; ++n) {
        move();
    }
    const double before = energy();
    rig_.engine->Stop();
    for (int n = 0; n < 4; ++n) {
        play();
    }
    EXPECT_GT(energy(), 0.25 * before) << "nothing has asked for another response";
}

}  // namespace
}  // namespace tessaly::test
