// Table of effects, parameters and rooms.
#include "render/listing.h"

#include <fmt/format.h>

#include "render/rooms.h"

namespace tessaly {

std::string listing(const PluginLibrary& library) {
    std::string text = fmt::format("Library: {}\n", library.file().string());
    for (const UnityAudioEffectDefinition* effect : library.effects()) {
        const bool spatializer = (effect->flags & effectFlagIsSpatializer) != 0;
        text += fmt::format("\n{} ({})\n", fieldText(effect->name),
                            spatializer ? "spatializer, one a source" : "effect of a mixer group");
        text += fmt::format("  {:>5}  {:<16} {:<6} {:>8} {:>8} {:>8}  {}\n", "index", "parameter",
                            "unit", "min", "max", "default", "description");
        int index = 0;
        for (const UnityAudioParameterDefinition& one : parametersOf(*effect)) {
            text += fmt::format("  {:>5}  {:<16} {:<6} {:>8g} {:>8g} {:>8g}  {}\n", index,
                                fieldText(one.name), fieldText(one.unit), one.min, one.max,
                                one.defaultval, one.description != nullptr ? one.description : "");
            ++index;
        }
    }
    text += fmt::format("\nRooms\n  {:>5}  {:>6}  {}\n", "room", "preset", "name");
    for (int number = 0; number < roomCount; ++number) {
        const Room& room = roomAt(number);
        text += fmt::format("  {:>5}  {:>6}  {}\n", number, room.preset, room.name);
    }
    return text;
}

}  // namespace tessaly
