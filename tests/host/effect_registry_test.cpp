// Definitions and parameter registration.
#include "host/effect_registry.h"

#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <limits>
#include <string>

#include "host/expect_definition.h"
#include "host/reverb_effect.h"
#include "host/spatializer_effect.h"

namespace tessaly::test {
namespace {

/// A definition with room for parameters, whose texts it frees.
struct Scratch {
    Scratch() { definition.paramdefs = parameters.data(); }
    ~Scratch() {
        for (const auto& parameter : parameters) {
            delete[] parameter.description;
        }
    }
    Scratch(const Scratch&) = delete;
    Scratch& operator=(const Scratch&) = delete;

    std::array<UnityAudioParameterDefinition, 4> parameters{};
    UnityAudioEffectDefinition definition{};
};

TEST(EffectRegistry, OffersTwoEffects) {
    UnityAudioEffectDefinition** table = nullptr;
    ASSERT_EQ(getAudioEffectDefinitions(&table), 2);
    expectDefinition(*table[0], "Tessaly Engine", 2, expectedEngineParameters);
    expectDefinition(*table[1], "Tessaly Reverb", 0, expectedReverbParameters);
    EXPECT_EQ(table[0]->getfloatbuffer, table[1]->getfloatbuffer) << "one stub serves both";
}

TEST(EffectRegistry, BuildsItsDefinitionsOnce) {
    UnityAudioEffectDefinition** first = nullptr;
    UnityAudioEffectDefinition** second = nullptr;
    ASSERT_EQ(getAudioEffectDefinitions(&first), 2);
    const std::array<UnityAudioEffectDefinition*, 2> entries = {first[0], first[1]};
    const UnityAudioParameterDefinition* parameters = first[0]->paramdefs;
    first[0] = nullptr;
    ASSERT_EQ(getAudioEffectDefinitions(&second), 2);
    EXPECT_EQ(first, second);
    EXPECT_EQ(second[0], entries[0]) << "the pointer table is filled anew";
    EXPECT_EQ(second[1], entries[1]);
    EXPECT_EQ(second[0]->paramdefs, parameters);
    EXPECT_EQ(getAudioEffectDefinitions(nullptr), 2);
}

TEST(EffectRegistry, AParameterWithoutDescriptionShowsItsName) {
    Scratch scratch;
    RegisterParameter(scratch.definition, "Gain", "dB", -1.0f, 1.0f, 0.5f, 0, nullptr);
    RegisterParameter(scratch.definition, nullptr, nullptr, 0.0f, 0.0f, 0.0f, 1, nullptr);
    EXPECT_STREQ(scratch.parameters[0].description, "Gain");
    EXPECT_EQ(scratch.parameters[1].description, nullptr);
    EXPECT_EQ(scratch.parameters[0].min, -1.0f);
    EXPECT_EQ(scratch.parameters[0].max, 1.0f);
    EXPECT_EQ(scratch.parameters[0].defaultval, 0.5f);
    EXPECT_EQ(scratch.parameters[0].displayscale, 1.0f);
    EXPECT_EQ(scratch.parameters[0].displayexponent, 1.0f);
}

TEST(EffectRegistry, DescriptionsAreCopies) {
    Scratch scratch;
    char text[] = "first";
    RegisterParameter(scratch.definition, "Gain", "dB", 0.0f, 1.0f, 0.0f, 0, text);
    text[0] = 'F';
    EXPECT_STREQ(scratch.parameters[0].description, "first");
}

TEST(EffectRegistry, CountsUpToTheHighestIndex) {
    Scratch scratch;
    RegisterParameter(scratch.definition, "c", "", 0.0f, 1.0f, 0.0f, 2, "c");
    EXPECT_EQ(scratch.definition.numparameters, 3u);
    RegisterParameter(scratch.definition, "a", "", 0.0f, 1.0f, 0.0f, 0, "a");
    EXPECT_EQ(scratch.definition.numparameters, 3u);
}

TEST(EffectRegistry, LongTextsStayInTheirFields) {
    Scratch scratch;
    const std::string longText(100, 'x');
    RegisterParameter(scratch.definition, longText.c_str(), longText.c_str(), 0.0f, 1.0f, 0.25f, 0,
                      nullptr);
    EXPECT_EQ(std::string(scratch.parameters[0].name), std::string(15, 'x'));
    EXPECT_EQ(std::string(scratch.parameters[0].unit), std::string(15, 'x'));
    EXPECT_EQ(scratch.parameters[0].defaultval, 0.25f);
    EXPECT_EQ(std::string(scratch.parameters[0].description), longText);
}

TEST(EffectRegistry, TheSpatializerFlagLeavesTheOthers) {
    UnityAudioEffectDefinition definition{};
    definition.flags = 0xABCD000000000001u;
    EXPECT_EQ(registerSpatializerParameters(definition), 20);
    EXPECT_EQ(definition.flags, 0xABCD000000000003u);
    for (std::uint32_t i = 0; i < definition.numparameters; ++i) {
        delete[] definition.paramdefs[i].description;
    }
    delete[] definition.paramdefs;
}

TEST(EffectRegistry, DefaultsComeFromTheTable) {
    std::array<float, 21> engine{};
    engine.fill(-5.0f);
    InitParametersFromDefinitions(&registerSpatializerParameters, engine.data());
    for (std::size_t i = 0; i < 20; ++i) {
        EXPECT_EQ(engine[i], static_cast<float>(expectedEngineParameters[i].defaultval));
    }
    EXPECT_EQ(engine[20], -5.0f);
    std::array<float, 9> reverb{};
    InitParametersFromDefinitions(&registerReverbParameters, reverb.data());
    for (std::size_t i = 0; i < 9; ++i) {
        EXPECT_EQ(reverb[i], static_cast<float>(expectedReverbParameters[i].defaultval));
    }
}

TEST(EffectRegistry, ReadsParametersWithinTheirRange) {
    const std::array<float, 3> values = {1.0f, 2.0f, 3.0f};
    float value = 0.0f;
    char text[4] = "abc";
    EXPECT_EQ(getFloatParameter(values, 2, &value, text), 0);
    EXPECT_EQ(value, 3.0f);
    EXPECT_EQ(text[0], '\0');
    EXPECT_EQ(text[1], 'b') << "the first byte only";
    EXPECT_EQ(getFloatParameter(values, 1, nullptr, nullptr), 0);
    for (const int index :
         {3, -1, std::numeric_limits<int>::max(), std::numeric_limits<int>::min()}) {
        EXPECT_EQ(getFloatParameter(values, index, &value, text), 1);
    }
    EXPECT_EQ(value, 3.0f);
}

TEST(EffectRegistry, TheBufferStubTouchesNothing) {
    float buffer[2] = {1.0f, 2.0f};
    EXPECT_EQ(getFloatBufferStub(nullptr, "any", buffer, 2), 0);
    EXPECT_EQ(buffer[0], 1.0f);
    EXPECT_EQ(buffer[1], 2.0f);
}

}  // namespace
}  // namespace tessaly::test
