// Loading, look-up and control functions, against the stand-in library.
#include "minihost/plugin_library.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>

namespace tessaly {
namespace {

using ::testing::HasSubstr;

std::string failureOf(const std::function<void()>& action) {
    try {
        action();
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "";
}

TEST(PluginLibrary, FindsTheEffectsByName) {
    const PluginLibrary library(TESSALY_MOCK_PLUGIN);
    ASSERT_EQ(library.effects().size(), 2u);
    EXPECT_EQ(fieldText(library.effect("Tessaly Engine").name), "Tessaly Engine");
    EXPECT_EQ(library.effect("Tessaly Reverb").flags, 0u);
    EXPECT_THAT(failureOf([&] { library.effect("Tessaly"); }), HasSubstr("no effect \"Tessaly\""));
}

TEST(PluginLibrary, OpenedTwiceIsTheSameLibrary) {
    const PluginLibrary first(TESSALY_MOCK_PLUGIN);
    const PluginLibrary second(TESSALY_MOCK_PLUGIN);
    EXPECT_EQ(first.effects().data(), second.effects().data());
}

TEST(PluginLibrary, PrivateCopiesShareNothing) {
    using Stored = float (*)(int);
    const PluginLibrary shared(TESSALY_MOCK_PLUGIN);
    const PluginLibrary first = PluginLibrary::privateCopy(TESSALY_MOCK_PLUGIN);
    const PluginLibrary second = PluginLibrary::privateCopy(TESSALY_MOCK_PLUGIN);
    EXPECT_NE(first.effects().data(), second.effects().data());
    EXPECT_EQ(first.file(), TESSALY_MOCK_PLUGIN);
    shared.setRoomDistances({1.0f, 1.0f, 1.0f, 1.0f, 1.0f, 1.0f});
    first.setRoomDistances({2.0f, 2.0f, 2.0f, 2.0f, 2.0f, 2.0f});
    second.setRoomDistances({3.0f, 3.0f, 3.0f, 3.0f, 3.0f, 3.0f});
    float expected = 1.0f;
    for (const PluginLibrary* library : {&shared, &first, &second}) {
        const auto stored = reinterpret_cast<Stored>(library->findSymbol("MockRoomDistance"));
        ASSERT_NE(stored, nullptr);
        EXPECT_EQ(stored(0), expected);
        expected += 1.0f;
    }
}

TEST(PluginLibrary, PrivateCopyLeavesNothingBehind) {
    const std::filesystem::path folder =
        std::filesystem::path(::testing::TempDir()) / "private_copy_test";
    std::filesystem::remove_all(folder);
    std::filesystem::create_directories(folder);
    const char* before = std::getenv("TMPDIR");
    const std::string kept = before != nullptr ? before : "";
    setenv("TMPDIR", folder.c_str(), 1);
    const PluginLibrary library = PluginLibrary::privateCopy(TESSALY_MOCK_PLUGIN);
    EXPECT_THAT(failureOf([] { PluginLibrary::privateCopy("/no/such/library.so"); }),
                HasSubstr("/no/such/library.so cannot be copied"));
    EXPECT_TRUE(std::filesystem::is_empty(folder));
    if (before != nullptr) {
        setenv("TMPDIR", kept.c_str(), 1);
    } else {
        unsetenv("TMPDIR");
    }
    EXPECT_EQ(library.testMethode(7), 1);
    std::filesystem::remove_all(folder);
}

TEST(PluginLibrary, ParametersHaveTheirIndices) {
    const PluginLibrary library(TESSALY_MOCK_PLUGIN);
    const UnityAudioEffectDefinition& engine = library.effect("Tessaly Engine");
    EXPECT_EQ(parameterIndex(engine, "Gain"), 0);
    EXPECT_EQ(parameterIndex(engine, "Room Selection"), 2);
    EXPECT_EQ(parameterIndex(engine, "room selection"), -1);
    EXPECT_EQ(parametersOf(engine).size(), 5u);
}

TEST(PluginLibrary, FieldTextNeedsNoTerminator) {
    const char full[4] = {'a', 'b', 'c', 'd'};
    EXPECT_EQ(fieldText(full), "abcd");
    const char part[4] = {'a', '\0', 'c', 'd'};
    EXPECT_EQ(fieldText(part), "a");
}

TEST(PluginLibrary, ReportsAFileThatIsNotThere) {
    EXPECT_THAT(failureOf([] { PluginLibrary("/no/such/library.so"); }),
                HasSubstr("/no/such/library.so"));
    EXPECT_THAT(failureOf([] { PluginLibrary::locate("/no/such/library.so"); }),
                HasSubstr("library not found: /no/such/library.so"));
}

TEST(PluginLibrary, ReportsAFileThatIsNoLibrary) {
    const std::filesystem::path file =
        std::filesystem::path(::testing::TempDir()) / "no_library.so";
    std::ofstream(file) << "text";
    EXPECT_THAT(failureOf([&] { PluginLibrary{file}; }), HasSubstr("cannot be loaded"));
    std::filesystem::remove(file);
}

TEST(PluginLibrary, CallsTheControlFunctionsOfEachFamily) {
    const PluginLibrary library(TESSALY_MOCK_PLUGIN);
    EXPECT_EQ(library.setBuffersize(512), 512);
    EXPECT_EQ(library.setBuffersize(512, ExportFamily::Reverb), -512);
    EXPECT_EQ(library.set3DBypass(true), 1);
    EXPECT_EQ(library.getErrorState(), 1);
    EXPECT_EQ(library.testMethode(7), 1);
    EXPECT_FALSE(library.setStreamingAssetsPath("/no/such/place"));
    EXPECT_FALSE(library.setStreamingAssetsPath("/no/such/place", ExportFamily::ReverbIos));
    EXPECT_EQ(library.setRoomDistances({1.0f, 2.0f, 3.0f, 4.0f, 5.0f, 6.0f}), 1);
    const auto stored = reinterpret_cast<float (*)(int)>(library.findSymbol("MockRoomDistance"));
    ASSERT_NE(stored, nullptr);
    for (int i = 0; i < 6; ++i) {
        EXPECT_EQ(stored(i), static_cast<float>(i + 1));
    }
}

TEST(PluginLibrary, NamesAMissingControlFunction) {
    const PluginLibrary library(TESSALY_MOCK_PLUGIN);
    EXPECT_THAT(failureOf([&] { library.getErrorState(ExportFamily::Reverb); }),
                HasSubstr("no function GetErrorStateReverb"));
    EXPECT_EQ(library.findSymbol("NoSuchExport"), nullptr);
}

}  // namespace
}  // namespace tessaly
