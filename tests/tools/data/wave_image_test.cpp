// Header bytes, polarity through the library's reader, order through the engine's table.
#include "data/wave_image.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "base/ess_error.h"
#include "data/data_error.h"
#include "data/hrir_options.h"
#include "data/library_reader.h"
#include "data/measurement.h"
#include "data/sphere.h"
#include "resources/hrir_database.h"
#include "tools/data/scratch_directory.h"

namespace tessaly::data {
namespace {

TEST(WaveImage, HeaderIsTheFortyFourByteForm) {
    const std::string bytes = waveImage({1.0f, -0.5f, 0.25f, 0.0f}, 2, 44100);
    const unsigned char expected[] = {'R',  'I', 'F', 'F',  52,   0,    0,   0, 'W',
                                      'A',  'V', 'E', 'f',  'm',  't',  ' ',  // 36 + 16
                                      16,   0,   0,   0,    3,    0,    2,   0, 0x44,
                                      0xac, 0,   0,   0x20, 0x62, 0x05, 0,   8, 0,
                                      32,   0,   'd', 'a',  't',  'a',  16,  0, 0,
                                      0,    0,   0,   0x80, 0x3f, 0,    0,   0, 0xbf};
    ASSERT_EQ(bytes.size(), waveHeaderBytes + 16);
    for (std::size_t i = 0; i < sizeof(expected); ++i) {
        EXPECT_EQ(static_cast<unsigned char>(bytes[i]), expected[i]) << "byte " << i;
    }
}

TEST(WaveImage, OnlyTheRateThatTheReaderInvertsIsStoredNegated) {
    EXPECT_EQ(waveImage({1.0f}, 1, 24000).substr(waveHeaderBytes), std::string("\0\0\x80\x3f", 4));
    EXPECT_EQ(waveImage({1.0f}, 1, 48000).substr(waveHeaderBytes), std::string("\0\0\x80\xbf", 4));
}

TEST(WaveImage, HeaderCheckNamesTheWrongByte) {
    const std::string good = waveImage({1.0f, 2.0f}, 2, 48000);
    const WaveHeader header = checkWaveHeader(good, good.size(), "x");
    EXPECT_EQ(header.channels, 2);
    EXPECT_EQ(header.sampleRate, 48000);
    EXPECT_EQ(header.frames, 1u);
    for (const std::size_t offset : {0u, 8u, 12u, 16u, 20u, 28u, 32u, 34u, 36u}) {
        std::string bad = good;
        bad[offset] = static_cast<char>(bad[offset] ^ 1);
        try {
            checkWaveHeader(bad, bad.size(), "x");
            FAIL() << "byte " << offset << " is not checked";
        } catch (const DataError& error) {
            EXPECT_NE(std::string(error.what()).find(fmt::format("byte {} ", offset)),
                      std::string::npos)
                << error.what();
        }
    }
    EXPECT_THROW(checkWaveHeader(good, good.size() - 4, "x"), DataError);
    EXPECT_THROW(checkWaveHeader(good.substr(0, 20), 20, "x"), DataError);
}

/// A set whose samples tell where they belong: right k + 1, left -(k + 1), at the first frame.
HrirSet numberedSet(const RateEntry& rate) {
    HrirSet set;
    set.sampleRate = rate.sampleRate;
    set.taps = static_cast<std::size_t>(rate.hrirLength);
    set.pairs.assign(packedOrder().size() * set.taps * earCount, 0.0f);
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        set.pairs[entry * set.taps * earCount] = static_cast<float>(entry + 1);
        set.pairs[entry * set.taps * earCount + 1] = -static_cast<float>(entry + 1);
    }
    return set;
}

class PackedFile : public testing::TestWithParam<int> {
protected:
    PackedFile() : rate(rateEntry(GetParam())), set(numberedSet(rate)) {
        std::ofstream file(scratch.path() / rate.fileName, std::ios::binary);
        file << waveImage(set.pairs, earCount, rate.sampleRate);
    }
    ~PackedFile() override { resetHrirTables(); }

    ScratchDirectory scratch;
    const RateEntry& rate;
    HrirSet set;
};

TEST_P(PackedFile, TheLibraryReadsTheSamplesAsGiven) {
    const HrirSet found = readPackedSet(scratch.path(), rate);
    EXPECT_EQ(found.taps, set.taps);
    EXPECT_EQ(found.pairs, set.pairs);
    EXPECT_EQ(found.sample(5, rightEar, 0), 6.0f);
    EXPECT_EQ(found.sample(5, leftEar, 0), -6.0f);
}

TEST_P(PackedFile, TheEnginesTableFindsEachDirectionInItsPlace) {
    resetHrirTables();
    essError = essErrorNone;
    HrirDatabaseSettings settings;
    settings.bundleBasePath = scratch.path().string();
    settings.sampleRate = rate.sampleRate;
    settings.hrirLength = static_cast<std::int16_t>(rate.hrirLength);
    HrirDatabase database(settings);
    std::int16_t phi = 0;
    std::int16_t theta = 0;
    std::int16_t phiNew = 0;
    std::int16_t indexPhi = 0;
    std::int16_t indexTheta = 0;
    testing::internal::CaptureStdout();
    const bool loaded = database.load(0, {phi, theta, phiNew, indexPhi, indexTheta, 0, 0});
    testing::internal::GetCapturedStdout();
    ASSERT_TRUE(loaded);
    ASSERT_EQ(essError, essErrorNone);
    for (int degrees = -180; degrees <= 180; degrees += gridStepDegrees) {
        for (int elevation = -90; elevation <= 90; elevation += gridStepDegrees) {
            const float* pair = hrirAt(phiToIndex(degrees), thetaToIndex(elevation));
            ASSERT_NE(pair, nullptr);
            const auto number = static_cast<float>(packedIndex(degrees, elevation) + 1);
            EXPECT_EQ(pair[0], number) << degrees << " " << elevation;
            EXPECT_EQ(pair[1], -number) << degrees << " " << elevation;
        }
    }
}

TEST_P(PackedFile, FilesOfTheWrongRateOrLengthAreRefused) {
    std::ofstream file(scratch.path() / rate.fileName, std::ios::binary);
    file << waveImage(set.pairs, earCount, rate.sampleRate == 44100 ? 48000 : 44100);
    file.close();
    EXPECT_THROW(readPackedSet(scratch.path(), rate), DataError);
    file.open(scratch.path() / rate.fileName, std::ios::binary);
    file << waveImage(std::vector<float>(2522 * 2 * 64 + 2), earCount, rate.sampleRate);
    file.close();
    EXPECT_THROW(readPackedSet(scratch.path(), rate), DataError);
    std::filesystem::remove(scratch.path() / rate.fileName);
    EXPECT_THROW(readPackedSet(scratch.path(), rate), DataError);
}

INSTANTIATE_TEST_SUITE_P(Rates, PackedFile, testing::Values(24000, 44100, 48000));

}  // namespace
}  // namespace tessaly::data
