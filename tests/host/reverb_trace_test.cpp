// What returns tell where trace lines join the output log.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "host/debug_text_capture.h"
#include "host/host_instance.h"
#include "host/reverb_effect.h"
#include "host/reverb_mix_buffers.h"

namespace tessaly::test {
namespace {

using namespace reverb;

constexpr std::uint32_t frames = 8;

/// No data path is set, so no engine is ever built.
class ReverbTrace : public ::testing::Test {
protected:
    ReverbTrace() : host(48000, frames) {
        reverbmixbuffermap.clear();
        EXPECT_EQ(reverbCreate(&host.state), 0);
        DebugTextCapture::calls().clear();
    }
    ~ReverbTrace() override {
        EXPECT_EQ(reverbRelease(&host.state), 0);
        reverbmixbuffermap.clear();
    }

    void setId(float value) {
        DebugTextCapture::calls().clear();
        EXPECT_EQ(reverbSetFloatParameter(&host.state, P_REVERB_ID, value), 0);
    }
    /// How many lines a silent block writes that begin so.
    std::size_t muted(const char* line) {
        DebugTextCapture::calls().clear();
        std::vector<float> in(2 * frames, 0.5f);
        std::vector<float> out(2 * frames, 9.0f);
        EXPECT_EQ(reverbProcess(&host.state, in.data(), out.data(), frames, 2, 2), 0);
        EXPECT_EQ(out, std::vector<float>(2 * frames, 0.0f));
        return DebugTextCapture::count(line);
    }

    const DebugTextCapture log;
    HostInstance host;
};

TEST_F(ReverbTrace, AnIdIsToldAndTheFirstOfAll) {
    setId(5.7f);
    EXPECT_EQ(DebugTextCapture::count("Tessaly_sr: reverbmixbuffermap == 0"), 1u);
    EXPECT_EQ(DebugTextCapture::count("Tessaly_sr: set float P_REVERB_ID to 5.7 equals valueIn 5"),
              1u);
    setId(6.0f);
    EXPECT_EQ(DebugTextCapture::count("reverbmixbuffermap"), 0u);
    EXPECT_EQ(DebugTextCapture::count("Tessaly_sr: set float P_REVERB_ID to 6 equals valueIn 6"),
              1u);
}

TEST_F(ReverbTrace, ASilentBlockSaysWhy) {
    EXPECT_EQ(muted("Tessaly_sr: WARNING mute buffer in ReverbID 0 cause isLoaded = 0 or ID == 0 "
                    "= 1 or -> second = "),
              1u);
    setId(5.0f);
    EXPECT_EQ(muted("Tessaly_sr: WARNING mute buffer in ReverbID 5 cause isLoaded = 0 or ID == 0 "
                    "= 0 or -> second = "),
              1u);
}

}  // namespace
}  // namespace tessaly::test
