// What a rendered source sounds like, as far as any proper HRIR set decides it.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "plugin/plugin_fixture.h"

namespace tessaly::test {
namespace {

class SoundTest : public PluginTest {
protected:
    /// Output of a new source at a position given in metres; the distance told by the host stays
    /// one metre.
    static std::vector<float> heardAt(const PluginLibrary& library, float x, float y, float z) {
        Source source(library, 48000, 256);
        UnityAudioSpatializerData& data = source.effect().spatializerData();
        data.sourcematrix[12] = x;
        data.sourcematrix[13] = y;
        data.sourcematrix[14] = z;
        return source.blocks(6);
    }
};

TEST_F(SoundTest, EverySizeAndRateLoadsAndSounds) {
    withData({24000, 44100, 48000}, [](const PluginLibrary& library) {
        for (const std::uint32_t rate : allRates) {
            for (std::uint32_t frames = 2; frames <= 4096; frames *= 2) {
                SCOPED_TRACE(::testing::Message() << rate << " Hz, " << frames << " frames");
                Source source(library, rate, frames);
                source.place(60.0, 10.0, 1.5);
                source.blocks(3);
                source.place(65.0, 10.0, 1.4);
                const std::vector<float> out = source.blocks(static_cast<int>(256 / frames) + 3);
                EXPECT_EQ(library.getErrorState(), 1);
                EXPECT_TRUE(allFinite(out));
                if (frames >= 64) {
                    EXPECT_GT(energy(out, 0), 0.0);
                    EXPECT_GT(energy(out, 1), 0.0);
                }
            }
        }
    });
}

TEST_F(SoundTest, TheNearEarIsLouder) {
    withData({24000, 44100, 48000}, [](const PluginLibrary& library) {
        for (const std::uint32_t rate : allRates) {
            for (const double azimuth : {90.0, -90.0, 45.0, -135.0}) {
                SCOPED_TRACE(::testing::Message() << rate << " Hz, " << azimuth << " degrees");
                Source source(library, rate, 512);
                source.place(azimuth, 0.0, 1.0);
                const std::vector<float> out = source.blocks(6);
                const double ratio = energy(out, 1) / energy(out, 0);
                if (azimuth > 0.0) {
                    EXPECT_GT(ratio, 1.2);
                } else {
                    EXPECT_LT(ratio, 1.0 / 1.2);
                }
            }
        }
    });
}

TEST_F(SoundTest, ASourceAtTheListenerIsHeardAtTheRight) {
    withData({48000}, [](const PluginLibrary& library) {
        EXPECT_EQ(heardAt(library, 0.0f, 0.0f, 0.0f), heardAt(library, 1.0f, 0.0f, 0.0f));
    });
}

TEST_F(SoundTest, NearThePlaneOfTheEarsTheSideDecides) {
    withData({48000}, [](const PluginLibrary& library) {
        const std::vector<float> left = heardAt(library, -1.0f, 0.0f, 0.0f);
        EXPECT_EQ(heardAt(library, -1.0f, 0.0f, 0.0005f), left);
        EXPECT_EQ(heardAt(library, -1.0f, 0.0f, -0.0005f), left);
        EXPECT_NE(heardAt(library, 1.0f, 0.0f, 0.0005f), left);
    });
}

TEST_F(SoundTest, BehindIsTheSameFromEitherSide) {
    withData({48000}, [](const PluginLibrary& library) {
        EXPECT_EQ(heardAt(library, 0.0f, 0.0f, -1.0f), heardAt(library, -0.0f, 0.0f, -1.0f));
    });
}

TEST_F(SoundTest, TheAngleBendsTheFrontOnly) {
    withData({48000}, [](const PluginLibrary& library) {
        const auto heard = [&](double azimuth, float exponent) {
            Source source(library, 48000, 256);
            source.effect().setParameter("Angle", exponent);
            source.place(azimuth, 0.0, 1.0);
            return source.blocks(6);
        };
        // 45 degrees squared over 90 is 22.5, truncated, and 5 degrees are one step of the set.
        EXPECT_EQ(heard(45.0, 2.0f), heard(22.0, 1.0f));
        EXPECT_EQ(heard(-45.5, 2.0f), heard(-23.0, 1.0f));
        EXPECT_EQ(heard(120.0, 2.0f), heard(120.0, 1.0f));
        EXPECT_EQ(heard(45.0, 1.005f), heard(45.0, 1.0f));
        EXPECT_NE(heard(45.0, 2.0f), heard(45.0, 1.0f));
    });
}

TEST_F(SoundTest, LevelsScaleTheOutput) {
    withData({48000}, [](const PluginLibrary& library) {
        const auto heard = [&](const char* name, float value) {
            Source source(library, 48000, 256);
            source.effect().setParameter(name, value);
            return energy(source.blocks(8), 0);
        };
        const double plain = heard("Gain", 0.0f);
        EXPECT_NEAR(10.0 * std::log10(heard("Gain", -6.0f) / plain), -6.0, 0.01);
        EXPECT_NEAR(10.0 * std::log10(heard("Direct", -6.0f) / plain), -6.0, 0.01);
        EXPECT_NEAR(10.0 * std::log10(heard("Early", -6.0f) / plain), 0.0, 0.01);
        EXPECT_LT(heard("Distance", 10.0f), 0.1 * plain);
    });
}

TEST_F(SoundTest, InputChannelChoosesTheSide) {
    withData({48000}, [](const PluginLibrary& library) {
        constexpr std::uint32_t frames = 256;
        std::vector<float> left(2 * frames, 0.0f);
        for (std::size_t i = 0; i < frames; ++i) {
            left[2 * i] = i % 16 < 8 ? 0.5f : -0.5f;
        }
        const auto heard = [&](float channel) {
            Source source(library, 48000, frames);
            source.effect().setParameter("Input Channel", channel);
            double sum = 0.0;
            for (int i = 0; i < 6; ++i) {
                sum += energy(source.block(left), 0);
            }
            return sum;
        };
        const double full = heard(-1.0f);
        EXPECT_GT(full, 0.0);
        EXPECT_NEAR(heard(0.0f) / full, 0.25, 1e-4);
        EXPECT_EQ(heard(1.0f), 0.0);
    });
}

TEST_F(SoundTest, OcclusionDarkensAndReturnsInLevel) {
    withData({48000}, [](const PluginLibrary& library) {
        Source source(library, 48000, 1024);
        source.blocks(4);
        const double open = energy(source.blocks(8), 0);
        source.effect().setParameter("Occlusion", 1.0f);
        source.blocks(30);
        EXPECT_LT(energy(source.blocks(8), 0), 0.001 * open) << "24 dB and the low-pass";
        source.effect().setParameter("Occlusion", 0.0f);
        source.blocks(30);
        EXPECT_GT(energy(source.blocks(8), 0), 0.5 * open);
    });
}

}  // namespace
}  // namespace tessaly::test
