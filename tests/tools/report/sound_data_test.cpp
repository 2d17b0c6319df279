// Sounds and pictures as the page carries them, decoded again.
#include "report/sound_data.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sndfile.h>

#include <cmath>
#include <fstream>
#include <limits>
#include <string>

#include "report/base64.h"
#include "tools/data/scratch_directory.h"

namespace tessaly {
namespace {

constexpr float nan = std::numeric_limits<float>::quiet_NaN();
constexpr float infinity = std::numeric_limits<float>::infinity();

std::vector<unsigned char> bytesOf(const std::string& text) { return {text.begin(), text.end()}; }

std::vector<float> decoded(const std::vector<unsigned char>& flac, int sampleRate) {
    const data::ScratchDirectory scratch;
    const std::filesystem::path file = scratch.path() / "sound.flac";
    {
        std::ofstream stream(file, std::ios::binary);
        for (const unsigned char byte : flac) {
            stream.put(static_cast<char>(byte));
        }
    }
    SF_INFO info{};
    SNDFILE* opened = sf_open(file.c_str(), SFM_READ, &info);
    EXPECT_NE(opened, nullptr);
    if (opened == nullptr) {
        return {};
    }
    EXPECT_EQ(info.channels, 2);
    EXPECT_EQ(info.samplerate, sampleRate);
    EXPECT_EQ(info.format, SF_FORMAT_FLAC | SF_FORMAT_PCM_16);
    std::vector<float> stereo(static_cast<std::size_t>(2 * info.frames));
    EXPECT_EQ(sf_readf_float(opened, stereo.data(), info.frames), info.frames);
    sf_close(opened);
    return stereo;
}

TEST(Base64, EncodesTheVectorsOfItsStandard) {
    const std::vector<std::pair<std::string, std::string>> pairs = {{"", ""},
                                                                    {"f", "Zg=="},
                                                                    {"fo", "Zm8="},
                                                                    {"foo", "Zm9v"},
                                                                    {"foob", "Zm9vYg=="},
                                                                    {"fooba", "Zm9vYmE="},
                                                                    {"foobar", "Zm9vYmFy"},
                                                                    {"\xFF\xFB", "//s="}};
    for (const auto& [plain, encoded] : pairs) {
        EXPECT_EQ(base64(bytesOf(plain)), encoded);
    }
    EXPECT_EQ(dataUri("image/png", bytesOf("foo")), "data:image/png;base64,Zm9v");
}

TEST(SoundData, DecodesToTheSamplesWithinSixteenBits) {
    for (const int sampleRate : {24000, 44100, 48000}) {
        std::vector<float> stereo(2 * 5000);
        for (std::size_t i = 0; i < stereo.size(); ++i) {
            stereo[i] =
                0.999f * static_cast<float>(std::sin(0.0137 * static_cast<double>(i * i % 9973)));
        }
        stereo[10] = 1.0f;
        stereo[11] = -1.0f;
        const SoundData sound = encodeFlac(stereo, sampleRate);
        EXPECT_DOUBLE_EQ(sound.loweredDb, 0.0);
        const std::vector<float> again = decoded(sound.flac, sampleRate);
        ASSERT_EQ(again.size(), stereo.size());
        for (std::size_t i = 0; i < stereo.size(); ++i) {
            // Half a step of rounding, and full scale is one step below 1.
            ASSERT_NEAR(again[i], stereo[i], 1.6 / 32768.0) << i;
        }
    }
}

TEST(SoundData, PeaksAboveFullScaleLowerTheWholeSound) {
    const std::vector<float> stereo = {0.5f, -2.0f, 1.0f, 0.25f, 0.0f, 0.1f};
    const SoundData sound = encodeFlac(stereo, 48000);
    EXPECT_NEAR(sound.loweredDb, 6.0206, 1e-4);
    const std::vector<float> again = decoded(sound.flac, 48000);
    ASSERT_EQ(again.size(), stereo.size());
    for (std::size_t i = 0; i < stereo.size(); ++i) {
        EXPECT_NEAR(again[i], 0.5f * stereo[i], 1.6 / 32768.0);
    }
}

TEST(SoundData, HugePeaksAreLoweredToo) {
    const std::vector<float> stereo(64, std::numeric_limits<float>::max());
    const SoundData sound = encodeFlac(stereo, 48000);
    EXPECT_NEAR(sound.loweredDb, 20.0 * std::log10(3.4028235e38), 1e-3);
    EXPECT_NEAR(decoded(sound.flac, 48000).at(5), 1.0, 1e-4);
}

TEST(SoundData, ShortestSoundIsWhole) {
    EXPECT_TRUE(encodeFlac({}, 48000).flac.empty());
    const std::vector<float> one = {0.25f, -0.25f};
    EXPECT_THAT(decoded(encodeFlac(one, 44100).flac, 44100),
                ::testing::Pointwise(::testing::FloatNear(1e-4f), one));
}

TEST(SoundData, SamplesThatAreNoNumbersAreSilentAndCounted) {
    const std::vector<float> stereo = {0.5f, nan, infinity, -0.5f, -infinity, 0.1f, 0.7f};
    const CleanSound sound = cleaned(stereo);
    EXPECT_EQ(sound.notNumbers, 3u);
    EXPECT_THAT(sound.stereo, ::testing::ElementsAre(0.5f, 0.0f, 0.0f, -0.5f, 0.0f, 0.1f));
    EXPECT_EQ(cleaned({}).notNumbers, 0u);
}

}  // namespace
}  // namespace tessaly
