// Reading and resampling of sound files.
#include "demo_sounds/sound_file.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sndfile.h>

#include <cmath>
#include <fstream>
#include <numbers>
#include <stdexcept>
#include <string>

namespace tessaly {
namespace {

using ::testing::HasSubstr;

std::filesystem::path temporary(const std::string& name) {
    return std::filesystem::path(::testing::TempDir()) / ("sound_file_test_" + name);
}

void write(const std::filesystem::path& file,
           const std::vector<float>& samples,
           int channels,
           int rate,
           int format = SF_FORMAT_WAV | SF_FORMAT_FLOAT) {
    SF_INFO info{};
    info.channels = channels;
    info.samplerate = rate;
    info.format = format;
    SNDFILE* opened = sf_open(file.c_str(), SFM_WRITE, &info);
    ASSERT_NE(opened, nullptr);
    sf_write_float(opened, samples.data(), static_cast<sf_count_t>(samples.size()));
    sf_close(opened);
}

TEST(SoundFile, StereoStaysStereo) {
    const std::filesystem::path file = temporary("stereo.wav");
    write(file, {0.1f, -0.1f, 0.2f, -0.2f, 0.3f, -0.3f}, 2, 44100);
    const Sound sound = readSoundFile(file, 10.0);
    EXPECT_EQ(sound.channels, 2);
    EXPECT_EQ(sound.sampleRate, 44100.0);
    EXPECT_EQ(sound.samples, (std::vector<float>{0.1f, -0.1f, 0.2f, -0.2f, 0.3f, -0.3f}));
}

TEST(SoundFile, FirstTwoOfManyChannelsAreKept) {
    const std::filesystem::path file = temporary("four.wav");
    write(file, {1.0f, 2.0f, 3.0f, 4.0f, 5.0f, 6.0f, 7.0f, 8.0f}, 4, 48000);
    const Sound sound = readSoundFile(file, 10.0);
    EXPECT_EQ(sound.channels, 2);
    EXPECT_EQ(sound.samples, (std::vector<float>{1.0f, 2.0f, 5.0f, 6.0f}));
}

TEST(SoundFile, ReadsNoFurtherThanAsked) {
    const std::filesystem::path file = temporary("long.flac");
    write(file, std::vector<float>(100000, 0.25f), 1, 1000, SF_FORMAT_FLAC | SF_FORMAT_PCM_16);
    EXPECT_EQ(readSoundFile(file, 70.5).frames(), 70500u);
    EXPECT_EQ(readSoundFile(file, 1000.0).frames(), 100000u);
}

TEST(SoundFile, FailuresNameTheFile) {
    const auto failureOf = [](const std::filesystem::path& file) -> std::string {
        try {
            readSoundFile(file, 1.0);
        } catch (const std::runtime_error& error) {
            return error.what();
        }
        return "";
    };
    EXPECT_THAT(failureOf("/no/such.wav"), HasSubstr("cannot read /no/such.wav"));
    const std::filesystem::path text = temporary("text.wav");
    std::ofstream(text) << "this is no sound";
    EXPECT_THAT(failureOf(text), HasSubstr(text.string()));
    const std::filesystem::path empty = temporary("empty.wav");
    write(empty, {}, 1, 48000);
    EXPECT_THAT(failureOf(empty), HasSubstr("no sound in " + empty.string()));
    const std::filesystem::path notNumbers = temporary("nan.wav");
    write(notNumbers, {0.0f, std::nanf("")}, 1, 48000);
    EXPECT_THAT(failureOf(notNumbers), HasSubstr("no numbers"));
}

TEST(SoundFile, ResamplingKeepsLevelAndTiming) {
    Sound sound;
    sound.channels = 2;
    sound.sampleRate = 22050.0;
    constexpr double frequency = 997.0;
    for (int i = 0; i < 22050; ++i) {
        const double phase = 2.0 * std::numbers::pi * frequency * i / 22050.0;
        sound.samples.push_back(static_cast<float>(0.5 * std::sin(phase)));
        sound.samples.push_back(static_cast<float>(0.25 * std::cos(phase)));
    }
    const Sound result = resampled(sound, 48000.0);
    EXPECT_EQ(result.channels, 2);
    EXPECT_EQ(result.frames(), 48000u);
    // Away from the ends; a 20-bit resampler is good to about 1e-5.
    for (std::size_t i = 10000; i < 38000; ++i) {
        const double phase = 2.0 * std::numbers::pi * frequency * static_cast<double>(i) / 48000.0;
        ASSERT_NEAR(static_cast<double>(result.samples[2 * i]), 0.5 * std::sin(phase), 1e-4);
        ASSERT_NEAR(static_cast<double>(result.samples[2 * i + 1]), 0.25 * std::cos(phase), 1e-4);
    }
}

TEST(SoundFile, SameRateIsUntouched) {
    Sound sound;
    sound.sampleRate = 48000.0;
    sound.samples = {0.1f, 0.2f, 0.3f};
    EXPECT_EQ(resampled(sound, 48000.0).samples, sound.samples);
}

}  // namespace
}  // namespace tessaly
