// The picture: well-formed for every kind of content, with all its parts.
#include "render/picture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>

#include "render/chart_axis.h"
#include "tools/render/xml_check.h"

namespace tessaly {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;

PictureContent content(const SourcePath& path, double duration) {
    PictureContent result;
    result.title = "a <sound> & more";
    result.subtitle = "how";
    result.path = path;
    result.duration = duration;
    for (int i = 0; i < 100; ++i) {
        BinauralPoint point;
        point.time = duration * i / 100.0;
        point.leftDb = -20.0 - 0.1 * i;
        point.rightDb = -30.0 + 0.1 * i;
        if (i % 10 != 0) {
            point.levelDifference = point.rightDb - point.leftDb;
            point.timeDifference = 0.01 * (i - 50);
        }
        result.points.push_back(point);
    }
    return result;
}

TEST(Picture, IsWellFormedForEveryPath) {
    const SourcePath paths[] = {FixedPath{{0.0, 0.0, 0.0}}, FixedPath{{1.0, 2.0, -3.0}},
                                OrbitPath{}, LinePath{{-500.0, 0.0, 1.0}, {500.0, 0.0, 1.0}},
                                RisePath{}};
    for (const SourcePath& path : paths) {
        for (const double duration : {0.001, 0.5, 8.0, 3600.0}) {
            const std::string document = drawPicture(content(path, duration));
            EXPECT_EQ(xmlFault(document), "") << describe(path) << ", " << duration << " s";
            EXPECT_THAT(document, Not(HasSubstr("nan")));
            EXPECT_THAT(document, Not(HasSubstr("inf")));
            EXPECT_LT(document.size(), 200000u);
        }
    }
}

TEST(Picture, HasTitleUnitsAndLegends) {
    const std::string document = drawPicture(content(OrbitPath{}, 8.0));
    for (const char* words :
         {"a &lt;sound&gt; &amp; more", "Path from above", "Path from the right side",
          "Level at the ears", "Time difference, + right ear first",
          "Level difference, + right ear louder", "dBFS rms", ">ms<", ">dB<", "time, s", "left ear",
          "right ear", "measured", "rigid sphere", "left – right, m"}) {
        EXPECT_THAT(document, HasSubstr(words));
    }
}

TEST(Picture, SilenceDrawsNoCurvesButTheModel) {
    PictureContent silent = content(OrbitPath{}, 8.0);
    const int before = countElements(drawPicture(silent), "polyline");
    for (BinauralPoint& point : silent.points) {
        point = BinauralPoint{point.time, silenceDb, silenceDb, std::nullopt, std::nullopt};
    }
    const std::string document = drawPicture(silent);
    EXPECT_EQ(xmlFault(document), "");
    EXPECT_LT(countElements(document, "polyline"), before);
}

TEST(Picture, EmptyMeasurementIsDrawn) {
    PictureContent nothing = content(OrbitPath{}, 8.0);
    nothing.points.clear();
    EXPECT_EQ(xmlFault(drawPicture(nothing)), "");
}

TEST(Picture, StepsAreOneTwoOrFive) {
    EXPECT_DOUBLE_EQ(niceStep(0.0, 8.0, 8), 1.0);
    EXPECT_DOUBLE_EQ(niceStep(0.0, 8.0, 4), 2.0);
    EXPECT_DOUBLE_EQ(niceStep(0.0, 0.03, 8), 0.005);
    EXPECT_DOUBLE_EQ(niceStep(-30.0, 30.0, 5), 20.0);
    EXPECT_DOUBLE_EQ(niceStep(0.0, 99.0, 10), 10.0);
}

TEST(Picture, SphereTimeDifferenceIsWoodworths) {
    // a/c (pi/2 + 1) at the side, with a = 87.5 mm and c = 343 m/s.
    const double side = 1000.0 * 0.0875 / 343.0 * (std::acos(-1.0) / 2.0 + 1.0);
    EXPECT_NEAR(sphereTimeDifference({90.0, 0.0, 1.0}), side, 1e-12);
    EXPECT_NEAR(sphereTimeDifference({-90.0, 0.0, 1.0}), -side, 1e-12);
    EXPECT_NEAR(sphereTimeDifference({180.0, 0.0, 1.0}), 0.0, 1e-12);
    EXPECT_NEAR(sphereTimeDifference({90.0, 90.0, 1.0}), 0.0, 1e-12);
}

}  // namespace
}  // namespace tessaly
