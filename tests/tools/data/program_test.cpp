// The program as a user runs it: exit codes, messages, what it leaves behind.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <sndfile.hh>

#include "data/import_sofa.h"
#include "data/sha256.h"
#include "data/wave_image.h"
#include "tools/data/program_fixture.h"
#include "tools/data/synthetic_head.h"

namespace tessaly::data {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;

class HrirProgram : public Program {
protected:
    void writeHead(const Measurement& head) {
        std::ofstream list(scratch.path() / "list.txt");
        for (std::size_t i = 0; i < head.count(); ++i) {
            const std::string name = fmt::format("{}.wav", i);
            SndfileHandle file((scratch.path() / name).string(), SFM_WRITE,
                               SF_FORMAT_WAV | SF_FORMAT_FLOAT, 2, 44100);
            std::vector<double> pairs;
            for (std::size_t n = 0; n < head.taps; ++n) {
                pairs.push_back(head.response(i, leftEar)[n]);
                pairs.push_back(head.response(i, rightEar)[n]);
            }
            file.writef(pairs.data(), static_cast<sf_count_t>(head.taps));
            list << name << ' ' << head.directions[i].azimuth << ' ' << head.directions[i].elevation
                 << '\n';
        }
    }
};

TEST_F(Program, FilesThatAreNoSofaSetLeaveNothing) {
    std::ofstream(scratch.path() / "text.sofa") << "azimuth elevation\n";
    std::ofstream(scratch.path() / "picture.sofa") << "\x89PNG\r\n\x1a\n";
    std::ofstream(scratch.path() / "damaged.sofa") << "\x89HDF\r\n\x1a\n" << std::string(90, 'x');
    expectRefusal("hrir --sofa text.sofa --out out", "found a text file; expected");
    expectRefusal("hrir --sofa picture.sofa --out out", "found a PNG picture; expected");
    expectRefusal("hrir --sofa damaged.sofa --out out", "found an HDF5 file, damaged");
    expectRefusal("hrir --sofa none.sofa --out out", "none.sofa not found");
    expectRefusal("hrir --wav-list none.txt --out out", "none.txt cannot be read");
}

TEST_F(Program, WrongOptionsLeaveNothing) {
    expectRefusal("hrir --out out --rates 44100,32000", "unknown rate \"32000\", expected 44100");
    expectRefusal("hrir --out out --rates fast", "unknown rate \"fast\"");
    expectRefusal("hrir --out out --symmetry perhaps", "expected auto, on or off");
    expectRefusal("hrir --out out --taps 1000", "1000 taps, expected 32 to 256");
    expectRefusal("hrir --out out --gain nan", "gain is nan dB");
}

TEST_F(Program, UsageErrorsAreOneLine) {
    for (const auto& [arguments, says] :
         {std::pair("", "subcommand is required"),
          std::pair("biuld --out out", "unknown subcommand \"biuld\": all, hrir, tails"),
          std::pair("--unheard-of", "unknown option \"--unheard-of\""),
          std::pair("hrir", "--out is required"),
          std::pair("hrir --out out --unheard-of", "--unheard-of"),
          std::pair("hrir --out out --taps many", "many")}) {
        const Outcome outcome = run(arguments);
        EXPECT_EQ(outcome.code, 2) << arguments;
        EXPECT_EQ(outcome.output, "");
        EXPECT_THAT(outcome.errors, AllOf(testing::StartsWith("tessaly-data: "), HasSubstr(says)));
        EXPECT_EQ(std::count(outcome.errors.begin(), outcome.errors.end(), '\n'), 1)
            << outcome.errors;
        EXPECT_FALSE(fs::exists(scratch.path() / "out")) << arguments;
    }
    for (const char* asked : {"--help", "--version", "hrir --help"}) {
        const Outcome outcome = run(asked);
        EXPECT_EQ(outcome.code, 0) << asked;
        EXPECT_NE(outcome.output, "") << asked;
        EXPECT_EQ(outcome.errors, "") << asked;
    }
}

TEST_F(Program, PlacesThatCannotBeWrittenToAreNamed) {
    std::ofstream(scratch.path() / "file") << "x";
    expectRefusal("hrir --out file", "file is no directory");
    expectRefusal("hrir --out file/below", "file/below is no directory");
    EXPECT_EQ(readIfPresent(scratch.path() / "file"), "x");
}

TEST_F(HrirProgram, SwappedEarsAndMirroredAzimuthLeaveNothing) {
    Measurement head = syntheticHead(30, -60);
    for (int step = 1; head.count() < 100 && step < 4; ++step) {
        head = syntheticHead(30 - 5 * step, -60);
    }
    Measurement swapped = head;
    swapEars(swapped);
    writeHead(swapped);
    expectRefusal("hrir --wav-list list.txt --out out", "list.txt: ears swapped or azimuth");
    for (Direction& direction : head.directions) {
        direction.azimuth = -direction.azimuth;
    }
    writeHead(head);
    expectRefusal("hrir --wav-list list.txt --out out", "expected the left ear first and louder");
}

TEST_F(HrirProgram, TooFewDirectionsLeaveNothing) {
    writeHead(syntheticHead(45, -45));
    expectRefusal("hrir --wav-list list.txt --out out", "found 25, expected 100");
}

TEST_F(HrirProgram, WavListsBecomeASetThatVerifies) {
    writeHead(syntheticHead());
    const Outcome built = run("hrir --wav-list list.txt --out out --rates 24000 --taps 64");
    EXPECT_EQ(built.code, 0) << built.errors;
    EXPECT_EQ(built.errors, "") << "progress is for terminals";
    EXPECT_THAT(built.output, HasSubstr("44100 Hz was built too"));
    EXPECT_TRUE(fs::exists(scratch.path() / "out" / "TSLdata120.dat"));
    EXPECT_FALSE(fs::exists(scratch.path() / "out" / "TSLdata121.dat"));
    EXPECT_EQ(fs::file_size(scratch.path() / "out" / "TSLdata122.dat"), 44u + 2522u * 64u * 8u);
    const Outcome verified = run("verify out");
    EXPECT_EQ(verified.code, 0) << verified.output << verified.errors;
    EXPECT_THAT(verified.output, HasSubstr("difference to the measurement"));
}

TEST_F(Program, VerifyNeedsASet) {
    fs::create_directory(scratch.path() / "empty");
    Outcome outcome = run("verify empty");
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(outcome.errors, HasSubstr("no HRIR file in empty; expected TSLdata120.dat"));
    outcome = run("verify none");
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(outcome.errors, HasSubstr("none is no directory"));
}

TEST_F(BuiltData, HasTheSizesOfTheEnginesFiles) {
    const fs::path data = TESSALY_TEST_DATA;
    EXPECT_EQ(fs::file_size(data / "TSLdata120.dat"), 2582572u);
    EXPECT_EQ(fs::file_size(data / "TSLdata121.dat"), 2804508u);
    EXPECT_EQ(fs::file_size(data / "TSLdata122.dat"), 1412364u);
    EXPECT_THAT(readIfPresent(data / attributionName), HasSubstr("Keith Martin"));
    for (const ManifestEntry& entry : parseManifest(readIfPresent(data / manifestName))) {
        EXPECT_EQ(entry.sha256, sha256OfFile(data / entry.file));
        EXPECT_EQ(entry.size, fs::file_size(data / entry.file));
        if (entry.file.rfind("TSLdata12", 0) != 0) {
            continue;
        }
        EXPECT_EQ(entry.sourceSha256, kemarSha256);
        EXPECT_EQ(entry.options, "dfeq=on symmetry=auto taps=default gain=0 lowest=auto");
    }
}

TEST_F(BuiltData, ASecondBuildGivesTheSameBytes) {
    const Outcome built = run("hrir --out out --rates 44100");
    ASSERT_EQ(built.code, 0) << built.errors;
    EXPECT_EQ(sha256OfFile(scratch.path() / "out" / "TSLdata120.dat"),
              sha256OfFile(fs::path(TESSALY_TEST_DATA) / "TSLdata120.dat"));
}

TEST_F(BuiltData, VerifyAcceptsItAtAllRates) {
    const Outcome outcome = run(fmt::format("verify '{}'", TESSALY_TEST_DATA));
    EXPECT_EQ(outcome.code, 0) << outcome.output << outcome.errors;
    EXPECT_EQ(outcome.errors, "");
    EXPECT_THAT(outcome.output,
                AllOf(HasSubstr("44100/128"), HasSubstr("48000/139"), HasSubstr("24000/70"),
                      HasSubstr("difference to the measurement, narrow"),
                      HasSubstr("all figures are within their limits"), Not(HasSubstr("FAILED"))));
}

TEST_F(BuiltData, VerifyReportsAMissingFirstFileAndWrongChecksums) {
    copySet({"TSLdata122.dat", manifestName});
    std::fstream file(scratch.path() / "set" / "TSLdata122.dat",
                      std::ios::binary | std::ios::in | std::ios::out);
    file.seekp(1000000);
    file.put('\x01');
    file.close();
    const Outcome outcome = run("verify set");
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(outcome.output, AllOf(HasSubstr("FAILED TSLdata122.dat: size 1412364"),
                                      HasSubstr("FAILED TSLdata120.dat is missing")));
}

TEST_F(BuiltData, VerifyReportsAnotherGainWithoutAManifestToo) {
    copySet({"TSLdata120.dat"});
    const fs::path path = scratch.path() / "set" / "TSLdata120.dat";
    const std::string bytes = readIfPresent(path);
    std::vector<float> samples((bytes.size() - waveHeaderBytes) / sizeof(float));
    std::memcpy(samples.data(), bytes.data() + waveHeaderBytes, bytes.size() - waveHeaderBytes);
    for (float& sample : samples) {
        sample *= 1.06f;
    }
    std::ofstream(path, std::ios::binary) << waveImage(samples, 2, 44100);
    const Outcome outcome = run("verify set");
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(outcome.output, AllOf(HasSubstr("FAILED 44100/128: frontal: sum of squares"),
                                      HasSubstr("no MANIFEST.txt")));
}

TEST_F(BuiltData, VerifyRefusesCutFiles) {
    copySet({"TSLdata120.dat"});
    fs::resize_file(scratch.path() / "set" / "TSLdata120.dat", 2000000);
    const Outcome outcome = run("verify set");
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(outcome.errors, HasSubstr("has 2000000 bytes, expected 2582572"));
}

}  // namespace
}  // namespace tessaly::data
