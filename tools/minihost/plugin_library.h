// The built library as a host sees it: loaded at run time, its effects and its control functions.
#pragma once

#include <array>
#include <filesystem>
#include <span>
#include <string>
#include <string_view>

#include "host/audio_plugin_interface.h"

namespace tessaly {

/// The four name endings under which most control functions are exported.
enum class ExportFamily { Plain, Ios, Reverb, ReverbIos };

/// One loaded library. It stays loaded until the program ends, as in a game: its process-wide state
/// and its definitions live on, and opening the same file twice gives the same state.
class PluginLibrary {
public:
    /// Loads the library and asks for its effects. Load time.
    /// @throws std::runtime_error with one line that says what is missing
    explicit PluginLibrary(const std::filesystem::path& file);

    /// Loads a copy of the file, which has process-wide state and definitions of its own. For
    /// several independent sessions in one program; the copy on disk is gone when this returns.
    /// @throws std::runtime_error as the constructor, or if the copy cannot be made
    static PluginLibrary privateCopy(const std::filesystem::path& file);

    /// File name of the library on this platform.
    static constexpr const char* fileName = "libAudioPluginTessaly.so";

    /// The given path if there is one, else ../lib/ beside this program, then the program's folder.
    /// @throws std::runtime_error naming the places looked at
    static std::filesystem::path locate(const std::string& given);

    const std::filesystem::path& file() const noexcept { return path; }

    /// All effects, in the library's order.
    std::span<UnityAudioEffectDefinition* const> effects() const noexcept { return definitions; }

    /// @throws std::runtime_error if there is no effect of that name
    const UnityAudioEffectDefinition& effect(std::string_view name) const;

    /// @returns the address of an export, null if there is none of that name
    void* findSymbol(const std::string& name) const noexcept;

    // The control functions. Each resolves its export by name and throws std::runtime_error if the
    // library does not have it; they are for load time and script time, not for a block.
    bool setStreamingAssetsPath(const std::string& directory,
                                ExportFamily family = ExportFamily::Plain) const;
    int setBuffersize(int size, ExportFamily family = ExportFamily::Plain) const;
    unsigned char set3DBypass(bool bypass, ExportFamily family = ExportFamily::Plain) const;
    int setRoomDistances(const std::array<float, 6>& metres,
                         ExportFamily family = ExportFamily::Plain) const;
    int getErrorState(ExportFamily family = ExportFamily::Plain) const;
    int testMethode(int value) const;

private:
    template <typename Function>
    Function resolve(const char* name, ExportFamily family) const;

    std::filesystem::path path;
    void* handle = nullptr;
    std::span<UnityAudioEffectDefinition* const> definitions;
};

/// Text of a fixed-size field, which need not be terminated.
std::string_view fieldText(std::span<const char> field) noexcept;

/// @throws std::runtime_error if there is no effect of that name
const UnityAudioEffectDefinition& effectNamed(std::span<UnityAudioEffectDefinition* const> effects,
                                              std::string_view name);

/// Parameters of an effect, in index order.
std::span<const UnityAudioParameterDefinition> parametersOf(
    const UnityAudioEffectDefinition& definition) noexcept;

/// @returns the index of the parameter of that exact name, -1 if there is none
int parameterIndex(const UnityAudioEffectDefinition& definition, std::string_view name) noexcept;

}  // namespace tessaly
