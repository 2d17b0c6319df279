// Normal blocks allocate nothing, whatever is switched on; construction survives missing memory.
#include <gtest/gtest.h>
#include <sys/resource.h>

#include <algorithm>
#include <functional>

#include "minihost/no_allocation_scope.h"
#include "support/engine_rig.h"
#include "support/fresh_process.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

class EngineAllocation : public EngineFixture {
protected:
    EngineAllocation() {
        writePackedHrirSet(directory.path(), 48000, 256);  // long enough for every quality
        writePackedTails(directory.path(), 48000, {20});
    }
    TempDirectory directory;
};

TEST_F(EngineAllocation, NoSwitchMakesABlockAllocate) {
    struct Case {
        const char* name;
        std::function<void(EngineRig&)> set;
    };
    const Case cases[] = {
        {"plain", [](EngineRig&) {}},
        {"doppler and smooth steps",
         [](EngineRig& rig) { rig.settings.doppler = rig.settings.qvSmoothSteps = 1; }},
        {"fixed pair", [](EngineRig& rig) { rig.settings.qvEarlyReflections = 1; }},
        {"filter interpolation", [](EngineRig& rig) { rig.qualityValue = 9; }},
        {"direct feed", [](EngineRig& rig) { rig.qualityValue = 10; }},
        {"static filter", [](EngineRig& rig) { rig.settings.qvTrackDirection = 0; }},
        {"synthetic tail", [](EngineRig& rig) { rig.settings.qvReverb = 1; }},
        {"bypass", [](EngineRig& rig) { rig.settings.bypass3DAudio = 1; }},
        {"walls and tail",
         [](EngineRig& rig) {
             rig.settings.auralisation = 1;
             rig.settings.earlyFlexRefPreset = rig.settings.qvReverb = 20;
         }},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        resetProcess();
        EngineRig rig(directory.path(), 48000, 128);
        rig.settings.qvUse256HRIR = 1;
        c.set(rig);
        rig.build();
        ASSERT_EQ(essError, essErrorNone);
        std::fill(rig.input.begin(), rig.input.end(), 0.25f);
        rig.run();
        for (int block = 0; block < 40; ++block) {
            rig.azimuth = static_cast<std::int16_t>(block * 3 - 60);
            rig.elevation = static_cast<std::int16_t>(block - 20);
            rig.distance = 0.5f + 0.4f * static_cast<float>(block);
            rig.mix.directGain = 1.0f + 0.01f * static_cast<float>(block);
            rig.engine->setInputLowPass(0.02f * static_cast<float>(block));
            NoAllocationScope scope;
            rig.run();
            ASSERT_EQ(scope.allocations(), 0u) << block;
        }
    }
}

TEST_F(EngineAllocation, MissingMemoryIsAnErrorAndSilence) {
#if defined(__SANITIZE_ADDRESS__)
    GTEST_SKIP() << "the sanitizer's own address space leaves no limit to set";
#endif
    inFreshProcess([&] {
        rlimit limit{};
        limit.rlim_cur = limit.rlim_max = rlim_t{1} << 30;  // 1 GiB of addresses in all
        ASSERT_EQ(setrlimit(RLIMIT_AS, &limit), 0);
        EngineRig rig(directory.path(), 48000, 1024);
        rig.settings.qvReverb = 1;
        rig.settings.defaultFirSize = 1 << 28;  // a response of 1 GiB an ear
        LogCapture log;
        rig.build();
        EXPECT_EQ(essError, essErrorSpectrumMemory);
        EXPECT_EQ(log.count(LogStream::output, "!!!Not enough memory!!!"), 1u);
        EXPECT_EQ(engineCount, 1);
        std::fill(rig.output.begin(), rig.output.end(), 1.0f);
        rig.run();
        EXPECT_EQ(rig.output, std::vector<float>(rig.output.size(), 0.0f));
        rig.engine.reset();
        EXPECT_EQ(engineCount, 0);
    });
}

}  // namespace
}  // namespace tessaly::test
