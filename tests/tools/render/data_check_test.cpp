// Which data files a scene asks for.
#include "render/data_check.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <stdexcept>

namespace tessaly {
namespace {

using ::testing::HasSubstr;

class DataCheck : public ::testing::Test {
protected:
    void SetUp() override {
        folder = std::filesystem::path(::testing::TempDir()) / "data_check_test";
        std::filesystem::remove_all(folder);
        std::filesystem::create_directories(folder);
        put("TSLdata120.dat");
        put("TSLdata121.dat");
        scene.sources.emplace_back();
    }
    void TearDown() override { std::filesystem::remove_all(folder); }

    void put(const char* name) const { std::ofstream(folder / name) << "data"; }

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
    put("TSLdata122.dat");
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
    put("TSLdata511.dat");
    EXPECT_EQ(failure(), "");
}

TEST_F(DataCheck, HeadphonesNeedTheirFilter) {
    scene.sources[0].engine = DirectEngine{};
    EXPECT_EQ(failure(), "");
    scene.sources[0].engine->settings.qvHpTFcompSelect = 5;
    EXPECT_THAT(failure(), HasSubstr("no filter for headphone 5"));
    EXPECT_THAT(failure(), HasSubstr("FFIH03GL is missing"));
    put("FFIH03GL");
    EXPECT_EQ(failure(), "");
}

TEST_F(DataCheck, ADirectoryThatIsNotThereIsNamed) {
    std::filesystem::remove_all(folder);
    EXPECT_THAT(failure(), HasSubstr("no data directory " + folder.string()));
}

}  // namespace
}  // namespace tessaly
