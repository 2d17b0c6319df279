// The packed tail file: layout, and what the engine's reader and strict checks make of it.
#include "data/packed_tails.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <fstream>

#include "data/data_error.h"
#include "data/measurement.h"
#include "data/output_directory.h"
#include "tools/data/scratch_directory.h"

namespace tessaly::data {
namespace {

using testing::HasSubstr;

/// Tails whose samples tell preset and place.
std::vector<std::vector<float>> numberedTails(int sampleRate) {
    std::vector<std::vector<float>> tails;
    for (const TailDesign& design : tailDesigns()) {
        std::vector<float>& tail =
            tails.emplace_back(storedTailFrames(design, sampleRate) * earCount);
        for (std::size_t i = 0; i < tail.size(); ++i) {
            tail[i] = static_cast<float>(design.preset) + 1e-6f * static_cast<float>(i % 1000);
        }
    }
    return tails;
}

std::int32_t indexAt(const std::string& bytes, int preset) {
    std::int32_t value = 0;
    std::memcpy(&value, bytes.data() + 2 + 4 * (preset - 1), sizeof(value));
    return value;
}

class PackedTails : public testing::Test {
protected:
    void write(int sampleRate, const std::string& bytes) {
        std::ofstream(scratch.path() / tailFileName(sampleRate), std::ios::binary) << bytes;
    }
    std::string refusal(int sampleRate) {
        try {
            readPackedTails(scratch.path(), sampleRate);
        } catch (const DataError& error) {
            return error.what();
        }
        return "";
    }
    ScratchDirectory scratch;
};

TEST_F(PackedTails, HaveTheSizesAndStartsOfTheEnginesFiles) {
    const std::string bytes = packTails(numberedTails(48000));
    EXPECT_EQ(bytes.size(), 25553338u);
    EXPECT_EQ(packTails(numberedTails(44100)).size(), 23477306u);
    EXPECT_EQ(packTails(numberedTails(24000)).size(), 12776874u);
    for (int preset = 1; preset <= 15; ++preset) {
        EXPECT_EQ(indexAt(bytes, preset), 0) << preset;
    }
    EXPECT_EQ(indexAt(bytes, 16), 23147);
    EXPECT_EQ(indexAt(bytes, 17), 23147 + 74340);
    float left = 0.0f;
    std::memcpy(&left, bytes.data() + 242 + 8 * 23147, sizeof(left));
    EXPECT_EQ(left, 16.0f);
}

TEST_F(PackedTails, TheEnginesReaderGivesEverySampleBack) {
    for (const int rate : {24000, 44100, 48000}) {
        const std::vector<std::vector<float>> tails = numberedTails(rate);
        write(rate, packTails(tails));
        EXPECT_EQ(readPackedTails(scratch.path(), rate), tails) << rate;
    }
}

TEST_F(PackedTails, WrongSizesStartsAndNamesAreRefused) {
    EXPECT_THAT(refusal(24000), HasSubstr("TSLdata512.dat is missing or empty"));
    std::string bytes = packTails(numberedTails(24000));
    write(24000, bytes.substr(0, bytes.size() - 8));
    EXPECT_THAT(refusal(24000), HasSubstr("has 12776866 bytes, expected 12776874"));
    bytes[2 + 4 * 40] = static_cast<char>(bytes[2 + 4 * 40] + 1);
    write(24000, bytes);
    EXPECT_THAT(refusal(24000), HasSubstr("the tail of preset 41 starts at frame"));
    EXPECT_THROW(tailFileName(22050), DataError);
}

}  // namespace
}  // namespace tessaly::data
