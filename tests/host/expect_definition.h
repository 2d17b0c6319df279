// Compares a definition with what the host is to be told.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <span>

#include "host/audio_plugin_interface.h"
#include "host/expected_parameters.h"

namespace tessaly::test {

/// Every field of the definition that has a fixed value, and every parameter.
inline void expectDefinition(const UnityAudioEffectDefinition& definition,
                             const char* name,
                             std::uint64_t flags,
                             std::span<const ExpectedParameter> parameters) {
    SCOPED_TRACE(name);
    EXPECT_EQ(definition.structsize, sizeof(void*) == 8 ? 136u : 104u);
    EXPECT_EQ(definition.paramstructsize, sizeof(void*) == 8 ? 64u : 56u);
    EXPECT_EQ(definition.apiversion, 0x10300u);
    EXPECT_EQ(definition.pluginversion, 0x10000u);
    EXPECT_EQ(definition.channels, 0u);
    EXPECT_EQ(definition.flags, flags);
    EXPECT_STREQ(definition.name, name);
    EXPECT_NE(definition.create, nullptr);
    EXPECT_NE(definition.release, nullptr);
    EXPECT_EQ(definition.reset, nullptr);
    EXPECT_NE(definition.process, nullptr);
    EXPECT_EQ(definition.setposition, nullptr);
    EXPECT_NE(definition.setfloatparameter, nullptr);
    EXPECT_NE(definition.getfloatparameter, nullptr);
    EXPECT_NE(definition.getfloatbuffer, nullptr);
    ASSERT_EQ(definition.numparameters, parameters.size());
    for (std::size_t i = 0; i < parameters.size(); ++i) {
        const ExpectedParameter& expected = parameters[i];
        const UnityAudioParameterDefinition& actual = definition.paramdefs[i];
        SCOPED_TRACE(expected.name);
        EXPECT_STREQ(actual.name, expected.name);
        EXPECT_STREQ(actual.unit, expected.unit);
        EXPECT_STREQ(actual.description, expected.description);
        EXPECT_EQ(actual.min, static_cast<float>(expected.min));
        EXPECT_EQ(actual.max, static_cast<float>(expected.max));
        EXPECT_EQ(actual.defaultval, static_cast<float>(expected.defaultval));
        EXPECT_EQ(actual.displayscale, 1.0f);
        EXPECT_EQ(actual.displayexponent, 1.0f);
    }
}

}  // namespace tessaly::test
