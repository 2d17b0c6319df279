// An engine that is told of silence rests, and nobody can tell.
#include <gtest/gtest.h>

#include <cstring>
#include <random>

#include "base/audio_thread.h"
#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

/// What the engine is beside the scene that it plays.
struct Engine {
    const char* name;
    int block;
    std::int16_t preset;   ///< of the reflections, 0: none
    bool fading;           ///< crossfades at a change of response
    std::uint8_t updates;  ///< `alwaysUpdateFilter`
    bool rests;
    std::int16_t interval = 1;  ///< blocks between two looks at the direction
    bool interpolates = false;  ///< between directions
    std::int16_t reverb = 0;    ///< 1: the synthetic tail
    std::uint8_t doppler = 0;
    std::uint8_t smoothSteps = 0;  ///< of angle and distance, limited a block
};

void PrintTo(const Engine& engine, std::ostream* out) { *out << engine.name; }

class Rest : public EngineFixture, public testing::WithParamInterface<Engine> {
protected:
    Rest() { writePackedHrirSet(directory_.path(), 48000); }

    struct Played {
        std::vector<float> sound;
        std::vector<std::uint32_t> counters;  ///< process's blocks and ring places, a pair a block
        std::uint64_t rested = 0;             ///< blocks that were not made
    };

    /// A random scene of sound and long silences, in which now and then something changes.
    /// @param tells  silence is announced
    Played play(std::uint32_t seed, bool tells) {
        resetProcess();
        const LogCapture quiet;
        EngineRig rig(directory_.path(), 48000, GetParam().block);
        EngineRig other(directory_.path(), 48000, GetParam().block);
        for (EngineRig* const each : {&rig, &other}) {
            each->settings.earlyFlexRefPreset = GetParam().preset;
            each->settings.qvTrackDirection = 1;
            each->settings.fading = GetParam().fading ? 1 : 0;
            each->settings.alwaysUpdateFilter = GetParam().updates;
            each->settings.qvUpdateInterval = GetParam().interval;
            each->settings.qvInterpolateFilters = GetParam().interpolates ? 1 : 0;
            each->settings.qvReverb = GetParam().reverb;
            each->settings.doppler = GetParam().doppler;
            each->settings.qvSmoothSteps = GetParam().smoothSteps;
            each->build();
        }
        std::mt19937 random(seed);
        const auto chance = [&random](unsigned one) { return random() % one == 0; };
        Played played;
        // Filters need a second to come to rest.
        const int restAfter = 60000 / GetParam().block;
        int left = 20;
        bool sounds = true;
        for (int n = 0; n < 5 * restAfter; ++n, --left) {
            if (left == 0) {
                sounds = !sounds;
                left = sounds ? 3 + static_cast<int>(random() % 20)
                              : restAfter / 2 + static_cast<int>(random() % (2u * restAfter));
            }
            for (std::size_t i = 0; i < rig.input.size(); i += 2) {
                rig.input[i] = sounds ? static_cast<float>(random() >> 8) * 0x1p-24f - 0.5f : 0.0f;
            }
            change(rig, random, chance);
            if (tells && !sounds) {
                rig.engine->expectSilence();
            }
            rig.run();
            if (chance(3)) {
                other.input = rig.input;
                other.run();  // sets and clears the process's flags in between
            }
            played.sound.insert(played.sound.end(), rig.output.begin(), rig.output.end());
            played.counters.push_back(blockCounter);
            played.counters.push_back(static_cast<std::uint32_t>(rig.state().firstOLS->FDLpos));
        }
        played.rested = rig.state().rest.blocksLeft();
        return played;
    }

private:
    template <typename Chance>
    void change(EngineRig& rig, std::mt19937& random, const Chance& chance) {
        LiveControls& controls = rig.engine->controls();
        if (chance(40)) {
            rig.azimuth = static_cast<std::int16_t>(random() % 360) - 180;
        }
        if (chance(80)) {
            rig.elevation = static_cast<std::int16_t>(random() % 90);
        }
        if (chance(60)) {
            rig.distance = 0.5f + 0.01f * static_cast<float>(random() % 2000);
        }
        if (chance(80)) {
            rig.gainDb = -static_cast<float>(random() % 20);
        }
        if (chance(80)) {
            rig.mix.directGain = 0.1f * static_cast<float>(random() % 10);
        }
        if (chance(80)) {
            rig.mix.earlyGain = 0.1f * static_cast<float>(random() % 10);
        }
        if (chance(150)) {
            controls.bassBoost = !controls.bassBoost;
        }
        if (chance(150)) {
            controls.reflectionLP_Fc = 1000.0f + static_cast<float>(random() % 10000);
        }
        if (chance(150)) {
            rig.engine->setInputLowPass(0.1f * static_cast<float>(random() % 10));
        }
        if (chance(300)) {
            forceUpdateAll = true;
        }
        if (chance(300)) {
            rig.engine->Stop();
        }
    }

    TempDirectory directory_;
};

TEST_P(Rest, ChangesNothingThatIsHeard) {
    std::uint64_t rested = 0;
    for (std::uint32_t seed = 1; seed <= 3; ++seed) {
        SCOPED_TRACE(seed);
        const Played plain = play(seed, false);
        const Played told = play(seed, true);
        ASSERT_EQ(plain.sound.size(), told.sound.size());
        EXPECT_EQ(
            std::memcmp(plain.sound.data(), told.sound.data(), plain.sound.size() * sizeof(float)),
            0);
        EXPECT_EQ(plain.counters, told.counters);
        EXPECT_EQ(plain.rested, 0u);
        rested += told.rested;
    }
    if (GetParam().rests) {
        EXPECT_GT(rested, 100u);
    } else {
        EXPECT_EQ(rested, 0u);
    }
}

// The far part of a response needs 48 blocks of it.
INSTANTIATE_TEST_SUITE_P(
    Engines,
    Rest,
    testing::Values(Engine{"dry", 256, 0, true, 1, true},
                    Engine{"lazy", 256, 0, true, 0, true},
                    Engine{"withoutCrossfade", 256, 0, false, 1, true},
                    Engine{"reflections", 512, 25, true, 1, true},
                    Engine{"farTail", 64, 25, true, 1, true},
                    Engine{"farTailLazy", 64, 25, true, 0, true},
                    Engine{"syntheticTail", 512, 0, true, 1, true, 1, false, 1},
                    Engine{"everyThirdBlock", 512, 25, true, 1, false, 3},
                    Engine{"interpolating", 512, 0, true, 1, false, 1, true},
                    Engine{"doppler", 512, 0, true, 1, false, 1, false, 0, 1},
                    Engine{"smoothSteps", 512, 25, true, 1, false, 1, false, 0, 0, 1}),
    [](const auto& tested) { return std::string(tested.param.name); });

class RestOfOne : public EngineFixture {
protected:
    RestOfOne() : rig(directory_.path(), 48000, 256) {
        writePackedHrirSet(directory_.path(), 48000);
        rig.build();
        for (int n = 0; n < 40; ++n) {
            block();
        }
    }
    void block() {
        rig.engine->expectSilence();
        rig.run();
    }

private:
    TempDirectory directory_;
    LogCapture quiet_;

protected:
    EngineRig rig;
};

TEST_F(RestOfOne, SettlesAndEndsWithAnyChangeAndSettlesAgain) {
    EXPECT_TRUE(rig.state().rest.settled());
    EXPECT_GT(rig.state().rest.blocksLeft(), 15u);
    const std::uint64_t before = rig.state().rest.blocksLeft();
    block();
    EXPECT_EQ(rig.state().rest.blocksLeft(), before + 1);
    rig.distance = 3.0f;
    block();
    EXPECT_FALSE(rig.state().rest.settled());
    EXPECT_EQ(rig.state().law.distance, 3.0f) << "made in full";
    block();
    EXPECT_TRUE(rig.state().rest.settled());
}

TEST_F(RestOfOne, NeedsToBeToldInEachBlock) {
    rig.distance = 3.0f;
    block();
    block();
    ASSERT_TRUE(rig.state().rest.settled());
    rig.input[0] = 1.0f;
    rig.run();
    EXPECT_FALSE(rig.state().rest.settled());
    EXPECT_NE(rig.output, std::vector<float>(rig.output.size())) << "heard at once";
}

TEST_F(RestOfOne, WritesZerosOverWhateverTheHostsBufferHolds) {
    rig.output.assign(rig.output.size(), 5.0f);
    block();
    EXPECT_EQ(rig.output, std::vector<float>(rig.output.size()));
}

TEST_F(RestOfOne, DoesNotOutlastANewHrirSet) {
    ++hrirTablesVersion;
    block();
    EXPECT_FALSE(rig.state().rest.settled());
}

TEST_F(RestOfOne, IsOverWhileAnErrorStands) {
    essError = -105;
    const LogCapture log;
    block();
    EXPECT_FALSE(log.outputLines().empty()) << "reported as in any other block";
    EXPECT_FALSE(rig.state().rest.settled());
    essError = essErrorNone;
}

}  // namespace
}  // namespace tessaly::test
