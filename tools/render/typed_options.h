// From the texts of the command line to what is to be done.
#pragma once

#include <string>
#include <vector>

#include "render/options.h"

namespace tessaly {

/// The texts as typed; numbers are read by ourselves so that each failure has its own plain line.
/// Empty: not given.
struct TypedOptions {
    std::string input;
    std::string sound;
    std::string text;
    bool textGiven = false;  ///< also if it is empty
    std::vector<std::string> scenes;
    std::string output;
    std::string report;
    std::string title;
    std::string data;
    std::string library;
    std::string at;
    std::string atXyz;
    std::string from;
    std::string to;
    std::string rise;
    std::string radius;
    std::string elevation;
    std::string azimuth;
    std::string turns;
    std::string period;
    std::string direction;
    std::string room;
    std::vector<std::string> settings;
    std::string rate;
    std::string block;
    std::string duration;
    std::string format;
    std::string picture;
    bool orbit = false;
    bool noPicture = false;
    bool loop = false;
    bool list = false;
    bool verbose = false;
};

/// Reads and checks all of it.
/// @param defaultDataDirectory  taken if none is given
/// @throws UsageError
RenderOptions optionsFromTexts(const TypedOptions& typed,
                               const std::filesystem::path& defaultDataDirectory);

}  // namespace tessaly
