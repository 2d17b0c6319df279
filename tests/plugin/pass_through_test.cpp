// Blocks that the library does not render.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "plugin/plugin_fixture.h"

namespace tessaly::test {
namespace {

using PassThroughTest = PluginTest;

constexpr std::uint32_t rate = 44100;
constexpr std::uint32_t frames = 64;

std::vector<float> counted(std::size_t count) {
    std::vector<float> samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        samples[i] = static_cast<float>(i + 1);
    }
    return samples;
}

TEST_F(PassThroughTest, AMonoInputGoesToAllSixChannels) {
    withData({rate}, [](const PluginLibrary& library) {
        Source source(library, rate, frames);
        std::vector<float> in = counted(frames);
        std::vector<float> out(6 * frames);
        source.effect().processBlock(in.data(), out.data(), frames, 1, 6);
        for (std::size_t i = 0; i < out.size(); ++i) {
            ASSERT_EQ(out[i], in[i / 6]);
        }
    });
}

TEST_F(PassThroughTest, WithoutSpatializerDataNothingLoads) {
    withData({rate}, [](const PluginLibrary& library) {
        Source source(library, rate, frames);
        source.effect().state().spatializerdata = nullptr;
        std::vector<float> in = counted(2 * frames);
        std::vector<float> out(2 * frames);
        const std::string log = standardErrorOf(
            [&] { source.effect().processBlock(in.data(), out.data(), frames, 2, 2); });
        EXPECT_EQ(out, in);
        EXPECT_EQ(log, "");
    });
}

TEST_F(PassThroughTest, OlderHostsGetTheirInputBack) {
    withData({rate}, [](const PluginLibrary& library) {
        Source source(library, rate, frames);
        std::vector<float> in = counted(2 * frames);
        std::vector<float> out(2 * frames);
        source.effect().state().hostapiversion = 0x10200;
        source.effect().processBlock(in.data(), out.data(), frames, 2, 2);
        EXPECT_EQ(out, in);
        source.effect().state().hostapiversion = 0x10300;
        source.effect().state().structsize = 56;
        out.assign(out.size(), 0.0f);
        source.effect().processBlock(in.data(), out.data(), frames, 2, 2);
        EXPECT_EQ(out, in);
    });
}

TEST_F(PassThroughTest, MoreOutputsThanInputsEndInZeros) {
    withData({rate}, [](const PluginLibrary& library) {
        Source source(library, rate, frames);
        std::vector<float> in = counted(2 * frames);
        std::vector<float> out(6 * frames, 9.0f);
        source.effect().processBlock(in.data(), out.data(), frames, 2, 6);
        for (std::size_t i = 0; i < out.size(); ++i) {
            ASSERT_EQ(out[i], i < in.size() ? in[i] : 0.0f);
        }
    });
}

TEST_F(PassThroughTest, AReverbCopiesOtherChannelCounts) {
    withData({rate}, [](const PluginLibrary& library) {
        EffectInstance reverb(library.effect("Tessaly Reverb"), rate, frames);
        reverb.setParameter("Room Selection", 0.0f);
        std::vector<float> in = counted(6 * frames);
        std::vector<float> out(6 * frames, 9.0f);
        reverb.processBlock(in.data(), out.data(), frames, 6, 6);
        EXPECT_EQ(out, in);
        out.assign(out.size(), 9.0f);
        reverb.processBlock(in.data(), out.data(), frames, 1, 2);
        EXPECT_EQ(out[frames - 1], in[frames - 1]);
        EXPECT_EQ(out[frames], 0.0f) << "the input of one channel ends here";
    });
}

TEST_F(PassThroughTest, ABypassedSourceIsHeardAsItIs) {
    withData({rate}, [](const PluginLibrary& library) {
        Source source(library, rate, frames);
        source.blocks(2);
        source.effect().setParameter("Bypass", 1.0f);
        EXPECT_EQ(source.block(counted(2 * frames)), counted(2 * frames));
        const std::vector<float> out = source.block(counted(frames), 1);
        for (std::size_t i = 0; i < out.size(); ++i) {
            ASSERT_EQ(out[i], static_cast<float>(i / 2 + 1));
        }
    });
}

}  // namespace
}  // namespace tessaly::test
