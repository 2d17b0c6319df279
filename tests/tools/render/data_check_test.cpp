// Which data files a scene asks for.
#include "render/data_check.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <stdexcept>
#include <string>

#include "tools/render/data_files.h"

namespace tessaly {
namespace {

using ::testing::HasSubstr;

class DataCheck : public ::testing::Test {
protected:
    void SetUp() override {
        folder = std::filesystem::path(::testing::TempDir()) / "data_check_test";
        std::filesystem::remove_all(folder);
        std::filesystem::create_directories(folder);
        putResponses(folder / "TSLdata120.dat", 128);
        putResponses(folder / "TSLdata121.dat", 139);
        scene.sources.emplace_back();
    }
    void TearDown() override { std::filesystem::remove_all(folder); }

    // A word of the packed tails, little-endian: the start of a preset's tail in frames.
    void putStart(int preset, std::int32_t start) const {
        std::fstream file(folder / "TSLdata511.dat",
                          std::ios::binary | std::ios::in | std::ios::out);
        file.seekp(4 * preset - 2);
        for (int i = 0; i < 4; ++i) {
            file.put(static_cast<char>(static_cast<std::uint32_t>(start) >> (8 * i)));
        }
    }

    // A WAV header that names its bits a sample, and zeros.
    void putFilter(const char* name, int bits, std::uintmax_t bytes) const {
        putSized(folder / name, bytes);
        std::fstream file(folder / name, std::ios::binary | std::ios::in | std::ios::out);
        file << "RIFF";
        file.seekp(34);
        file.put(static_cast<char>(bits));
    }

    std::string failure() const {
        try {
            checkData(folder, scene);
        } catch (const std::runtime_error& missing) {
            return missing.what();
        }
        return "";
    }

    std::filesystem::path folder;
    Scene scene;
};

TEST_F(DataCheck, DryScenesNeedTheirRateAndTheProbe) {
    EXPECT_EQ(failure(), "");
    scene.sampleRate = 24000;
    EXPECT_THAT(failure(), HasSubstr("no data for 24000 Hz"));
    EXPECT_THAT(failure(), HasSubstr("TSLdata122.dat is missing"));
    putResponses(folder / "TSLdata122.dat", 70);
    EXPECT_EQ(failure(), "");
    std::filesystem::remove(folder / "TSLdata120.dat");
    EXPECT_THAT(failure(), HasSubstr("TSLdata120.dat is missing"));
}

TEST_F(DataCheck, RoomsNeedTailsWhereverTheyAreNamed) {
    scene.sources[0].room = 2;
    EXPECT_EQ(failure(), "") << "reflections only";
    scene.sources[0].room = 5;
    EXPECT_THAT(failure(), HasSubstr("no tail for room 5 (FamousConcerthall) at 48000 Hz"));
    EXPECT_THAT(failure(), HasSubstr("TSLdata511.dat is missing"));
    scene.sources[0].room = 0;
    scene.sources[0].parameters = {
        {"Room Selection", {{{0.0, 0.0}, {1.0, 20.0}}, Interpolation::Step}}};
    EXPECT_THAT(failure(), HasSubstr("no tail for room 20 (SmallRoomStone)"));
    scene.sources[0].parameters.clear();
    scene.returns.push_back({"hall", 1, 4, {}});
    EXPECT_THAT(failure(), HasSubstr("no tail for room 4 (ConcerthallFinnland)"));
    putTails(folder / "TSLdata511.dat");
    EXPECT_EQ(failure(), "");
}

TEST_F(DataCheck, HeadphonesNeedTheirFilter) {
    scene.sources[0].engine = DirectEngine{};
    EXPECT_EQ(failure(), "");
    scene.sources[0].engine->settings.qvHpTFcompSelect = 5;
    EXPECT_THAT(failure(), HasSubstr("no filter for headphone 5"));
    EXPECT_THAT(failure(), HasSubstr("FFIH03GL is missing"));
    putFilter("FFIH03GL", 32, 44 + 4 * 256);
    EXPECT_EQ(failure(), "");
    putFilter("FFIH03GL", 32, 44 + 4 * 256 - 1);
    EXPECT_THAT(failure(), HasSubstr("FFIH03GL is damaged: 1067 bytes, expected 1068 or more"));
    putFilter("FFIH03GL", 16, 44 + 2 * 256);
    EXPECT_EQ(failure(), "");
    for (const std::uintmax_t bytes : {0, 2000}) {
        putSized(folder / "FFIH03GL", bytes);
        EXPECT_THAT(failure(), HasSubstr("FFIH03GL is damaged: ")) << bytes;
        EXPECT_THAT(failure(), HasSubstr("no WAV header")) << bytes;
    }
}

TEST_F(DataCheck, ResponsesOfTheWrongSizeAreDamaged) {
    const std::filesystem::path file = folder / "TSLdata121.dat";
    for (const std::uintmax_t bytes :
         {std::uintmax_t{0}, std::uintmax_t{2804507}, std::uintmax_t{2804509}}) {
        putSized(file, bytes);
        EXPECT_EQ(failure(), file.string() + " is damaged: " + std::to_string(bytes) +
                                 " bytes, expected 2804508");
    }
    putResponses(file, 128);
    EXPECT_THAT(failure(), HasSubstr("is damaged")) << "the length of another rate";
    scene.sampleRate = 44100;
    EXPECT_EQ(failure(), "");
    scene.sampleRate = 48000;
    scene.sources[0].engine = DirectEngine{};
    scene.sources[0].engine->settings.qvUse256HRIR = 1;
    EXPECT_THAT(failure(), HasSubstr("expected 5165100"));
}

TEST_F(DataCheck, LongResponsesAreForEnginesThatAskForThem) {
    const std::filesystem::path file = folder / "TSLdata121.dat";
    putResponses(file, 256);
    const std::string refusal = file.string() +
                                " holds responses of 256 frames: only sources with the engine "
                                "setting use256HRIR can use it";
    EXPECT_EQ(failure(), refusal);
    scene.sources[0].name = "bird";
    scene.sources[0].engine = DirectEngine{};
    EXPECT_EQ(failure(), refusal);
    scene.sources[0].engine->settings.qvUse256HRIR = 1;
    EXPECT_EQ(failure(), "");
    scene.returns.push_back({"hall", 1, 0, {}});
    EXPECT_EQ(failure(), refusal) << "a return plays through the library";
    scene.returns.clear();
    putResponses(file, 139);
    EXPECT_THAT(failure(), HasSubstr("source \"bird\" needs responses of 256 frames: make a set "
                                     "with tessaly-data all --taps 256"));
}

TEST_F(DataCheck, QualityStepsAskForLongResponsesAsTheEngineReadsThem) {
    for (const bool wanted : {false, true}) {
        for (const int step : {-1, 0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 1000}) {
            DirectEngine engine;
            engine.settings.sampleRate = 48000;
            engine.settings.qvUse256HRIR = wanted ? 1 : 0;
            engine.qualityValue = static_cast<std::int16_t>(step);
            EffectiveSettings effective;
            std::int16_t angleStep = 5;
            setQualitySettings(engine.settings, engine.qualityValue, effective, angleStep, 0, 512,
                               1);
            EXPECT_EQ(usesLongResponses(engine), effective.qvUse256HRIR) << step;
        }
    }
}

TEST_F(DataCheck, TailsMustLieInTheirFile) {
    const std::filesystem::path file = folder / "TSLdata511.dat";
    scene.sources[0].room = 5;  // preset 16, 74339 or 74340 frames
    for (const std::uintmax_t bytes : {0, 241}) {
        putSized(file, bytes);
        EXPECT_EQ(failure(), file.string() + " is damaged: " + std::to_string(bytes) +
                                 " bytes, expected more than 242");
    }
    putSized(file, 242 + 8 * 74338);
    EXPECT_THAT(failure(), HasSubstr("is damaged: 594946 bytes, expected 5949"));
    EXPECT_THAT(failure(), HasSubstr("for the tail of room 5 (FamousConcerthall)"));
    putSized(file, 242 + 8 * 74340);
    EXPECT_EQ(failure(), "");
    putStart(16, 2);
    EXPECT_THAT(failure(), HasSubstr("is damaged")) << "it ends behind the file";
    putStart(16, 0);
    putStart(17, 70000);
    EXPECT_EQ(failure(), "") << "a tail that is not used";
    for (const std::int32_t start : {-1, 74341, 2147483647}) {
        putStart(16, start);
        EXPECT_THAT(failure(), HasSubstr("starts at frame " + std::to_string(start)));
    }
}

TEST_F(DataCheck, ADirectoryThatIsNotThereIsNamed) {
    std::filesystem::remove_all(folder);
    EXPECT_THAT(failure(), HasSubstr("no data directory " + folder.string()));
}

}  // namespace
}  // namespace tessaly
