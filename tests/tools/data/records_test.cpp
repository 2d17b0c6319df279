// Checksums, manifest, attribution, options.
#include <gtest/gtest.h>

#include "data/attribution.h"
#include "data/data_error.h"
#include "data/hrir_builder.h"
#include "data/hrir_options.h"
#include "data/manifest.h"
#include "data/sha256.h"

namespace tessaly::data {
namespace {

TEST(Sha256, PublishedExamples) {
    EXPECT_EQ(sha256(""), "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855");
    EXPECT_EQ(sha256("abc"), "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad");
    EXPECT_EQ(sha256("abcdbcdecdefdefgefghfghighijhijkijkljklmklmnlmnomnopnopq"),
              "248d6a61d20638b8e5c026930c3e6039a33ce45964ff2167f6ecedd419db06c1");
    EXPECT_EQ(sha256(std::string(1000000, 'a')),
              "cdc76e5c9914fb9281a1c7e284d73e67f1809a48a497200e046d39ccc7112cd0");
}

TEST(Manifest, TextReadsBack) {
    const std::vector<ManifestEntry> entries = {
        {"a.dat", 12, "aa", "some content", "/dir/x: y.sofa", "bb", "free", "dfeq=on"},
        {"b.dat", 0, "cc", "", "s", "dd", "terms", ""}};
    EXPECT_EQ(parseManifest(manifestText(entries)), entries);
    EXPECT_TRUE(parseManifest("anything else\nfile: a\n").empty());
    EXPECT_TRUE(parseManifest("").empty());
}

TEST(Manifest, LineBreaksInsideAValueCannotForgeEntries) {
    ManifestEntry entry;
    entry.file = "a.dat";
    entry.licence = "free\nfile: b.dat";
    EXPECT_EQ(parseManifest(manifestText({entry})).size(), 1u);
}

TEST(Manifest, MergeReplacesTheSameFileAndSorts) {
    ManifestEntry a;
    a.file = "a.dat";
    ManifestEntry b;
    b.file = "b.dat";
    b.size = 1;
    ManifestEntry newB = b;
    newB.size = 2;
    EXPECT_EQ(mergeManifest({b}, {newB, a}), (std::vector<ManifestEntry>{a, newB}));
}

TEST(Attribution, TextReadsBack) {
    const Attributions terms = {{"aa", "one\n\ntwo\n"}, {"bb", "three\n"}};
    EXPECT_EQ(parseAttributions(attributionText(terms)), terms);
}

TEST(Attribution, StanzaOfTheDefaultSourceIsCutOut) {
    const std::string text =
        "Files: *\nCopyright: someone\n\nFiles: share/MIT_KEMAR_normal_pinna.sofa\n"
        "License: mit-kemar\n provided free\n\nFiles: other\n";
    EXPECT_EQ(kemarStanza(text),
              "Files: share/MIT_KEMAR_normal_pinna.sofa\nLicense: mit-kemar\n provided free\n");
    EXPECT_EQ(kemarStanza("Files: other\n"), "");
    EXPECT_NE(kemarAttribution().find("Keith Martin"), std::string::npos);
    EXPECT_NE(kemarAttribution().find("provided the authors"), std::string::npos);
}

TEST(Options, TextReadsBack) {
    HrirOptions options;
    EXPECT_EQ(toText(options), "dfeq=on symmetry=auto taps=default gain=0 lowest=auto");
    EXPECT_EQ(hrirOptionsFromText(toText(options)), options);
    options = {false, Symmetry::off, 256, -1.25, -30.0};
    EXPECT_EQ(hrirOptionsFromText(toText(options)), options);
    EXPECT_EQ(hrirOptionsFromText(""), HrirOptions{});
    for (const char* bad : {"dfeq=maybe", "taps=many", "gain=1x", "symmetry=yes", "other=1"}) {
        EXPECT_THROW(hrirOptionsFromText(bad), DataError) << bad;
    }
}

TEST(Options, TheFirstRateIsAlwaysBuiltAndNoneTwice) {
    EXPECT_EQ(ratesToBuild({24000}), (std::vector<int>{44100, 24000}));
    EXPECT_EQ(ratesToBuild({24000, 48000, 24000, 44100}), (std::vector<int>{44100, 48000, 24000}));
    EXPECT_THROW(ratesToBuild({44100, 32000}), DataError);
    EXPECT_THROW(rateFromText("44100 "), DataError);
    EXPECT_EQ(rateFromText("48000"), 48000);
}

TEST(Options, TapsComeFromTheRateUnlessGiven) {
    EXPECT_EQ(tapsFor({}, 24000), 70u);
    EXPECT_EQ(tapsFor({}, 44100), 128u);
    EXPECT_EQ(tapsFor({}, 48000), 139u);
    HrirOptions options;
    options.taps = 256;
    EXPECT_EQ(tapsFor(options, 24000), 256u);
    options.taps = 257;
    EXPECT_THROW(tapsFor(options, 24000), DataError);
    options.taps = 31;
    EXPECT_THROW(tapsFor(options, 24000), DataError);
}

}  // namespace
}  // namespace tessaly::data
