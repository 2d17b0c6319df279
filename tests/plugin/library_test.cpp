// What the library offers when it is loaded.
#include <gtest/gtest.h>

#include <optional>
#include <string>

#include "host/expect_definition.h"
#include "plugin/plugin_fixture.h"

namespace tessaly::test {
namespace {

using LibraryTest = PluginTest;

TEST_F(LibraryTest, OffersBothEffectsWithTheirParameters) {
    withLibrary([](const PluginLibrary& library) {
        ASSERT_EQ(library.effects().size(), 2u);
        expectDefinition(*library.effects()[0], "Tessaly Engine", 2, expectedEngineParameters);
        expectDefinition(*library.effects()[1], "Tessaly Reverb", 0, expectedReverbParameters);
    });
}

TEST_F(LibraryTest, GivesTheSameDefinitionsEachTime) {
    withLibrary([](const PluginLibrary& library) {
        using Entry = int (*)(UnityAudioEffectDefinition***);
        const auto entry =
            reinterpret_cast<Entry>(library.findSymbol("UnityGetAudioEffectDefinitions"));
        ASSERT_NE(entry, nullptr);
        UnityAudioEffectDefinition** table = nullptr;
        EXPECT_EQ(entry(&table), 2);
        EXPECT_EQ(table, library.effects().data());
        EXPECT_EQ(table[0], library.effects()[0]);
        EXPECT_EQ(entry(nullptr), 2);
    });
}

TEST_F(LibraryTest, HasAllNamesOfTheControlFunctions) {
    withLibrary([](const PluginLibrary& library) {
        for (const std::string name :
             {"SetStreamingAssetsPath", "SetBuffersize", "Set3DBypass", "GetErrorState"}) {
            for (const std::string ending : {"", "IOS", "Reverb", "ReverbIOS"}) {
                EXPECT_NE(library.findSymbol(name + ending), nullptr) << name + ending;
            }
        }
        for (const char* name : {"SetRoomDistances", "SetRoomDistancesIOS", "TestMethode"}) {
            EXPECT_NE(library.findSymbol(name), nullptr) << name;
        }
        EXPECT_EQ(library.findSymbol("essError"), nullptr);
    });
}

TEST_F(LibraryTest, EffectsStartWithTheirDefaults) {
    withLibrary([](const PluginLibrary& library) {
        for (const UnityAudioEffectDefinition* definition : library.effects()) {
            const EffectInstance instance(*definition, 48000, 1024);
            int index = 0;
            for (const auto& parameter : parametersOf(*definition)) {
                EXPECT_EQ(instance.parameter(index), std::optional(parameter.defaultval));
                ++index;
            }
        }
    });
}

TEST_F(LibraryTest, ParametersReadBackAndOthersAreRefused) {
    withLibrary([](const PluginLibrary& library) {
        for (const UnityAudioEffectDefinition* definition : library.effects()) {
            EffectInstance instance(*definition, 48000, 1024);
            const int count = static_cast<int>(definition->numparameters);
            for (int index = 0; index < count; ++index) {
                EXPECT_EQ(instance.setParameter(index, 3.75f), 0);
                const std::string name = definition->paramdefs[index].name;
                const bool whole = name == "Reverb ID" || name == "ReverbID";
                EXPECT_EQ(instance.parameter(index), std::optional(whole ? 3.0f : 3.75f)) << name;
            }
            for (const int index : {count, count + 100, -1}) {
                EXPECT_EQ(instance.setParameter(index, 1.0f), 1);
                EXPECT_EQ(instance.parameter(index), std::nullopt);
            }
            float buffer[2] = {1.0f, 2.0f};
            EXPECT_EQ(definition->getfloatbuffer(&instance.state(), "any", buffer, 2), 0);
            EXPECT_EQ(buffer[0], 1.0f);
            EXPECT_EQ(buffer[1], 2.0f);
        }
    });
}

TEST_F(LibraryTest, TheDistanceCallbackLeavesTheHostsCurve) {
    withLibrary([](const PluginLibrary& library) {
        EffectInstance instance(library.effect("Tessaly Engine"), 48000, 1024);
        const auto callback = instance.spatializerData().distanceattenuationcallback;
        ASSERT_NE(callback, nullptr);
        float attenuation = 0.77f;
        EXPECT_EQ(callback(&instance.state(), 12.0f, 0.4f, &attenuation), 0);
        EXPECT_EQ(attenuation, 0.77f);
    });
}

}  // namespace
}  // namespace tessaly::test
