// Loading of the library, look-up of its exports and of its definitions.
#include "minihost/plugin_library.h"

#include <dlfcn.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <system_error>

namespace tessaly {

namespace {

const char* endingOf(ExportFamily family) {
    switch (family) {
        case ExportFamily::Plain:
            return "";
        case ExportFamily::Ios:
            return "IOS";
        case ExportFamily::Reverb:
            return "Reverb";
        case ExportFamily::ReverbIos:
            return "ReverbIOS";
    }
    return "";
}

std::filesystem::path programFolder() {
    std::error_code ignored;
    return std::filesystem::read_symlink("/proc/self/exe", ignored).parent_path();
}

// A new directory under the system's temporary one; goes with everything in it.
class ScratchDirectory {
public:
    ScratchDirectory() {
        std::string pattern = (std::filesystem::temp_directory_path() / "tessaly-XXXXXX").string();
        if (mkdtemp(pattern.data()) == nullptr) {
            throw std::runtime_error("cannot make a directory like " + pattern + ": " +
                                     std::strerror(errno));
        }
        place = pattern;
    }
    ~ScratchDirectory() {
        std::error_code ignored;
        std::filesystem::remove_all(place, ignored);
    }
    ScratchDirectory(const ScratchDirectory&) = delete;
    ScratchDirectory& operator=(const ScratchDirectory&) = delete;

    const std::filesystem::path& path() const noexcept { return place; }

private:
    std::filesystem::path place;
};

}  // namespace

PluginLibrary PluginLibrary::privateCopy(const std::filesystem::path& file) {
    const ScratchDirectory scratch;
    const std::filesystem::path copy = scratch.path() / file.filename();
    std::error_code failure;
    std::filesystem::copy_file(file, copy, failure);
    if (failure) {
        throw std::runtime_error("library " + file.string() +
                                 " cannot be copied: " + failure.message());
    }
    // Loaded code keeps the removed file alive, so its identity is not given to the next copy.
    PluginLibrary library(copy);
    library.path = file;
    return library;
}

std::filesystem::path PluginLibrary::locate(const std::string& given) {
    std::error_code ignored;
    if (!given.empty()) {
        if (!std::filesystem::is_regular_file(given, ignored)) {
            throw std::runtime_error("library not found: " + given);
        }
        return std::filesystem::absolute(given);
    }
    const std::filesystem::path folder = programFolder();
    const std::filesystem::path beside = (folder / ".." / "lib" / fileName).lexically_normal();
    const std::filesystem::path same = folder / fileName;
    for (const std::filesystem::path& candidate : {beside, same}) {
        if (std::filesystem::is_regular_file(candidate, ignored)) {
            return candidate;
        }
    }
    throw std::runtime_error("library not found: neither " + beside.string() + " nor " +
                             same.string() + " exists");
}

PluginLibrary::PluginLibrary(const std::filesystem::path& file) : path(file) {
    // Local binding, as a player loads it: nothing but the looked-up exports may be needed.
    handle = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (handle == nullptr) {
        const char* reason = dlerror();
        throw std::runtime_error("library cannot be loaded: " +
                                 std::string(reason != nullptr ? reason : path.c_str()));
    }
    using Entry = int (*)(UnityAudioEffectDefinition***);
    const Entry entry = resolve<Entry>("UnityGetAudioEffectDefinitions", ExportFamily::Plain);
    UnityAudioEffectDefinition** table = nullptr;
    const int count = entry(&table);
    if (count < 0 || (count > 0 && table == nullptr)) {
        throw std::runtime_error("library offers no effects: " + path.string());
    }
    definitions = {table, static_cast<std::size_t>(count)};
}

const UnityAudioEffectDefinition& PluginLibrary::effect(std::string_view name) const {
    return effectNamed(definitions, name);
}

void* PluginLibrary::findSymbol(const std::string& name) const noexcept {
    return dlsym(handle, name.c_str());
}

template <typename Function>
Function PluginLibrary::resolve(const char* name, ExportFamily family) const {
    const std::string symbol = std::string(name) + endingOf(family);
    void* address = findSymbol(symbol);
    if (address == nullptr) {
        throw std::runtime_error("library has no function " + symbol + ": " + path.string());
    }
    return reinterpret_cast<Function>(address);
}

bool PluginLibrary::setStreamingAssetsPath(const std::string& directory,
                                           ExportFamily family) const {
    return resolve<bool (*)(const char*)>("SetStreamingAssetsPath", family)(directory.c_str());
}

int PluginLibrary::setBuffersize(int size, ExportFamily family) const {
    return resolve<int (*)(int)>("SetBuffersize", family)(size);
}

unsigned char PluginLibrary::set3DBypass(bool bypass, ExportFamily family) const {
    return resolve<unsigned char (*)(bool)>("Set3DBypass", family)(bypass);
}

int PluginLibrary::setRoomDistances(const std::array<float, 6>& metres, ExportFamily family) const {
    using Setter = int (*)(float, float, float, float, float, float);
    return resolve<Setter>("SetRoomDistances", family)(metres[0], metres[1], metres[2], metres[3],
                                                       metres[4], metres[5]);
}

int PluginLibrary::getErrorState(ExportFamily family) const {
    return resolve<int (*)()>("GetErrorState", family)();
}

int PluginLibrary::testMethode(int value) const {
    return resolve<int (*)(int)>("TestMethode", ExportFamily::Plain)(value);
}

std::string_view fieldText(std::span<const char> field) noexcept {
    const auto end = std::find(field.begin(), field.end(), '\0');
    return {field.data(), static_cast<std::size_t>(end - field.begin())};
}

const UnityAudioEffectDefinition& effectNamed(std::span<UnityAudioEffectDefinition* const> effects,
                                              std::string_view name) {
    const auto found = std::find_if(effects.begin(), effects.end(),
                                    [&](const auto* one) { return fieldText(one->name) == name; });
    if (found == effects.end()) {
        throw std::runtime_error("library has no effect \"" + std::string(name) + "\"");
    }
    return **found;
}

std::span<const UnityAudioParameterDefinition> parametersOf(
    const UnityAudioEffectDefinition& definition) noexcept {
    return {definition.paramdefs, definition.numparameters};
}

int parameterIndex(const UnityAudioEffectDefinition& definition, std::string_view name) noexcept {
    int index = 0;
    for (const UnityAudioParameterDefinition& parameter : parametersOf(definition)) {
        if (fieldText(parameter.name) == name) {
            return index;
        }
        ++index;
    }
    return -1;
}

}  // namespace tessaly
