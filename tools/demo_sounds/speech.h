// Spoken demo signal, made by the espeak-ng program where it is installed.
#pragma once

#include <string>

#include "demo_sounds/sound_file.h"

namespace tessaly {

/// @returns true if the program is found in the search path
bool speechAvailable();

/// Speaks a text, mono, at the rate wanted, as loud as the demo signals but with peaks held within
/// full scale. Runs the program directly, not through a shell, so any text is safe.
/// @throws std::runtime_error if the program is missing or fails
Sound makeSpeech(const std::string& text, double sampleRate);

}  // namespace tessaly
