// Look-up of parameters by what a user calls them, and setting them block by block.
#include "render/parameter_setter.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <stdexcept>
#include <string_view>

#include "minihost/plugin_library.h"
#include "render/effect_names.h"
#include "render/text_numbers.h"

namespace tessaly {

namespace {

/// A change of one of these is a new engine.
constexpr std::array<std::string_view, 4> loadingParameters = {roomParameter, "Auralization",
                                                               "Reverb disable", "Mute"};

// By exact name, by name without regard to case and blanks, or by index.
int findParameter(const UnityAudioEffectDefinition& effect, const std::string& wanted) {
    const int exact = parameterIndex(effect, wanted);
    if (exact >= 0) {
        return exact;
    }
    const auto parameters = parametersOf(effect);
    if (const std::optional<double> number = numberFromText(wanted)) {
        const bool known = *number >= 0.0 && *number < static_cast<double>(parameters.size()) &&
                           *number == std::floor(*number);
        return known ? static_cast<int>(*number) : -1;
    }
    const std::string folded = foldedName(wanted);
    for (std::size_t i = 0; i < parameters.size(); ++i) {
        if (foldedName(fieldText(parameters[i].name)) == folded) {
            return static_cast<int>(i);
        }
    }
    return -1;
}

void checkRange(const UnityAudioParameterDefinition& parameter, const ScalarTrack& track) {
    for (const Keyframe<double>& key : track.keys) {
        const auto value = static_cast<float>(key.value);
        if (!(value >= parameter.min && value <= parameter.max)) {
            throw std::runtime_error(fmt::format("parameter \"{}\" takes {:g} to {:g}, got {:g}",
                                                 fieldText(parameter.name), parameter.min,
                                                 parameter.max, value));
        }
    }
}

}  // namespace

ParameterSetter::ParameterSetter(const UnityAudioEffectDefinition& effect,
                                 const std::vector<ParameterTrack>& parameters) {
    for (const ParameterTrack& one : parameters) {
        const int index = findParameter(effect, one.name);
        if (index < 0) {
            throw std::runtime_error(fmt::format(
                "unknown parameter \"{}\": --list shows the names and indices", one.name));
        }
        const UnityAudioParameterDefinition& parameter =
            parametersOf(effect)[static_cast<std::size_t>(index)];
        checkRange(parameter, one.track);
        const bool loads = std::find(loadingParameters.begin(), loadingParameters.end(),
                                     fieldText(parameter.name)) != loadingParameters.end();
        entries.push_back(
            {index, one.track, parameter.min, parameter.max, loads, std::nullopt, false});
    }
}

bool ParameterSetter::set(EffectInstance& instance, double seconds) {
    bool loads = false;
    for (Entry& entry : entries) {
        const float value =
            std::clamp(static_cast<float>(valueAt(entry.track, seconds)), entry.low, entry.high);
        const bool differs = entry.last != value;
        if (differs || entry.repeat) {
            instance.setParameter(entry.index, value);
            loads = loads || (differs && entry.loads);
            entry.last = value;
            entry.repeat = false;
        }
    }
    return loads;
}

void ParameterSetter::repeatAll() noexcept {
    for (Entry& entry : entries) {
        entry.repeat = true;
    }
}

}  // namespace tessaly
