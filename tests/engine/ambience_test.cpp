// Loading the ambience loop.
#include "engine/ambience.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <vector>

#include "base/ess_error.h"
#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

using AmbienceLoop = EngineFixture;

std::vector<float> loop() {
    std::vector<float> samples(std::size_t{2} * ATMO_LENGTH);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        samples[i] = static_cast<float>(i % 1000) * 0.001f;
    }
    return samples;
}

TEST_F(AmbienceLoop, IsFoundWithAnEmptyDirectoryOnly) {
    // With an empty data directory the name stands at the root of the file system, where a test
    // has nothing to write; the double prefix shows with any other directory.
    const TempDirectory directory;
    std::filesystem::create_directories(directory.path() + directory.path());
    writeWav(directory.path() + directory.path() + "/SFX39", 2, 44100, 16, loop());
    Ambience bed;
    bed.setBlockLength(1024);
    bed.load(3, directory.path());
    EXPECT_EQ(essError, essErrorNone) << "the directory is put in front twice";
    ASSERT_NE(bed.block(0), nullptr);
    EXPECT_NEAR(bed.block(0)[7], 0.007f, 1e-4f);
    EXPECT_NEAR(bed.block(1)[0], 0.048f, 1e-4f) << "2048 floats on";
}

TEST_F(AmbienceLoop, AMissingLoopIsAnErrorAndASilentBed) {
    const TempDirectory directory;
    for (const int selection : {1, 2, 3}) {
        essError = essErrorNone;
        LogCapture log;
        Ambience bed;
        bed.setBlockLength(256);
        bed.load(selection, directory.path());
        EXPECT_EQ(essError, essErrorWavUnreadable);
        EXPECT_EQ(log.count(LogStream::output, "Load Source Wav!..."), 1u);
        const char* const names[] = {"/AtmoHerrmansplatzShort", "/Atmo_Wald_Long4dB", "/SFX39"};
        EXPECT_EQ(log.count(LogStream::output, "filePathIn = " + directory.path() +
                                                   directory.path() + names[selection - 1]),
                  1u);
        ASSERT_NE(bed.block(3), nullptr);
        EXPECT_EQ(bed.block(3)[0], 0.0f);
    }
}

TEST_F(AmbienceLoop, OtherSelectionsLoadNothing) {
    for (const int selection : {-1, 0, 4, 99}) {
        Ambience bed;
        bed.setBlockLength(256);
        bed.load(selection, "");
        EXPECT_EQ(bed.block(0), nullptr);
    }
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(AmbienceLoop, TheLastBlockEndsInsideTheLoop) {
    for (int block = 2; block <= 8192; block *= 2) {
        Ambience bed;
        bed.setBlockLength(block);
        bed.atmoBuffer = AlignedArray<float>(std::size_t{2} * ATMO_LENGTH);
        const float* last = bed.block(static_cast<unsigned int>(bed.ATMO_BLOCKS) - 1u);
        EXPECT_LE(last + 2 * block, bed.atmoBuffer.end()) << block;
    }
}

}  // namespace
}  // namespace tessaly::test
