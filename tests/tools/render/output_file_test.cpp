// Files that are complete or absent, and WAV formats.
#include "render/output_file.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sndfile.h>
#include <unistd.h>

#include <fstream>
#include <functional>
#include <stdexcept>
#include <string>

#include "demo_sounds/sound_file.h"

namespace tessaly {
namespace {

using ::testing::HasSubstr;

class OutputFile : public ::testing::Test {
protected:
    void SetUp() override {
        folder = std::filesystem::path(::testing::TempDir()) /
                 ("output_file_" +
                  std::string(::testing::UnitTest::GetInstance()->current_test_info()->name()));
        std::filesystem::remove_all(folder);
        std::filesystem::create_directory(folder);
    }
    void TearDown() override { std::filesystem::remove_all(folder); }

    std::size_t filesInFolder() const {
        const std::filesystem::directory_iterator files(folder);
        return static_cast<std::size_t>(std::distance(begin(files), end(files)));
    }

    std::filesystem::path folder;
};

TEST_F(OutputFile, LeavesNothingIfItIsNotCompleted) {
    {
        const PendingFile file(folder / "a.txt");
        writeText(file, "half");
        EXPECT_EQ(filesInFolder(), 1u);
        EXPECT_FALSE(std::filesystem::exists(folder / "a.txt"));
    }
    EXPECT_EQ(filesInFolder(), 0u);
}

TEST_F(OutputFile, ReplacesAnOlderFileOnlyWhenComplete) {
    std::ofstream(folder / "a.txt") << "old";
    PendingFile file(folder / "a.txt");
    writeText(file, "new");
    std::string text;
    std::ifstream(folder / "a.txt") >> text;
    EXPECT_EQ(text, "old");
    file.complete();
    std::ifstream(folder / "a.txt") >> text;
    EXPECT_EQ(text, "new");
    EXPECT_EQ(filesInFolder(), 1u);
}

TEST_F(OutputFile, UnwritablePlacesAreRefusedAtOnce) {
    const auto failureOf = [](const std::filesystem::path& file) -> std::string {
        try {
            const PendingFile pending(file);
        } catch (const std::runtime_error& error) {
            return error.what();
        }
        return "";
    };
    EXPECT_THAT(failureOf(folder / "missing" / "a.wav"), HasSubstr("cannot write"));
    EXPECT_THAT(failureOf(folder), HasSubstr("it is a directory"));
}

TEST_F(OutputFile, AFullDiskIsToldWithTheReasonAndTheFinalName) {
    if (!std::filesystem::exists("/dev/full")) {
        GTEST_SKIP() << "no device that is always full";
    }
    const std::filesystem::path place = folder / "a.out";
    const auto failureOf = [&](const std::function<void(const PendingFile&)>& write) {
        std::filesystem::create_symlink("/dev/full",
                                        place.string() + ".part-" + std::to_string(getpid()));
        try {
            const PendingFile pending(place);
            write(pending);
        } catch (const std::runtime_error& error) {
            return std::string(error.what());
        }
        return std::string();
    };
    for (const std::size_t length : {1u, 1000000u}) {
        EXPECT_EQ(
            failureOf([&](const PendingFile& file) { writeText(file, std::string(length, 'x')); }),
            "cannot write " + place.string() + ": No space left on device");
        EXPECT_EQ(filesInFolder(), 0u);
    }
    const std::string sound = failureOf([](const PendingFile& file) {
        writeWav(file, std::vector<float>(100000), 48000, SampleFormat::Float);
    });
    EXPECT_THAT(sound, HasSubstr("cannot write " + place.string() + ": "));
    EXPECT_EQ(filesInFolder(), 0u);
}

TEST_F(OutputFile, NewDirectoriesGoAgainUnlessSomethingLiesInThem) {
    { const NewDirectory empty(folder / "a" / "b" / ""); }
    EXPECT_EQ(filesInFolder(), 0u);
    {
        const NewDirectory used(folder / "a" / "b");
        std::ofstream(folder / "a" / "b" / "file") << "x";
    }
    EXPECT_TRUE(std::filesystem::exists(folder / "a" / "b" / "file"));
    std::filesystem::create_directory(folder / "old");
    { const NewDirectory old(folder / "old"); }
    EXPECT_TRUE(std::filesystem::exists(folder / "old")) << "it was there before";
    EXPECT_THROW(NewDirectory(folder / "a" / "b" / "file" / "c"), std::runtime_error);
    EXPECT_THROW(NewDirectory(folder / "a" / "b" / "file"), std::runtime_error);
}

TEST_F(OutputFile, FloatSamplesComeBackExactly) {
    const std::vector<float> samples = {0.1f, -0.2f, 1.5f, -1.75f};
    PendingFile file(folder / "a.wav");
    EXPECT_EQ(writeWav(file, samples, 24000, SampleFormat::Float), 0u);
    file.complete();
    const Sound sound = readSoundFile(folder / "a.wav", 1.0);
    EXPECT_EQ(sound.samples, samples);
    EXPECT_EQ(sound.channels, 2);
    EXPECT_EQ(sound.sampleRate, 24000.0);
}

TEST_F(OutputFile, IntegerSamplesAreCutAtFullScaleAndCounted) {
    const std::vector<float> samples = {0.5f, -0.5f, 1.5f, -1.75f};
    for (const auto& [format, step, subtype] :
         {std::tuple(SampleFormat::Int16, 1.0f / 32768.0f, SF_FORMAT_PCM_16),
          std::tuple(SampleFormat::Int24, 1.0f / 8388608.0f, SF_FORMAT_PCM_24)}) {
        PendingFile file(folder / "a.wav");
        EXPECT_EQ(writeWav(file, samples, 48000, format), 2u);
        file.complete();
        SF_INFO info{};
        SNDFILE* opened = sf_open((folder / "a.wav").c_str(), SFM_READ, &info);
        ASSERT_NE(opened, nullptr);
        sf_close(opened);
        EXPECT_EQ(info.format & SF_FORMAT_SUBMASK, subtype);
        const Sound sound = readSoundFile(folder / "a.wav", 1.0);
        ASSERT_EQ(sound.samples.size(), 4u);
        EXPECT_NEAR(sound.samples[0], 0.5f, 2.0f * step);
        EXPECT_NEAR(sound.samples[1], -0.5f, 2.0f * step);
        EXPECT_NEAR(sound.samples[2], 1.0f, 2.0f * step);
        EXPECT_NEAR(sound.samples[3], -1.0f, 2.0f * step);
    }
}

}  // namespace
}  // namespace tessaly
