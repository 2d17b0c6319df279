// Tests of the sound file reader: names, header checks, sample formats, polarity and tails.
#include "resources/wav_reader.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <limits>
#include <string>
#include <utility>
#include <vector>

#include "base/ess_error.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly {
namespace {

using test::LogLine;
using test::LogStream;
using ::testing::Each;
using ::testing::ElementsAre;

constexpr float untouched = 123.0f;

class WavReader : public ::testing::Test {
protected:
    WavReader() { essError = essErrorNone; }
    ~WavReader() override { essError = essErrorNone; }

    /// A source whose names are complete.
    WavSource plain() const {
        WavSource source;
        source.bundleBasePath = directory_.path();
        source.sampleRate = 44100;
        return source;
    }

    /// Reads "/a.wav" into `values_`, which holds two values more than asked for.
    bool read(int frames, int channels) {
        values_.assign(static_cast<std::size_t>(std::max(frames, 0)) * channels + 2, untouched);
        return readWav(plain(), "/a.wav", values_.data(), frames,
                       static_cast<std::int16_t>(channels));
    }
    bool readBytes(const std::vector<char>& bytes, int frames, int channels) {
        test::writeFile(directory_.file("/a.wav"), bytes);
        return read(frames, channels);
    }
    bool readSamples(
        const std::vector<float>& samples, int rate, int bits, int frames, int channels) {
        return readBytes(test::wavBytes(channels, rate, bits, samples), frames, channels);
    }

    void expectErrorOnBothStreams(const std::string& text, int code) {
        EXPECT_EQ(essError, code);
        ASSERT_GE(log_.lines().size(), 2u);
        EXPECT_EQ(log_.lines()[log_.lines().size() - 2], (LogLine{LogStream::output, text}));
        EXPECT_EQ(log_.lines().back(), (LogLine{LogStream::error, text}));
        EXPECT_EQ(log_.errorLines().size(), 1u);
    }

    test::TempDirectory directory_;
    test::LogCapture log_;
    std::vector<float> values_;
};

// ---- Sample formats ----

TEST_F(WavReader, ReadsInterleavedFloatsAsTheyStand) {
    ASSERT_TRUE(readSamples({0.5f, -0.25f, 1.0f, -1.5f}, 44100, 32, 2, 2));
    EXPECT_THAT(values_, ElementsAre(0.5f, -0.25f, 1.0f, -1.5f, untouched, untouched));
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_EQ(log_.output(), "filePathIn = " + directory_.file("/a.wav") + "\n");
    EXPECT_EQ(log_.error(), "");
}

TEST_F(WavReader, FloatsOfFilesMarked48000AreInverted) {
    ASSERT_TRUE(readSamples({0.5f, -0.25f}, 48000, 32, 2, 1));
    EXPECT_THAT(values_, ElementsAre(-0.5f, 0.25f, untouched, untouched));
}

TEST_F(WavReader, OnlyTheRateOfTheFileDecidesThePolarity) {
    for (const int rate : {24000, 44100, 47999, 48001, 96000, 0}) {
        ASSERT_TRUE(readSamples({0.5f}, rate, 32, 1, 1));
        EXPECT_EQ(values_[0], 0.5f) << rate;
    }
    test::writeWav(directory_.file("/b"), 1, 44100, 32, std::vector{0.5f});
    WavSource source = plain();
    source.sampleRate = 48000;
    float value = 0.0f;
    ASSERT_TRUE(readWav(source, "/b", &value, 1, 1));
    EXPECT_EQ(value, 0.5f);
}

TEST_F(WavReader, SixteenBitValuesAreScaledToFullScaleOne) {
    ASSERT_TRUE(readSamples({-1.0f, 32767.0f / 32768.0f, 0.0f, 1.0f / 32768.0f}, 44100, 16, 4, 1));
    EXPECT_THAT(values_,
                ElementsAre(-1.0f, 0.99996948f, 0.0f, 3.0517578e-05f, untouched, untouched));
}

TEST_F(WavReader, SixteenBitValuesAreNeverInverted) {
    ASSERT_TRUE(readSamples({0.5f, -0.5f}, 48000, 16, 1, 2));
    EXPECT_EQ(values_[0], 0.5f);
    EXPECT_EQ(values_[1], -0.5f);
}

TEST_F(WavReader, LongFilesAreReadWhole) {
    for (const int bits : {32, 16}) {
        std::vector<float> samples;
        for (int n = 0; n < 10001; ++n) {
            samples.push_back(static_cast<float>(n % 3001 - 1500) / 32768.0f);
        }
        ASSERT_TRUE(readSamples(samples, 44100, bits, 10001, 1));
        samples.insert(samples.end(), {untouched, untouched});
        EXPECT_EQ(values_, samples) << bits;
    }
}

// ---- Checks ----

TEST_F(WavReader, ExcessSamplesAreNotRead) {
    ASSERT_TRUE(readSamples({1.0f, 2.0f, 3.0f, 4.0f}, 44100, 32, 3, 1));
    EXPECT_THAT(values_, ElementsAre(1.0f, 2.0f, 3.0f, untouched, untouched));
}

TEST_F(WavReader, OneSampleFewerThanWantedIsTooShort) {
    EXPECT_TRUE(readSamples({1.0f, 2.0f, 3.0f, 4.0f}, 44100, 32, 2, 2));
    EXPECT_FALSE(readBytes(test::wavBytes(2, 44100, 32, std::vector{1.0f, 2.0f, 3.0f}), 2, 2));
    EXPECT_THAT(values_, Each(untouched));
    expectErrorOnBothStreams("Tessaly_e ERROR: Wav with 3 is too short for 4 frames!",
                             essErrorWavTooShort);
}

TEST_F(WavReader, OtherChannelCountsAreRefusedBeforeTheLength) {
    EXPECT_FALSE(readBytes(test::wavBytes(2, 44100, 32, {}), 100, 1));
    EXPECT_THAT(values_, Each(untouched));
    expectErrorOnBothStreams("Tessaly_e ERROR: Wav is 2 instead of called for 1",
                             essErrorWavChannels);
}

TEST_F(WavReader, OtherDepthsAreRefused) {
    for (const int bits : {8, 24, 64}) {
        log_.clear();
        essError = essErrorNone;
        EXPECT_FALSE(readSamples(std::vector<float>(40), 44100, bits, 2, 1)) << bits;
        EXPECT_THAT(values_, Each(untouched));
        expectErrorOnBothStreams("Tessaly_e ERROR: Wav not 32 or 16 Bit!!!!", essErrorWavBitDepth);
    }
}

TEST_F(WavReader, TheLengthIsCheckedBeforeTheDepth) {
    // 8 bytes hold 2 values of 24 bits: the quotient is rounded down.
    EXPECT_FALSE(readSamples({1.0f, 2.0f}, 44100, 24, 3, 1));
    expectErrorOnBothStreams("Tessaly_e ERROR: Wav with 2 is too short for 3 frames!",
                             essErrorWavTooShort);
}

TEST_F(WavReader, DepthsBelowOneByteAreRefusedWithoutALength) {
    for (const int bits : {0, 1, 7}) {
        essError = essErrorNone;
        EXPECT_FALSE(readSamples({1.0f, 2.0f}, 44100, bits, 2, 1)) << bits;
        EXPECT_EQ(essError, essErrorWavBitDepth) << bits;
    }
}

TEST_F(WavReader, MissingFilesAreUnreadable) {
    EXPECT_FALSE(read(2, 1));
    EXPECT_THAT(values_, Each(untouched));
    EXPECT_EQ(log_.lines().front(),
              (LogLine{LogStream::output, "filePathIn = " + directory_.file("/a.wav")}));
    expectErrorOnBothStreams("Tessaly_e ERROR: Wav not readable!!!!", essErrorWavUnreadable);
}

TEST_F(WavReader, TheLastErrorWinsAndAGoodReadLeavesIt) {
    EXPECT_FALSE(read(2, 1));
    EXPECT_EQ(essError, essErrorWavUnreadable);
    EXPECT_FALSE(readSamples({1.0f}, 44100, 32, 2, 1));
    EXPECT_EQ(essError, essErrorWavTooShort);
    EXPECT_TRUE(readSamples({1.0f}, 44100, 32, 1, 1));
    EXPECT_EQ(essError, essErrorWavTooShort);
}

TEST_F(WavReader, NoFramesWantedReadsNothing) {
    EXPECT_TRUE(readSamples({1.0f}, 44100, 32, 0, 1));
    EXPECT_THAT(values_, Each(untouched));
}

TEST_F(WavReader, NegativeCountsAreTooShort) {
    std::vector<char> bytes = test::wavBytes(1, 44100, 16, std::vector<float>(64));
    const std::uint32_t hugeSize = 0xFFFFFFFFu;
    std::memcpy(bytes.data() + 40, &hugeSize, 4);
    for (const int frames : {-1, -5, std::numeric_limits<int>::min()}) {
        essError = essErrorNone;
        EXPECT_FALSE(readBytes(bytes, frames, 1)) << frames;
        EXPECT_EQ(essError, essErrorWavTooShort) << frames;
        EXPECT_THAT(values_, Each(untouched));
    }
    // Products that wrap round to a small positive number.
    const std::int16_t negativeChannels = -2;
    std::memcpy(bytes.data() + 22, &negativeChannels, 2);
    test::writeFile(directory_.file("/a.wav"), bytes);
    float value = untouched;
    EXPECT_FALSE(readWav(plain(), "/a.wav", &value, 0x7FFFFFFF, negativeChannels));
    EXPECT_EQ(value, untouched);
}

TEST_F(WavReader, NothingElseOfTheHeaderIsLookedAt) {
    std::vector<char> bytes = test::wavBytes(1, 44100, 32, std::vector{0.5f, 0.75f});
    for (const int offset : {0, 5, 8, 15, 16, 20, 21, 28, 32, 37, 38, 39}) {
        bytes[offset] = 'x';
    }
    EXPECT_TRUE(readBytes(bytes, 2, 1));
    EXPECT_THAT(values_, ElementsAre(0.5f, 0.75f, untouched, untouched));
}

// ---- The walk to the data ----

TEST_F(WavReader, WalksPastAChunkWithoutTheLetter) {
    std::vector<char> bytes = test::wavBytes(1, 44100, 32, std::vector{0.5f, 0.75f});
    const std::string chunk("fact\4\0\0\0\2\0\0\0", 12);
    bytes.insert(bytes.begin() + 36, chunk.begin(), chunk.end());
    EXPECT_TRUE(readBytes(bytes, 2, 1));
    EXPECT_THAT(values_, ElementsAre(0.5f, 0.75f, untouched, untouched));
    const std::vector<std::string> lines = log_.outputLines();
    ASSERT_EQ(lines.size(), 13u);
    for (std::size_t n = 1; n < lines.size(); ++n) {
        EXPECT_EQ(lines[n], "WAVE: not yet at \"data\" ");
    }
    EXPECT_EQ(log_.error(), "");
}

TEST_F(WavReader, AChunkWithTheLetterMisleads) {
    std::vector<char> bytes = test::wavBytes(1, 44100, 32, std::vector{0.5f, 0.75f});
    // "d" and three bytes more, a size of 4, then what is taken for the first sample.
    const std::string chunk("xxdxxx\4\0\0\0\0\0\200\77", 14);
    bytes.insert(bytes.begin() + 36, chunk.begin(), chunk.end());
    EXPECT_TRUE(readBytes(bytes, 1, 1));
    EXPECT_EQ(values_[0], 1.0f);
    EXPECT_FALSE(readBytes(bytes, 2, 1));
    EXPECT_EQ(essError, essErrorWavTooShort);
}

TEST_F(WavReader, WithoutTheLetterTheWalkEndsWithTheFile) {
    std::vector<char> bytes = test::wavBytes(1, 44100, 32, {});
    bytes.resize(36);
    bytes.resize(20036, 'e');
    EXPECT_FALSE(readBytes(bytes, 1, 1));
    expectErrorOnBothStreams("Tessaly_e ERROR: Wav with 0 is too short for 1 frames!",
                             essErrorWavTooShort);
    EXPECT_EQ(log_.count(LogStream::output, "not yet at"), 20000u);
}

TEST_F(WavReader, HeadersCutAnywhereAreRefused) {
    const std::vector<char> whole = test::wavBytes(1, 44100, 32, std::vector{0.5f});
    for (std::size_t length = 0; length < 44; ++length) {
        essError = essErrorNone;
        EXPECT_FALSE(readBytes({whole.begin(), whole.begin() + length}, 1, 1)) << length;
        EXPECT_EQ(essError, length < 24 ? essErrorWavChannels : essErrorWavTooShort) << length;
        EXPECT_THAT(values_, Each(untouched));
    }
}

TEST_F(WavReader, DataThatEndsBeforeItsSizeLeavesTheRestUntouched) {
    for (const int bits : {32, 16}) {
        std::vector<char> bytes =
            test::wavBytes(1, 44100, bits, std::vector<float>{0.5f, 0.25f, 0.125f});
        bytes.pop_back();
        EXPECT_TRUE(readBytes(bytes, 3, 1));
        EXPECT_THAT(values_, ElementsAre(0.5f, 0.25f, untouched, untouched, untouched)) << bits;
    }
}

// ---- Cost ----

/// Read calls of this process so far, as the system counts them; -1 where it does not.
long readCalls() {
    std::ifstream counters("/proc/self/io");
    std::string name;
    for (long value = 0; counters >> name >> value;) {
        if (name == "syscr:") {
            return value;
        }
    }
    return -1;
}

TEST_F(WavReader, FilesAreReadInLargeBlocks) {
    if (readCalls() < 0) {
        GTEST_SKIP() << "the system counts no calls";
    }
    const long counting = -readCalls() + readCalls();
    constexpr int frames = 100000;
    constexpr long header = 12;  // a seek and a read for each field
    const std::vector<float> samples(2 * frames, 0.25f);
    for (const int bits : {32, 16}) {
        for (const int rate : {44100, 48000}) {
            test::writeWav(directory_.file("/a.wav"), 2, rate, bits, samples);
            values_.assign(samples.size(), untouched);
            const long before = readCalls();
            ASSERT_TRUE(readWav(plain(), "/a.wav", values_.data(), frames, 2));
            const long calls = readCalls() - before - counting;
            const long bytes = 2L * frames * bits / 8;
            EXPECT_LE(calls, header + bytes / 8192 + 1) << bits << " bits, " << rate;
            EXPECT_GT(calls, 0);
        }
    }
}

// ---- Names ----

TEST_F(WavReader, NamesFollowTheMode) {
    struct Row {
        bool usePackedDatabase;
        bool loadingReverb;
        int sampleRate;
        const char* suffix;
    };
    constexpr Row rows[] = {
        {true, false, 48000, ""},           {false, false, 48000, ".wav"},
        {false, true, 48000, "_48000.wav"}, {false, true, 44100, "_44100.wav"},
        {false, true, 24000, "_24000.wav"},
    };
    for (const Row& row : rows) {
        test::writeWav(directory_.file(std::string("/name") + row.suffix), 1, 44100, 32,
                       std::vector{0.5f});
        WavSource source = plain();
        source.usePackedDatabase = row.usePackedDatabase;
        source.loadingReverb = row.loadingReverb;
        source.sampleRate = row.sampleRate;
        log_.clear();
        float value = 0.0f;
        EXPECT_TRUE(readWav(source, "/name", &value, 1, 1)) << row.suffix;
        EXPECT_EQ(value, 0.5f);
        EXPECT_EQ(log_.output(), "filePathIn = " + directory_.file("/name") + row.suffix + "\n");
        std::remove(directory_.file(std::string("/name") + row.suffix).c_str());
    }
}

TEST_F(WavReader, TailsOfOtherRatesHaveNoName) {
    WavSource source = plain();
    source.usePackedDatabase = false;
    source.loadingReverb = true;
    source.sampleRate = 96000;
    float value = untouched;
    EXPECT_FALSE(readWav(source, "/name", &value, 1, 1));
    EXPECT_EQ(essError, essErrorWavUnreadable);
    EXPECT_EQ(log_.outputLines().front(), "filePathIn = ");
    EXPECT_EQ(value, untouched);
}

// ---- Packed tails ----

class PackedTail : public WavReader {
protected:
    WavSource tail(int preset, int frames) const {
        WavSource source = plain();
        source.loadingReverb = true;
        source.IRfilePath = directory_.file("/TSLdata510.dat");
        source.qvReverb = static_cast<std::int16_t>(preset);
        source.reverbLength = frames;
        return source;
    }
    bool readTail(int preset, int frames) {
        values_.assign(static_cast<std::size_t>(std::max(frames, 0)) * 2 + 2, untouched);
        return readWav(tail(preset, frames), "/ignored", values_.data(), 1, 1);
    }
    /// The index of 60 entries, all `start`, and `frames` sample pairs 1, 2, 3 ...
    void writeTails(std::int32_t start, int frames) {
        std::vector<char> bytes(2);
        const auto append = [&bytes](const void* value) {
            const char* first = static_cast<const char*>(value);
            bytes.insert(bytes.end(), first, first + 4);
        };
        for (int n = 0; n < 60; ++n) {
            append(&start);
        }
        for (int n = 0; n < 2 * frames; ++n) {
            const float value = static_cast<float>(n + 1);
            append(&value);
        }
        test::writeFile(directory_.file("/TSLdata510.dat"), bytes);
    }
};

TEST_F(PackedTail, IsReadRawFromItsPlaceInTheFile) {
    test::writePackedTails(directory_.path(), 44100, {52, 15, 20});
    for (const int preset : {15, 20, 52}) {
        const int frames = test::testTailFrames(preset, 44100);
        ASSERT_TRUE(readTail(preset, frames));
        int unlike = 0;
        for (int n = 0; n < frames; ++n) {
            unlike += values_[2 * n] != test::testTailSample(preset, n, 0);
            unlike += values_[2 * n + 1] != test::testTailSample(preset, n, 1);
        }
        EXPECT_EQ(unlike, 0) << preset;
        EXPECT_EQ(values_[2 * frames], untouched);
    }
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_TRUE(log_.lines().empty());
}

TEST_F(PackedTail, IsNotInvertedAt48000) {
    test::writePackedTails(directory_.path(), 48000, {41});
    WavSource source = tail(41, 100);
    source.sampleRate = 48000;
    source.IRfilePath = directory_.file("/TSLdata511.dat");
    values_.assign(200, untouched);
    ASSERT_TRUE(readWav(source, "", values_.data(), 0, 0));
    EXPECT_EQ(values_[0], test::testTailSample(41, 0, 0));
    EXPECT_EQ(values_[199], test::testTailSample(41, 99, 1));
}

TEST_F(PackedTail, MissingFileNamesThePath) {
    EXPECT_FALSE(readTail(15, 4));
    EXPECT_THAT(values_, Each(untouched));
    expectErrorOnBothStreams(
        "Tessaly_e ERROR: Wav " + directory_.file("/TSLdata510.dat") + " not readable!!!!",
        essErrorTailUnreadable);
    EXPECT_EQ(log_.lines().size(), 2u);
}

TEST_F(PackedTail, AShortFileLeavesTheRestUntouched) {
    writeTails(1, 3);
    ASSERT_TRUE(readTail(15, 4));
    EXPECT_THAT(values_, ElementsAre(3.0f, 4.0f, 5.0f, 6.0f, untouched, untouched, untouched,
                                     untouched, untouched, untouched));
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(PackedTail, WhatTheFileDoesNotHoldMayBecomeZero) {
    const auto readZeroed = [&](int preset) {
        values_.assign(10, untouched);
        WavSource source = tail(preset, 4);
        source.zeroMissing = true;
        return readWav(source, "", values_.data(), 0, 0);
    };
    writeTails(1, 3);
    EXPECT_TRUE(readZeroed(15));
    EXPECT_THAT(values_,
                ElementsAre(3.0f, 4.0f, 5.0f, 6.0f, 0.0f, 0.0f, 0.0f, 0.0f, untouched, untouched));
    writeTails(1000, 3);
    EXPECT_TRUE(readZeroed(15));
    EXPECT_THAT(values_,
                ElementsAre(0.0f, 0.0f, 0.0f, 0.0f, 0.0f, 0.0f, 0.0f, 0.0f, untouched, untouched));
    std::remove(directory_.file("/TSLdata510.dat").c_str());
    EXPECT_FALSE(readZeroed(15));
    EXPECT_THAT(values_,
                ElementsAre(0.0f, 0.0f, 0.0f, 0.0f, 0.0f, 0.0f, 0.0f, 0.0f, untouched, untouched));
    EXPECT_EQ(essError, essErrorTailUnreadable);
}

TEST_F(PackedTail, IsReadAtOnce) {
    if (readCalls() < 0) {
        GTEST_SKIP() << "the system counts no calls";
    }
    const long counting = -readCalls() + readCalls();
    constexpr int frames = 50000;
    writeTails(0, frames);
    values_.assign(2 * frames, untouched);
    const long before = readCalls();
    ASSERT_TRUE(readWav(tail(15, frames), "", values_.data(), 0, 0));
    EXPECT_LE(readCalls() - before - counting, 4) << "index, samples and what the stream adds";
    EXPECT_EQ(values_.back(), 2.0f * frames);
}

TEST_F(PackedTail, StartsOutsideOfTheFileReadNothing) {
    for (const std::int32_t start :
         {-31, -1000, 4, 1000000, std::numeric_limits<std::int32_t>::max(),
          std::numeric_limits<std::int32_t>::min()}) {
        writeTails(start, 3);
        EXPECT_TRUE(readTail(60, 4)) << start;
        EXPECT_THAT(values_, Each(untouched)) << start;
    }
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(PackedTail, AStartInsideTheIndexReadsTheIndex) {
    writeTails(-1, 3);
    ASSERT_TRUE(readTail(15, 2));
    EXPECT_EQ(std::memcmp(values_.data(), "\377\377\377\377\377\377\377\377", 8), 0);
    EXPECT_EQ(values_[2], 1.0f);
    EXPECT_EQ(values_[3], 2.0f);
}

TEST_F(PackedTail, PresetsWithoutAnEntryReadNothing) {
    writeTails(0, 3);
    for (const int preset : {0, -5, -32768}) {
        EXPECT_TRUE(readTail(preset, 2)) << preset;
        EXPECT_THAT(values_, Each(untouched)) << preset;
    }
}

TEST_F(PackedTail, LengthsBelowOneReadNothing) {
    writeTails(0, 3);
    for (const int frames : {0, -1, std::numeric_limits<int>::min()}) {
        EXPECT_TRUE(readTail(15, frames)) << frames;
        EXPECT_THAT(values_, Each(untouched)) << frames;
    }
}

TEST_F(PackedTail, AnEmptyFileReadsNothing) {
    test::writeFile(directory_.file("/TSLdata510.dat"), {});
    EXPECT_TRUE(readTail(15, 2));
    EXPECT_THAT(values_, Each(untouched));
}

}  // namespace
}  // namespace tessaly
