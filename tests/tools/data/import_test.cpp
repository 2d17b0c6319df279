// SOFA structures and WAV lists, right and wrong.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <mysofa.h>

#include <array>
#include <fstream>
#include <iterator>
#include <sndfile.hh>

#include "data/data_error.h"
#include "data/import_sofa.h"
#include "data/import_wav_list.h"
#include "tools/data/scratch_directory.h"
#include "tools/data/synthetic_head.h"

namespace tessaly::data {
namespace {

using testing::AllOf;
using testing::HasSubstr;

template <typename Action>
std::string refusal(Action action) {
    try {
        action();
    } catch (const DataError& error) {
        return error.what();
    }
    return "";
}

/// A loaded file in memory: 3 directions, 2 receivers, 4 taps.
class SofaRecord {
public:
    SofaRecord() {
        file.M = 3;
        file.R = 2;
        file.N = 4;
        file.attributes = &convention;
        file.SourcePosition.values = positions.data();
        file.SourcePosition.elements = static_cast<unsigned>(positions.size());
        file.SourcePosition.attributes = &type;
        file.DataIR.values = samples.data();
        file.DataIR.elements = static_cast<unsigned>(samples.size());
        file.DataSamplingRate.values = &rate;
        file.DataSamplingRate.elements = 1;
        file.DataDelay.values = delays.data();
        file.DataDelay.elements = 2;
        for (std::size_t i = 0; i < samples.size(); ++i) {
            samples[i] = static_cast<float>(i);
        }
    }

    std::string refused() const {
        return refusal([this] { convertSofa(file, "x.sofa"); });
    }

    std::string conventionName = "SimpleFreeFieldHRIR";
    std::string conventionKey = "SOFAConventions";
    std::string typeName = "spherical";
    std::string typeKey = "Type";
    MYSOFA_ATTRIBUTE convention{nullptr, conventionKey.data(), conventionName.data()};
    MYSOFA_ATTRIBUTE type{nullptr, typeKey.data(), typeName.data()};
    std::array<float, 9> positions{0, 0, 1.4f, 90, 10, 1.4f, 270, -10, 1.4f};
    std::array<float, 24> samples{};
    std::array<float, 6> delays{2, 5, 0, 0, 0, 0};
    float rate = 48000.0f;
    MYSOFA_HRTF file{};
};

TEST(SofaImport, TakesSamplesDirectionsAndDelays) {
    SofaRecord record;
    const Measurement found = convertSofa(record.file, "x.sofa");
    ASSERT_EQ(found.count(), 3u);
    EXPECT_EQ(found.sampleRate, 48000.0);
    EXPECT_EQ(found.taps, 4u);
    EXPECT_EQ(found.directions[1].azimuth, 90.0);
    EXPECT_EQ(found.directions[2].elevation, -10.0);
    EXPECT_EQ(found.response(1, rightEar)[2], 14.0);
    for (const double seconds : found.extraSeconds) {
        EXPECT_DOUBLE_EQ(seconds, 3.0 / 48000.0);
    }
}

TEST(SofaImport, DelaysMayBeGivenForEachDirection) {
    SofaRecord record;
    record.file.DataDelay.elements = 6;
    const Measurement found = convertSofa(record.file, "x.sofa");
    EXPECT_DOUBLE_EQ(found.extraSeconds[0], 3.0 / 48000.0);
    EXPECT_EQ(found.extraSeconds[1], 0.0);
    record.file.DataDelay.elements = 4;
    EXPECT_THAT(record.refused(), HasSubstr("4 delays"));
}

TEST(SofaImport, CartesianPositionsBecomeDegrees) {
    SofaRecord record;
    record.typeName = "cartesian";
    record.type.value = record.typeName.data();
    record.positions = {1.4f, 0, 0, 0, 1.4f, 0, 0, 0, -1.4f};
    const Measurement found = convertSofa(record.file, "x.sofa");
    EXPECT_NEAR(found.directions[1].azimuth, 90.0, 1e-9);
    EXPECT_NEAR(found.directions[2].elevation, -90.0, 1e-9);
    record.typeName = "unheard-of";
    record.type.value = record.typeName.data();
    EXPECT_THAT(record.refused(), HasSubstr("\"unheard-of\""));
}

TEST(SofaImport, OfSeveralDistancesTheOneNearestTheUsualIsKept) {
    SofaRecord record;
    record.positions = {0, 0, 0.25f, 90, 10, 1.5f, 270, -10, 1.51f};
    const Measurement found = convertSofa(record.file, "x.sofa");
    ASSERT_EQ(found.count(), 2u);
    EXPECT_EQ(found.directions[0].azimuth, 90.0);
    EXPECT_EQ(found.response(0, leftEar)[0], 8.0);
    EXPECT_EQ(nearestDistanceGroup({1.0, 3.0, 1.02, 1.04, 3.01}),
              (std::vector<std::size_t>{0, 2, 3}));
}

TEST(SofaImport, OtherConventionsAndShapesAreNamed) {
    SofaRecord record;
    record.conventionName = "GeneralFIR";
    record.convention.value = record.conventionName.data();
    EXPECT_THAT(record.refused(),
                AllOf(HasSubstr("\"GeneralFIR\""), HasSubstr("expected \"SimpleFreeFieldHRIR\"")));
    SofaRecord mono;
    mono.file.R = 1;
    EXPECT_THAT(mono.refused(), HasSubstr("1 receivers, expected 2"));
    SofaRecord cut;
    cut.file.DataIR.elements = 20;
    EXPECT_THAT(cut.refused(), HasSubstr("20 samples"));
    SofaRecord flat;
    flat.file.SourcePosition.elements = 6;
    EXPECT_THAT(flat.refused(), HasSubstr("6 coordinates"));
    SofaRecord timeless;
    timeless.file.DataSamplingRate.elements = 0;
    EXPECT_THAT(timeless.refused(), HasSubstr("no sample rate"));
    SofaRecord empty;
    empty.file.attributes = nullptr;
    EXPECT_THAT(empty.refused(), HasSubstr("the convention \"\""));
}

class SofaFiles : public testing::Test {
protected:
    std::string refusedFile(const std::string& name, const std::string& bytes) {
        const std::filesystem::path path = scratch.path() / name;
        std::ofstream(path, std::ios::binary) << bytes;
        return refusal([&path] { importSofa(path); });
    }
    /// Empty if the package is not installed.
    static std::string packaged() {
        std::ifstream file(defaultSofaPath, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    }

    ScratchDirectory scratch;
};

TEST_F(SofaFiles, WhatIsNoSofaFileIsNamed) {
    EXPECT_THAT(refusedFile("a.sofa", "hello\n"), HasSubstr("found a text file"));
    EXPECT_THAT(refusedFile("b.sofa", "\x89PNG\r\n\x1a\n"), HasSubstr("found a PNG picture"));
    EXPECT_THAT(refusedFile("c.sofa", ""), HasSubstr("empty"));
    EXPECT_THAT(refusal([this] { importSofa(scratch.path()); }), HasSubstr("is not a file"));
    EXPECT_THAT(refusal([this] { importSofa(scratch.path() / "none"); }), HasSubstr("not found"));
}

TEST_F(SofaFiles, CutFilesAreRefusedWhereverTheyEnd) {
    const std::string whole = packaged();
    if (whole.empty()) {
        GTEST_SKIP() << defaultSofaPath << " is not installed";
    }
    for (const std::size_t bytes : {48u, 3000u, 200000u, 1000000u}) {
        EXPECT_THAT(refusedFile("cut.sofa", whole.substr(0, bytes)), HasSubstr("HDF5")) << bytes;
    }
}

TEST_F(SofaFiles, AnotherConventionInAFileIsNamed) {
    std::string bytes = packaged();
    if (bytes.empty()) {
        GTEST_SKIP() << defaultSofaPath << " is not installed";
    }
    const std::string convention = "SimpleFreeFieldHRIR";
    const std::size_t at = bytes.find(convention);
    ASSERT_NE(at, std::string::npos);
    bytes.replace(at, convention.size(), "SimpleFreeFieldHRSO");
    EXPECT_THAT(refusedFile("other.sofa", bytes), HasSubstr("\"SimpleFreeFieldHRSO\""));
}

TEST_F(SofaFiles, ThePackagedSetHasItsKnownShapeAndTerms) {
    if (packaged().empty()) {
        GTEST_SKIP() << defaultSofaPath << " is not installed";
    }
    Measurement kemar = importSofa(defaultSofaPath);
    EXPECT_EQ(kemar.provenance.sha256, kemarSha256);
    EXPECT_THAT(kemar.provenance.licence, HasSubstr("MIT Media Laboratory"));
    checkMeasurement(kemar);
    ASSERT_EQ(kemar.count(), 710u);
    EXPECT_EQ(kemar.taps, 512u);
    for (std::size_t i = 0; i < kemar.count(); ++i) {
        if (kemar.directions[i].azimuth != 90.0 || kemar.directions[i].elevation != 0.0) {
            continue;
        }
        double energy[earCount] = {};
        for (int ear = 0; ear < earCount; ++ear) {
            for (std::size_t n = 0; n < kemar.taps; ++n) {
                energy[ear] += kemar.response(i, ear)[n] * kemar.response(i, ear)[n];
            }
        }
        EXPECT_NEAR(energy[leftEar], 2.541, 0.0005);
        EXPECT_NEAR(energy[rightEar], 0.168, 0.0005);
        return;
    }
    FAIL() << "no direction at the left";
}

class WavList : public testing::Test {
protected:
    void writePair(const std::string& name,
                   int channels,
                   int rate,
                   std::size_t frames,
                   const double* left,
                   const double* right) {
        SndfileHandle file((scratch.path() / name).string(), SFM_WRITE,
                           SF_FORMAT_WAV | SF_FORMAT_DOUBLE, channels, rate);
        std::vector<double> samples;
        for (std::size_t i = 0; i < frames; ++i) {
            samples.push_back(left[i]);
            if (channels == 2) {
                samples.push_back(right[i]);
            }
        }
        file.write(samples.data(), static_cast<sf_count_t>(samples.size()));
    }
    void writeHead(const Measurement& head) {
        list = "# file azimuth elevation\n\n";
        for (std::size_t i = 0; i < head.count(); ++i) {
            const std::string name = std::to_string(i) + ".wav";
            writePair(name, 2, static_cast<int>(head.sampleRate), head.taps,
                      head.response(i, leftEar), head.response(i, rightEar));
            list += fmt::format("{} {} {}\n", name, head.directions[i].azimuth,
                                head.directions[i].elevation);
        }
    }
    std::filesystem::path listPath() {
        const std::filesystem::path path = scratch.path() / "list.txt";
        std::ofstream(path) << list;
        return path;
    }

    ScratchDirectory scratch;
    std::string list;
};

TEST_F(WavList, GivesTheSameSetAsItsSource) {
    const Measurement head = syntheticHead(30, -30);
    writeHead(head);
    const Measurement found = importWavList(listPath());
    EXPECT_EQ(found.count(), head.count());
    EXPECT_EQ(found.samples, head.samples);
    EXPECT_EQ(found.sampleRate, head.sampleRate);
    EXPECT_EQ(found.directions[9].azimuth, head.directions[9].azimuth);
    EXPECT_EQ(found.directions[13].elevation, head.directions[13].elevation);
    EXPECT_EQ(found.provenance.sha256.size(), 64u);
}

TEST_F(WavList, WrongFilesAndLinesAreNamedByLine) {
    const std::vector<double> impulse(32, 0.5);
    const double* samples = impulse.data();
    writePair("a.wav", 2, 44100, 32, samples, samples);
    writePair("mono.wav", 1, 44100, 32, samples, samples);
    writePair("rate.wav", 2, 48000, 32, samples, samples);
    writePair("short.wav", 2, 44100, 16, samples, samples);
    const struct {
        const char* line;
        const char* message;
    } cases[] = {{"a.wav 5", "expected: file azimuth elevation"},
                 {"a.wav five 0", "expected: file azimuth elevation"},
                 {"a.wav 5 0 1", "expected: file azimuth elevation"},
                 {"none.wav 5 0", "cannot be read as a sound file"},
                 {"mono.wav 5 0", "1 channels, expected 2"},
                 {"rate.wav 5 0", "48000 Hz"},
                 {"short.wav 5 0", "16 frames"}};
    for (const auto& bad : cases) {
        list = fmt::format("a.wav 0 0\n{}\n", bad.line);
        EXPECT_THAT(refusal([this] { importWavList(listPath()); }),
                    AllOf(HasSubstr("list.txt line 2"), HasSubstr(bad.message)))
            << bad.line;
    }
    EXPECT_THAT(refusal([this] { importWavList(scratch.path() / "no.txt"); }),
                HasSubstr("cannot be read"));
}

}  // namespace
}  // namespace tessaly::data
