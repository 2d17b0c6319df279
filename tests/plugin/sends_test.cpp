// From sources to shared reverbs, seen through a bypassed reverb, which gives out what it was sent.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <memory>
#include <utility>
#include <vector>

#include "plugin/plugin_fixture.h"

namespace tessaly::test {
namespace {

constexpr std::uint32_t rate = 44100;
constexpr std::uint32_t frames = 64;

class SendsTest : public PluginTest {
protected:
    /// A loaded reverb that passes its mix buffer on.
    static std::unique_ptr<EffectInstance> openReverb(const PluginLibrary& library,
                                                      float id,
                                                      std::uint32_t blockLength = frames) {
        auto reverb =
            std::make_unique<EffectInstance>(library.effect("Tessaly Reverb"), rate, blockLength);
        reverb->setParameter("Room Selection", 0.0f);
        reverb->setParameter("Bypass", 1.0f);
        reverb->setParameter("ReverbID", id);
        return reverb;
    }

    /// What has been sent since the last call; the reverb's own input must not show.
    static std::vector<float> taken(EffectInstance& reverb, std::uint32_t length = frames) {
        std::vector<float> in(2 * length, 1000.0f);
        std::vector<float> out(2 * length, 9.0f);
        EXPECT_EQ(reverb.processBlock(in.data(), out.data(), length), 0);
        return out;
    }

    static void setSends(EffectInstance& source,
                         const std::vector<std::pair<float, float>>& sends) {
        source.setParameter("Reverb disable", 1.0f);
        source.setParameter("Reverb Size", static_cast<float>(sends.size()));
        for (const auto& [id, level] : sends) {
            source.setParameter("Reverb ID", id);
            source.setParameter("Reverb Send", level);
        }
    }
};

const std::vector<float> ones(2 * frames, 1.0f);

TEST_F(SendsTest, TwoSendsReachTheirReverbsAtWholeDecibels) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto fifth = openReverb(library, 5.0f);
        const auto seventh = openReverb(library, 7.0f);
        const auto ninth = openReverb(library, 9.0f);
        Source source(library, rate, frames);
        setSends(source.effect(), {{5.0f, -6.9f}, {7.0f, 0.0f}});
        source.effect().setParameter("Reverb ID", 9.0f);  // a slot that is not in use
        // Waiting: no engine, so no gain by distance.
        source.effect().setParameter("Room Selection", -1.0f);
        source.block(ones);
        const float expected = 2.0f * std::pow(10.0f, -6.0f * 0.05f);
        const std::vector<float> fifthOut = taken(*fifth);
        const std::vector<float> seventhOut = taken(*seventh);
        for (std::size_t i = 0; i < frames; ++i) {
            EXPECT_FLOAT_EQ(fifthOut[2 * i], expected);
            EXPECT_EQ(fifthOut[2 * i + 1], 0.0f);
            EXPECT_EQ(seventhOut[2 * i], 2.0f);
        }
        EXPECT_TRUE(allZero(taken(*ninth)));
        EXPECT_TRUE(allZero(taken(*fifth))) << "taken once";
    });
}

TEST_F(SendsTest, OwnReverbAndBypassSendNothing) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto reverb = openReverb(library, 5.0f);
        Source source(library, rate, frames);
        setSends(source.effect(), {{5.0f, 0.0f}});
        source.effect().setParameter("Reverb disable", 0.0f);
        source.block(ones);
        EXPECT_TRUE(allZero(taken(*reverb)));
        source.effect().setParameter("Reverb disable", 1.0f);
        source.effect().setParameter("Bypass", 1.0f);
        source.block(ones);
        EXPECT_TRUE(allZero(taken(*reverb)));
        source.effect().setParameter("Bypass", 0.0f);
        source.block(ones);
        EXPECT_FALSE(allZero(taken(*reverb)));
    });
}

TEST_F(SendsTest, InARoomFartherSourcesSendLess) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto reverb = openReverb(library, 5.0f);
        Source source(library, rate, frames);
        source.effect().setParameter("Room Selection", 4.0f);
        setSends(source.effect(), {{5.0f, 0.0f}});
        float former = 2.0f * 1.0001f;
        for (const double distance : {5.0, 15.0, 20.0, 25.0}) {
            source.place(0.0, 0.0, distance);
            source.block(ones);
            taken(*reverb);
            source.block(ones);
            const float sent = taken(*reverb)[0];
            EXPECT_GT(sent, 0.0f);
            EXPECT_LT(sent, former) << distance;
            former = sent;
        }
    });
}

TEST_F(SendsTest, TheHostsZoneMixReplacesTheDistance) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto reverb = openReverb(library, 5.0f);
        Source source(library, rate, frames);
        setSends(source.effect(), {{5.0f, 0.0f}});
        source.effect().setParameter("UnityDistance", 1.0f);
        source.effect().spatializerData().reverbzonemix = 0.25f;
        source.place(0.0, 0.0, 50.0);
        source.block(ones);
        EXPECT_EQ(taken(*reverb)[0], 0.5f);
    });
}

TEST_F(SendsTest, MoreThanFiftySendsAreCutOff) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto last = openReverb(library, 50.0f);
        const auto beyond = openReverb(library, 51.0f);
        Source source(library, rate, frames);
        std::vector<std::pair<float, float>> sends;
        for (int id = 1; id <= 100; ++id) {
            sends.emplace_back(static_cast<float>(id), 0.0f);
        }
        setSends(source.effect(), sends);
        source.effect().setParameter("Room Selection", -1.0f);
        source.block(ones);
        EXPECT_EQ(taken(*last)[0], 2.0f);
        EXPECT_TRUE(allZero(taken(*beyond)));
    });
}

TEST_F(SendsTest, AnIdTakesAlongWhatIsInFlight) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto reverb = openReverb(library, 5.7f);
        EXPECT_EQ(reverb->parameter("ReverbID"), 5.0f);
        Source source(library, rate, frames);
        setSends(source.effect(), {{5.0f, 0.0f}});
        source.effect().setParameter("Room Selection", -1.0f);
        source.block(ones);
        reverb->setParameter("ReverbID", 6.0f);
        EXPECT_EQ(taken(*reverb)[0], 2.0f);
        source.block(ones);
        EXPECT_TRUE(allZero(taken(*reverb))) << "nobody has ID 5 now";
        reverb->setParameter("ReverbID", 0.0f);
        EXPECT_TRUE(allZero(taken(*reverb)));
    });
}

TEST_F(SendsTest, SendsPileUpUntilTheReverbRuns) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto reverb = openReverb(library, 5.0f);
        Source source(library, rate, frames);
        setSends(source.effect(), {{5.0f, 0.0f}});
        source.effect().setParameter("Room Selection", -1.0f);
        source.block(ones);
        source.block(ones);
        source.block(std::vector<float>(frames, 1.0f), 1);
        EXPECT_EQ(taken(*reverb)[0], 5.0f) << "stereo is summed, mono is not";
    });
}

TEST_F(SendsTest, SendsPileUpUntilTheReverbLoads) {
    withData({rate}, [](const PluginLibrary& library) {
        EffectInstance reverb(library.effect("Tessaly Reverb"), rate, frames);
        reverb.setParameter("ReverbID", 5.0f);
        reverb.setParameter("Bypass", 1.0f);
        Source source(library, rate, frames);
        setSends(source.effect(), {{5.0f, 0.0f}});
        source.effect().setParameter("Room Selection", -1.0f);
        for (int block = 0; block < 4; ++block) {
            source.block(ones);
            EXPECT_TRUE(allZero(taken(reverb))) << "without a room there is no engine";
        }
        reverb.setParameter("Room Selection", 0.0f);
        EXPECT_EQ(taken(reverb)[0], 8.0f) << "four blocks at once";
        EXPECT_TRUE(allZero(taken(reverb)));
    });
}

TEST_F(SendsTest, AReverbWithoutAnIdErasesNothing) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto reverb = openReverb(library, 5.0f);
        auto source = std::make_unique<Source>(library, rate, frames);
        setSends(source->effect(), {{5.0f, 0.0f}});
        source->effect().setParameter("Room Selection", -1.0f);
        source->block(ones);
        openReverb(library, 0.0f).reset();
        openReverb(library, 0.7f).reset();
        source.reset();
        EXPECT_EQ(taken(*reverb)[0], 2.0f) << "neither took the buffer with it";
    });
}

TEST_F(SendsTest, TheSecondOfTwoReverbsClearsAndEitherErases) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto first = openReverb(library, 5.0f);
        Source source(library, rate, frames);
        setSends(source.effect(), {{5.0f, 0.0f}});
        source.effect().setParameter("Room Selection", -1.0f);
        source.block(ones);
        auto second = openReverb(library, 5.0f);
        EXPECT_TRUE(allZero(taken(*first)));
        source.block(ones);
        EXPECT_EQ(taken(*second)[0], 2.0f) << "each takes what is there";
        EXPECT_TRUE(allZero(taken(*first)));
        second.reset();
        source.block(ones);
        EXPECT_TRUE(allZero(taken(*first)));
    });
}

TEST_F(SendsTest, TheLargestBlockUsesTheWholeBuffer) {
    withData({rate}, [](const PluginLibrary& library) {
        constexpr std::uint32_t largest = 4096;
        const auto reverb = openReverb(library, 5.0f, largest);
        Source source(library, rate, largest);
        setSends(source.effect(), {{5.0f, 0.0f}});
        source.effect().setParameter("Room Selection", -1.0f);
        source.block(std::vector<float>(2 * largest, 1.0f));
        EXPECT_EQ(taken(*reverb, largest)[2 * largest - 2], 2.0f);
        EXPECT_TRUE(allZero(taken(*reverb, largest)));
    });
}

TEST_F(SendsTest, BlocksBeyondTheBufferAreDroppedAndSilent) {
    withData({rate}, [](const PluginLibrary& library) {
        constexpr std::uint32_t tooLong = 8192;
        const auto reverb = openReverb(library, 5.0f, tooLong);
        Source source(library, rate, tooLong);
        setSends(source.effect(), {{5.0f, 0.0f}});
        source.block(std::vector<float>(2 * tooLong, 1.0f));
        EXPECT_TRUE(allZero(taken(*reverb, tooLong)));
    });
}

TEST_F(SendsTest, ABadLevelDoesNotSpoilTheReverb) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto reverb = openReverb(library, 5.0f);
        Source source(library, rate, frames);
        setSends(source.effect(), {{5.0f, 0.0f}});
        source.effect().setParameter("Room Selection", -1.0f);
        for (const char* name : {"Gain", "Reverb"}) {
            for (const float value : {std::nanf(""), HUGE_VALF}) {
                source.effect().setParameter(name, value);
                source.block(ones);
                EXPECT_TRUE(allZero(taken(*reverb)));
                source.effect().setParameter(name, 0.0f);
            }
        }
        source.block(ones);
        EXPECT_EQ(taken(*reverb)[0], 2.0f);
    });
}

}  // namespace
}  // namespace tessaly::test
