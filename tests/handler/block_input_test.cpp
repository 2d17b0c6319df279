// The engine's input over many blocks against a plain form of it, silence among them.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <limits>
#include <random>
#include <type_traits>
#include <vector>

#include "base/units.h"
#include "handler/fake_engine.h"
#include "handler/instance_handler.h"
#include "handler/process_fixture.h"
#include "support/log_capture.h"

namespace tessaly::test {
namespace {

constexpr int rate = 48000;
constexpr int frames = 16;
constexpr float nan = std::numeric_limits<float>::quiet_NaN();

bool sameBits(const std::vector<float>& a, const std::vector<float>& b) {
    return a.size() == b.size() && std::memcmp(a.data(), b.data(), a.size() * sizeof(float)) == 0;
}

class BlockInputTest : public ProcessFixture {
protected:
    BlockInputTest() : handler(rate, frames) {
        setAssetPath();
        load(0);
    }
    bool load(int room) {
        handler.roomPreset = room;
        return handler.checkForChanges(rate, frames);
    }
    const std::vector<float>& engineInput() { return fakeEngines().last().blocks.back().input; }

    LogCapture log;
    InstanceHandler handler;
};

/// `inputBlock` as it follows from the blocks so far, sample by sample.
struct PlainInput {
    std::vector<float> block = std::vector<float>(2 * frames, 0.0f);

    void take(const std::vector<float>& in,
              int inchannels,
              float inputChannel,
              std::size_t length) {
        if (inchannels <= 0) {
            std::fill_n(block.begin(), 2 * length, 0.0f);
        } else if (inchannels == 1) {
            for (std::size_t i = 0; i < length; ++i) {
                block[2 * i] = in[i];
            }
        } else if (inputChannel <= -1.0f || !(inputChannel <= 1e6f)) {
            std::copy_n(in.begin(), 2 * length, block.begin());
        } else {
            const float w = (inputChannel + 1.0f) * 0.5f;
            for (std::size_t i = 0; i < length; ++i) {
                block[2 * i] = in[2 * i] * (1.0f - w) + in[2 * i + 1] * w;
            }
        }
    }
};

TEST_F(BlockInputTest, EqualsThePlainFormOverSoundsAndSilences) {
    std::mt19937 random(7);
    std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
    const auto oneOf = [&random](auto... values) {
        const std::common_type_t<decltype(values)...> list[] = {values...};
        return list[random() % sizeof...(values)];
    };
    PlainInput plain;
    std::vector<float> out(2 * frames);
    int silentBlocks = 0;
    int toldBlocks = 0;  // all of the engine's input is zeros, and it was told
    for (int block = 0; block < 3000; ++block) {
        SCOPED_TRACE(block);
        if (random() % 200 == 0 && load(block % 2)) {
            plain = PlainInput{};
        }
        const int inchannels = oneOf(0, 1, 2, 2, 2, 6);
        const float channel = oneOf(-1.0f, -0.99999994f, -0.3f, 0.0f, 1.0f, 5.0f, nan);
        const auto length = static_cast<std::size_t>(oneOf(frames, frames, frames, 5, 1, 0));
        std::vector<float> in(static_cast<std::size_t>(std::max(inchannels, 0)) * frames, 0.0f);
        switch (random() % 6) {
            case 0:
                std::generate(in.begin(), in.end(), [&] { return noise(random); });
                break;
            case 1:
                std::generate(in.begin() + static_cast<std::ptrdiff_t>(in.size() / 2), in.end(),
                              [&] { return noise(random); });
                break;
            case 2:
                std::fill(in.begin(), in.end(), -0.0f);
                break;
            default:
                break;
        }
        handler.inputChannel = channel;
        handler.processBlock(in.data(), out.data(), static_cast<std::uint32_t>(length), inchannels,
                             2);
        plain.take(in, inchannels, channel, length);
        ASSERT_TRUE(sameBits(engineInput(), plain.block));
        ASSERT_TRUE(length < frames || sameBits(out, plain.block)) << "the fake passes it on";

        const std::size_t read = static_cast<std::size_t>(std::clamp(inchannels, 0, 2)) * length;
        const std::vector<float> heard(in.begin(), in.begin() + static_cast<std::ptrdiff_t>(read));
        const bool silent = sameBits(heard, std::vector<float>(read, 0.0f));
        EXPECT_EQ(handler.inputWasSilent(), silent);
        silentBlocks += silent ? 1 : 0;
        const bool zeros = sameBits(plain.block, std::vector<float>(plain.block.size(), 0.0f));
        EXPECT_EQ(fakeEngines().last().blocks.back().silenceExpected, silent && zeros);
        toldBlocks += silent && zeros ? 1 : 0;
    }
    EXPECT_GT(toldBlocks, 100);
    EXPECT_GT(silentBlocks, 500);
    EXPECT_LT(silentBlocks, 2500);
}

TEST_F(BlockInputTest, IsNotSaidToBeSilentWhereItWasNotLookedAt) {
    const std::vector<float> in(2 * frames, 0.0f);
    std::vector<float> out(2 * frames);
    const auto run = [&] {
        handler.processBlock(in.data(), out.data(), frames, 2, 2);
        return handler.inputWasSilent();
    };
    EXPECT_TRUE(run());
    handler.bypassExternal = true;
    EXPECT_FALSE(run());
    handler.bypassExternal = false;
    handler.unityDistanceMute = true;
    EXPECT_FALSE(run());
    handler.unityDistanceMute = false;
    EXPECT_TRUE(run());
}

TEST_F(BlockInputTest, TheOutputMayBeTheInput) {
    handler.inputChannel = 1.0f;
    std::vector<float> both(2 * frames);
    for (std::size_t i = 0; i < both.size(); ++i) {
        both[i] = static_cast<float>(i);
    }
    const std::vector<float> before = both;
    handler.processBlock(both.data(), both.data(), frames, 2, 2);
    for (std::size_t i = 0; i < frames; ++i) {
        EXPECT_EQ(both[2 * i], before[2 * i + 1]);
        EXPECT_EQ(both[2 * i + 1], 0.0f);
    }
}

TEST_F(BlockInputTest, LevelsAndAnglesFollowEveryChange) {
    const std::vector<float> in(2 * frames, 1.0f);
    std::vector<float> out(2 * frames);
    const auto run = [&]() -> const FakeBlock& {
        handler.processBlock(in.data(), out.data(), frames, 2, 2);
        return fakeEngines().last().blocks.back();
    };
    handler.angleExponent = 2.0f;
    for (int round = 0; round < 2; ++round) {
        for (const float db : {0.0f, -6.0f, -6.0f, 12.0f, nan, nan, -96.0f, 0.0f}) {
            handler.directGainDb = db;
            handler.earlyGainDb = db - 1.0f;
            handler.reverbGainDb = db - 2.0f;
            const FakeBlock& block = run();
            const float wanted[] = {decibelsToLinear(db), decibelsToLinear(db - 1.0f),
                                    decibelsToLinear(db - 2.0f)};
            const float got[] = {block.mix.directGain, block.mix.earlyGain, block.mix.reverbGain};
            EXPECT_EQ(std::memcmp(got, wanted, sizeof got), 0) << db;
        }
        struct Bend {
            float azimuth;
            float exponent;
            std::int16_t bent;
        };
        for (const Bend& bend : {Bend{45.0f, 2.0f, 22}, Bend{45.0f, 1.0f, 45},
                                 Bend{45.0f, 2.0f, 22}, Bend{-45.0f, 2.0f, -22}, Bend{nan, 2.0f, 0},
                                 Bend{-45.0f, 2.0f, -22}, Bend{0.0f, 2.0f, 0}}) {
            handler.azimuth = bend.azimuth;
            handler.angleExponent = bend.exponent;
            run();
            EXPECT_EQ(handler.azimuthIn, bend.bent) << bend.azimuth << " by " << bend.exponent;
        }
    }
}

}  // namespace
}  // namespace tessaly::test
