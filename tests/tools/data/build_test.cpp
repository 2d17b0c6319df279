// Everything that one command builds: files, records, determinism, imports, checks, refusals.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <fstream>

#include "data/headphone_table.h"
#include "data/library_reader.h"
#include "data/packed_tails.h"
#include "data/sha256.h"
#include "data/tail_builder.h"
#include "data/wave_image.h"
#include "support/test_data.h"
#include "tools/data/program_fixture.h"

namespace tessaly::data {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;

TEST_F(BuiltData, HasTailsAndHeadphoneFiltersOfTheirSizes) {
    const fs::path data = TESSALY_TEST_DATA;
    EXPECT_EQ(fs::file_size(data / "TSLdata510.dat"), 23477306u);
    EXPECT_EQ(fs::file_size(data / "TSLdata511.dat"), 25553338u);
    EXPECT_EQ(fs::file_size(data / "TSLdata512.dat"), 12776874u);
    for (const HeadphoneRow& row : headphoneTable()) {
        EXPECT_EQ(fs::file_size(data / row.file), 1068u) << row.file;
    }
    EXPECT_EQ(fs::file_size(data / smallFilterName), 1068u);
    EXPECT_THAT(readIfPresent(data / attributionName),
                AllOf(HasSubstr("Keith Martin"), HasSubstr("AutoEq"), HasSubstr("MIT License")));
    int parts = 0;
    int files = 0;
    for (const ManifestEntry& entry : parseManifest(readIfPresent(data / manifestName))) {
        ++files;
        for (const std::string& part : entry.parts) {
            EXPECT_EQ(tailOriginFromText(part).file, "") << part;
            ++parts;
        }
    }
    EXPECT_EQ(files, 3 + 3 + 11);
    EXPECT_EQ(parts, 3 * 46);
}

TEST_F(BuiltData, TailsAreMadeAgainBitForBit) {
    const std::vector<int> rates = {44100, 48000, 24000};
    const HrirSet set = readPackedSet(TESSALY_TEST_DATA, rateEntry(48000));
    const double direct = directEnergy(set);
    for (std::size_t r = 0; r < rates.size(); ++r) {
        const std::vector<std::vector<float>> stored = readPackedTails(TESSALY_TEST_DATA, rates[r]);
        for (const int preset : {20, 41, 53}) {
            const BuiltTail again =
                buildTail(tailDesign(preset), set, direct, TailOptions{}, nullptr, rates);
            EXPECT_EQ(again.stored[r], stored[static_cast<std::size_t>(preset - 15)])
                << preset << " at " << rates[r];
        }
    }
}

TEST_F(BuiltData, HeadphoneFiltersAreMadeAgainBitForBitAndJoinTheManifest) {
    ASSERT_EQ(run("headphones --out out --hp-flat-bass").code, 0);
    const fs::path out = scratch.path() / "out";
    EXPECT_NE(sha256OfFile(out / "FFIH03GL"),
              sha256OfFile(fs::path(TESSALY_TEST_DATA) / "FFIH03GL"));
    ASSERT_EQ(run("headphones --out out").code, 0);
    for (const HeadphoneRow& row : headphoneTable()) {
        EXPECT_EQ(sha256OfFile(out / row.file),
                  sha256OfFile(fs::path(TESSALY_TEST_DATA) / row.file));
    }
    EXPECT_EQ(parseManifest(readIfPresent(out / manifestName)).size(), 11u);
    const Outcome verified = run("verify out");
    EXPECT_EQ(verified.code, 1);
    EXPECT_THAT(verified.output, AllOf(HasSubstr("FAILED TSLdata120.dat is missing"),
                                       HasSubstr("FFIH03GL: error from 200 Hz up"),
                                       Not(HasSubstr("FAILED FFIH03GL"))));
}

TEST_F(BuiltData, VerifyFindsTailsAndFiltersThatWereTamperedWith) {
    copySet({"TSLdata122.dat", "TSLdata512.dat"});
    const fs::path set = scratch.path() / "set";
    for (const HeadphoneRow& row : headphoneTable()) {
        fs::copy_file(fs::path(TESSALY_TEST_DATA) / row.file, set / row.file);
    }
    std::vector<std::vector<float>> tails = readPackedTails(set, 24000);
    std::vector<float>& louder = tails[53 - 15];
    for (float& sample : louder) {
        sample *= 1.02f;  // 0.17 dB
    }
    tails[41 - 15][1] = 1e-6f;  // before the start
    std::ofstream(set / "TSLdata512.dat", std::ios::binary) << packTails(tails);
    std::vector<float> taps(256, 0.0f);
    taps[0] = 3.0f;
    std::ofstream(set / "FFIH03GL", std::ios::binary) << waveImage(taps, 1, 48000);

    const Outcome outcome = run("verify set");
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(
        outcome.output,
        AllOf(HasSubstr("FAILED TSLdata512.dat preset 53 SmallRoom: direct to tail less the rule"),
              HasSubstr("FAILED TSLdata512.dat preset 41 SpaceshipCabine: sounding samples before"),
              HasSubstr("FAILED headphones: FFIH03GL: error from 200 Hz up"),
              HasSubstr("FAILED IP23M3_512_FadeOut is missing"),
              Not(HasSubstr("FAILED TSLdata512.dat preset 15")),
              Not(HasSubstr("FAILED headphones: IPALLI_16"))));

    std::ofstream(set / "FFIH03GL", std::ios::binary) << waveImage(taps, 2, 48000);
    const Outcome refused = run("verify set");
    EXPECT_EQ(refused.code, 1);
    EXPECT_THAT(refused.errors, HasSubstr("FFIH03GL has 128 frames of 2 channels"));
}

TEST_F(BuiltData, ImportsReplaceSingleTailsAndFiltersAndTheResultVerifies) {
    fs::create_directory(scratch.path() / "measured");
    std::vector<float> pairs(2 * 30000);
    for (std::size_t i = 0; i < 30000; i += 37) {
        pairs[2 * i] = i % 2 == 0 ? 0.1f : -0.1f;
        pairs[2 * i + 1] = i % 3 == 0 ? 0.1f : -0.1f;
    }
    test::writeWav((scratch.path() / "measured" / "preset_53.wav").string(), 2, 32000, 16, pairs);
    std::ofstream(scratch.path() / "measured" / "tails.ini")
        << "[preset_53]\ngain_db = 2\nlicence = CC0\nsource = our cellar\n";
    std::ofstream(scratch.path() / "eq.txt") << "Filter 1: ON PK Fc 2000 Hz Gain 6.0 dB Q 2\n";
    const Outcome built =
        run("all --out out --rates 24000 --wet -1 --tails measured --hp-filter 3=eq.txt --hp-rate "
            "44100");
    ASSERT_EQ(built.code, 0) << built.errors;
    EXPECT_EQ(built.errors, "") << "progress is for terminals";
    EXPECT_THAT(built.output, HasSubstr("24000 Hz, 46 tails, 1 of them measured"));
    EXPECT_FALSE(fs::exists(scratch.path() / "out" / "TSLdata510.dat"));
    const std::string manifest = readIfPresent(scratch.path() / "out" / manifestName);
    EXPECT_THAT(manifest, AllOf(HasSubstr("part: 53 SmallRoom: measured; preset_53.wav; "),
                                HasSubstr("licence CC0; source our cellar"),
                                HasSubstr("part: 52 CarB: synthetic; gain "),
                                HasSubstr("options: rate=44100 flat-bass=off imported parametric"),
                                HasSubstr("options: level=rule wet=-1")));
    EXPECT_THAT(readIfPresent(scratch.path() / "out" / attributionName),
                AllOf(HasSubstr("our cellar"), HasSubstr("eq.txt, imported")));
    const Outcome verified = run("verify out");
    EXPECT_EQ(verified.code, 0) << verified.output << verified.errors;
    EXPECT_THAT(verified.output, HasSubstr("  measured\n"));
}

TEST_F(Program, BadTailsLeaveNothing) {
    fs::create_directory(scratch.path() / "measured");
    const auto write = [this](const char* name, int channels, int rate, std::size_t samples) {
        test::writeWav((scratch.path() / "measured" / name).string(), channels, rate, 32,
                       std::vector<float>(samples, 0.5f));
    };
    expectRefusal("all --out out --tails measured", "no measured tail in measured");
    expectRefusal("tails --out out --tails none", "none is no directory");
    write("preset_20.wav", 1, 48000, 10000);
    expectRefusal("all --out out --tails measured", "preset_20.wav has 1 channel, expected 2");
    write("preset_20.wav", 2, 22050, 10000);
    expectRefusal("tails --out out --tails measured", "22050 Hz, expected 24000 Hz or more");
    std::ofstream(scratch.path() / "measured" / "preset_20.wav").close();
    expectRefusal("tails --out out --tails measured", "preset_20.wav is empty");
    fs::remove(scratch.path() / "measured" / "preset_20.wav");
    write("preset_14.wav", 2, 48000, 10000);
    expectRefusal("tails --out out --tails measured", "preset 14 has no tail, expected 15 to 60");
}

TEST_F(Program, BadChoicesOfTailsAndFiltersLeaveNothing) {
    expectRefusal("all --out out --level loud", "level is \"loud\", expected rule or peak");
    expectRefusal("tails --out out --wet nan", "level of the tails is nan dB");
    expectRefusal("tails --out out --rates 22050", "unknown rate \"22050\"");
    expectRefusal("headphones --out out --hp-rate 96000", "unknown rate \"96000\"");
    expectRefusal("headphones --out out --hp-filter 12=x.txt", "row 12 is unknown");
    expectRefusal("headphones --out out --hp-filter 3=x.txt", "x.txt is missing or empty");
    std::ofstream(scratch.path() / "x.txt") << "loud\n";
    expectRefusal("headphones --out out --hp-filter 3=x.txt", "x.txt line 1: found \"loud\"");
}

TEST_F(Program, PlacesThatTakeNoFilesAreNamed) {
    expectRefusal("headphones --out /proc/tessaly", "/proc/tessaly is no directory");
    EXPECT_FALSE(fs::exists("/proc/tessaly"));
}

TEST_F(Program, AFullDiskLeavesWhatWasThere) {
    if (!fs::exists("/usr/share/libmysofa/MIT_KEMAR_normal_pinna.sofa")) {
        GTEST_SKIP() << "the default set is not installed";
    }
    fs::create_directory(scratch.path() / "old");
    std::ofstream(scratch.path() / "old" / "FFIH03GL") << "old";
    // A limit on the size of files fails like a full disk, in the middle of a file.
    const Outcome outcome = run("headphones --out old", "ulimit -f 1; trap '' XFSZ;");
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(outcome.errors, HasSubstr("tessaly-data: cannot write into old: File too large"));
    EXPECT_EQ(readIfPresent(scratch.path() / "old" / "FFIH03GL"), "old");
    int entries = 0;
    for ([[maybe_unused]] const auto& entry : fs::directory_iterator(scratch.path() / "old")) {
        ++entries;
    }
    EXPECT_EQ(entries, 1);
}

}  // namespace
}  // namespace tessaly::data
