// What is refused on import, judged by the samples.
#include "data/measurement.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>

#include "data/data_error.h"
#include "tools/data/synthetic_head.h"

namespace tessaly::data {
namespace {

using testing::AllOf;
using testing::HasSubstr;

std::string refusal(Measurement measurement) {
    try {
        checkMeasurement(measurement);
    } catch (const DataError& error) {
        return error.what();
    }
    return "";
}

TEST(MeasurementCheck, ASoundSetPasses) { EXPECT_EQ(refusal(syntheticHead()), ""); }

TEST(MeasurementCheck, SwappedEarsAreToldByTimeAndLevel) {
    Measurement head = syntheticHead();
    swapEars(head);
    EXPECT_THAT(refusal(head),
                AllOf(HasSubstr("ears swapped or azimuth mirrored"), HasSubstr("us later"),
                      HasSubstr("dB softer"), HasSubstr("expected the left ear first and louder")));
}

TEST(MeasurementCheck, MirroredAzimuthIsToldByTimeAndLevel) {
    Measurement head = syntheticHead();
    for (Direction& direction : head.directions) {
        direction.azimuth = -direction.azimuth;
    }
    EXPECT_THAT(refusal(head), HasSubstr("ears swapped or azimuth mirrored"));
}

TEST(MeasurementCheck, BothMistakesTogetherAreARightSet) {
    Measurement head = syntheticHead();
    swapEars(head);
    for (Direction& direction : head.directions) {
        direction.azimuth = 360.0 - direction.azimuth;
    }
    EXPECT_EQ(refusal(head), "");
}

TEST(MeasurementCheck, TurnedAzimuthsDoNotFollowTheDifferences) {
    Measurement head = syntheticHead();
    for (Direction& direction : head.directions) {
        direction.azimuth += 90.0;
    }
    EXPECT_THAT(refusal(head), HasSubstr("do not follow the azimuths"));
}

TEST(MeasurementCheck, LevelsThatContradictTheTimesAreRefused) {
    Measurement head = syntheticHead();
    for (std::size_t i = 0; i < head.count(); ++i) {
        const double side = toVector(head.directions[i])[1];
        for (int ear = 0; ear < earCount; ++ear) {
            const double turnedDb = 4.0 * syntheticShadowDb * (ear == leftEar ? -side : side);
            for (std::size_t n = 0; n < head.taps; ++n) {
                head.samples[(i * earCount + static_cast<std::size_t>(ear)) * head.taps + n] *=
                    std::pow(10.0, turnedDb / 20.0);
            }
        }
    }
    EXPECT_THAT(refusal(head),
                AllOf(HasSubstr("do not follow"), HasSubstr("earlier"), HasSubstr("softer")));
}

TEST(MeasurementCheck, TooFewDirectionsAreCounted) {
    Measurement head = syntheticHead();
    head.directions.resize(99);
    head.extraSeconds.resize(99);
    head.samples.resize(99 * earCount * head.taps);
    EXPECT_THAT(refusal(head), AllOf(HasSubstr("found 99"), HasSubstr("expected 100")));
}

TEST(MeasurementCheck, RepeatedDirectionsCountOnce) {
    Measurement head = syntheticHead();
    const std::size_t count = head.count();
    const Measurement copy = head;
    head.directions.insert(head.directions.end(), copy.directions.begin(), copy.directions.end());
    head.samples.insert(head.samples.end(), copy.samples.begin(), copy.samples.end());
    head.extraSeconds.resize(2 * count, 0.0);
    checkMeasurement(head);
    EXPECT_EQ(head.count(), count);
    EXPECT_EQ(head.samples, copy.samples);

    Measurement same = syntheticHead();
    for (Direction& direction : same.directions) {
        direction = {90.0, 0.0};
    }
    EXPECT_THAT(refusal(same), HasSubstr("found 1 different"));
}

TEST(MeasurementCheck, SilentAndBrokenEarsAreNamed) {
    Measurement head = syntheticHead();
    const std::size_t at = 30;  // ring -30, azimuth 90
    double* left = head.samples.data() + at * earCount * head.taps;
    std::fill(left + head.taps, left + 2 * head.taps, 0.0);
    EXPECT_THAT(refusal(head), AllOf(HasSubstr("right ear at azimuth 90.0"), HasSubstr("silent")));
    left[head.taps + 3] = std::numeric_limits<double>::quiet_NaN();
    EXPECT_THAT(refusal(head), HasSubstr("not a number"));
    left[head.taps + 3] = std::numeric_limits<double>::infinity();
    EXPECT_THAT(refusal(head), HasSubstr("not a number"));
}

TEST(MeasurementCheck, DirectionsOffTheSphereAreRefused) {
    Measurement head = syntheticHead();
    head.directions[7].elevation = 91.0;
    EXPECT_THAT(refusal(head), HasSubstr("elevation 91"));
    head = syntheticHead();
    head.directions[7].azimuth = std::numeric_limits<double>::quiet_NaN();
    EXPECT_THAT(refusal(head), HasSubstr("direction 7"));
}

TEST(MeasurementCheck, RatesAndLengthsHaveLimits) {
    Measurement head = syntheticHead();
    head.sampleRate = 32000.0;
    EXPECT_THAT(refusal(head), AllOf(HasSubstr("32000 Hz"), HasSubstr("44100 Hz or more")));
    head.sampleRate = std::numeric_limits<double>::quiet_NaN();
    EXPECT_THAT(refusal(head), HasSubstr("sample rate is nan"));
    head = syntheticHead();
    head.taps = 8;
    EXPECT_THAT(refusal(head), HasSubstr("8 samples long"));
}

TEST(MeasurementCheck, SetsWithoutSidesAreRefused) {
    Measurement head = syntheticHead(5, 45, 90);
    EXPECT_THAT(refusal(head), HasSubstr("too few directions at the sides"));
}

}  // namespace
}  // namespace tessaly::data
