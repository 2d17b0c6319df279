// What rooms tell where trace lines join the output log.
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "engine/room_geometry.h"
#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

class RoomTrace : public EngineFixture {
protected:
    RoomTrace() { writePackedHrirSet(directory.path(), 44100); }

    /// An engine of room 15: walls at 2.8, 1.8, 3.2, 2.1, 2.5 and 3 metres.
    std::unique_ptr<EngineRig> rigAmongWalls() {
        auto rig = std::make_unique<EngineRig>(directory.path(), 44100, 256);
        rig->settings.earlyFlexRefPreset = 15;
        rig->settings.auralisation = 1;
        rig->build();
        log.clear();
        return rig;
    }
    /// The lines of walls after a block with the source there.
    std::vector<std::string> wallsPassed(EngineRig& rig, int azimuth, int elevation, float metres) {
        rig.azimuth = static_cast<std::int16_t>(azimuth);
        rig.elevation = static_cast<std::int16_t>(elevation);
        rig.distance = metres;
        log.clear();
        rig.run();
        std::vector<std::string> found;
        for (const std::string& line : log.outputLines()) {
            if (line.starts_with("Ref ")) {
                found.push_back(line);
            }
        }
        return found;
    }

    TempDirectory directory;
    LogCapture log;
};

TEST_F(RoomTrace, ASourceAtAWallSaysWhichAndTheFrontInItsOwnWords) {
    const auto rig = rigAmongWalls();
    const std::string other = " out of RoomWall  ReflectionDistance set to 1000000!";
    EXPECT_EQ(wallsPassed(*rig, 0, 0, 1.0f), std::vector<std::string>{});
    EXPECT_EQ(wallsPassed(*rig, 0, 0, 3.5f),
              std::vector<std::string>{
                  "Ref 2 cosDistance = 3.5 out of Room, ReflectionDistance set to 1000000!"});
    EXPECT_EQ(wallsPassed(*rig, 180, 0, 2.5f),
              std::vector<std::string>{"Ref 3 cosDistance = -2.5" + other});
    // The engine's azimuth is the negated one of the host.
    EXPECT_EQ(wallsPassed(*rig, -90, 0, 2.75f),
              std::vector<std::string>{"Ref 4 sinDistance = 2.75" + other});
    EXPECT_EQ(wallsPassed(*rig, 90, 0, 3.25f),
              std::vector<std::string>{"Ref 5 sinDistance = -3.25" + other});
    for (const int elevation : {90, -90}) {
        const auto lines = wallsPassed(*rig, 90, elevation, 2.9f);
        ASSERT_EQ(lines.size(), 1u);
        EXPECT_TRUE(lines[0].starts_with(elevation > 0 ? "Ref 0 " : "Ref 1 ")) << lines[0];
        EXPECT_TRUE(lines[0].ends_with(other)) << lines[0];
    }
}

TEST_F(RoomTrace, FixedDirectionsAreToldRecordByRecord) {
    auto rig = std::make_unique<EngineRig>(directory.path(), 44100, 256);
    rig->settings.earlyFlexRefPreset = 15;
    rig->settings.qvTrackDirection = 0;
    rig->build();
    ASSERT_EQ(essError, essErrorNone);
    const std::array<std::string, 6> directions = {
        "phi -5 and theta 60 loading separately with indexPhi = 35 and indexTheta = 30",
        "phi 5 and theta -30 loading separately with indexPhi = 37 and indexTheta = 12",
        "phi 10 and theta 0 loading separately with indexPhi = 38 and indexTheta = 18",
        "phi -175 and theta 0 loading separately with indexPhi = 1 and indexTheta = 18",
        "phi -70 and theta 0 loading separately with indexPhi = 22 and indexTheta = 18",
        "phi 75 and theta 5 loading separately with indexPhi = 51 and indexTheta = 19"};
    const std::vector<std::string> lines = log.outputLines();
    std::size_t k = 0;
    for (std::size_t i = 0; i < lines.size(); ++i) {
        if (lines[i].starts_with("EarlyFlexReflection-HRIR-Degree ")) {
            ASSERT_LT(k, directions.size());
            EXPECT_EQ(lines[i], "EarlyFlexReflection-HRIR-Degree " + directions[k]);
            ASSERT_LT(i + 1, lines.size());
            EXPECT_EQ(lines[i + 1], "loadet FilterFile succesfully!");
            ++k;
        }
    }
    EXPECT_EQ(k, 6u);
}

}  // namespace
}  // namespace tessaly::test
