// What --list prints.
#pragma once

#include <string>

#include "minihost/plugin_library.h"

namespace tessaly {

/// Effects, their parameters with ranges and defaults, and the rooms, as aligned text.
std::string listing(const PluginLibrary& library);

}  // namespace tessaly
