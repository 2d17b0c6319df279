// What the program does on request, each from checked options to finished files.
#pragma once

#include "render/options.h"

namespace tessaly {

// Files appear complete or not at all; nothing is written if one of these throws.
// All throw std::runtime_error with one line, or Interrupted.

/// One sound: a WAV file, a picture, a page.
void renderOneSound(const RenderOptions& options);

/// One sound in each of the rooms: a WAV file and a picture each, a page.
void renderEveryRoom(const RenderOptions& options);

/// Scenes: a WAV file of the only one, a page of all.
void renderScenes(const RenderOptions& options);

/// Prints effects, parameters and rooms.
void printListing(const RenderOptions& options);

}  // namespace tessaly
