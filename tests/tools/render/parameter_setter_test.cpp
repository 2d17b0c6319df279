// Parameters over time, against the stand-in library.
#include "render/parameter_setter.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>

#include "minihost/plugin_library.h"

namespace tessaly {
namespace {

using ::testing::HasSubstr;

class ParameterSetterTest : public ::testing::Test {
protected:
    ParameterSetter setterOf(const std::vector<ParameterTrack>& parameters) const {
        return {instance.definition(), parameters};
    }

    std::string failureOf(const ParameterTrack& parameter) const {
        try {
            setterOf({parameter});
        } catch (const std::runtime_error& failure) {
            return failure.what();
        }
        return "";
    }

    const PluginLibrary library{TESSALY_MOCK_PLUGIN};
    EffectInstance instance{library.effect("Tessaly Engine"), 48000, 64};
};

TEST_F(ParameterSetterTest, FollowsTracksByNameAndIndex) {
    ParameterSetter setter =
        setterOf({{"gain", {{{0.0, 0.0}, {2.0, -20.0}}, Interpolation::Linear}},
                  {"1", constantTrack(-3.0)}});
    setter.set(instance, 0.5);
    EXPECT_EQ(instance.parameter("Gain"), -5.0f);
    EXPECT_EQ(instance.parameter("Direct"), -3.0f);
    setter.set(instance, 9.0);
    EXPECT_EQ(instance.parameter("Gain"), -20.0f);
}

TEST_F(ParameterSetterTest, SetsOnlyWhatChangesUntilToldToRepeat) {
    ParameterSetter setter = setterOf({{"Gain", constantTrack(-6.0)}});
    setter.set(instance, 0.0);
    instance.setParameter("Gain", 1.0f);
    setter.set(instance, 1.0);
    EXPECT_EQ(instance.parameter("Gain"), 1.0f);
    setter.repeatAll();
    EXPECT_FALSE(setter.set(instance, 2.0));
    EXPECT_EQ(instance.parameter("Gain"), -6.0f);
    instance.setParameter("Gain", 1.0f);
    setter.set(instance, 3.0);
    EXPECT_EQ(instance.parameter("Gain"), 1.0f) << "repeated once";
}

TEST_F(ParameterSetterTest, TellsWhenARoomChanges) {
    ParameterSetter setter =
        setterOf({{"Room Selection", {{{0.0, 1.0}, {1.0, 5.0}}, Interpolation::Step}},
                  {"Gain", {{{0.0, 0.0}, {1.0, -6.0}}, Interpolation::Linear}}});
    EXPECT_TRUE(setter.set(instance, 0.0));
    EXPECT_FALSE(setter.set(instance, 0.5)) << "the gain alone";
    EXPECT_TRUE(setter.set(instance, 1.0));
    setter.repeatAll();
    EXPECT_FALSE(setter.set(instance, 1.5)) << "the same room again";
}

TEST_F(ParameterSetterTest, ASplineThatOvershootsStaysInRange) {
    ParameterSetter setter = setterOf(
        {{"Gain",
          {{{0.0, 24.0}, {1.0, 24.0}, {2.0, -96.0}, {3.0, -96.0}}, Interpolation::Spline}}});
    setter.set(instance, 0.8);
    EXPECT_EQ(instance.parameter("Gain"), 24.0f);
    setter.set(instance, 2.2);
    EXPECT_EQ(instance.parameter("Gain"), -96.0f);
}

TEST_F(ParameterSetterTest, UnknownNamesAndValuesOutOfRangeAreRefused) {
    EXPECT_THAT(failureOf({"Loudness", constantTrack(0.0)}),
                HasSubstr("unknown parameter \"Loudness\""));
    EXPECT_THAT(failureOf({"17", constantTrack(0.0)}), HasSubstr("unknown parameter \"17\""));
    EXPECT_THAT(failureOf({"1.5", constantTrack(0.0)}), HasSubstr("unknown parameter \"1.5\""));
    EXPECT_THAT(failureOf({"Gain", {{{0.0, 0.0}, {1.0, 30.0}}, Interpolation::Step}}),
                HasSubstr("parameter \"Gain\" takes -96 to 24, got 30"));
}

}  // namespace
}  // namespace tessaly
