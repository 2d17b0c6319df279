// What the user asks of the renderer, read from the command line.
#pragma once

#include <filesystem>
#include <optional>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "render/output_file.h"
#include "render/source_path.h"

namespace tessaly {

struct RenderOptions {
    std::filesystem::path input;  ///< sound file; empty if a built-in sound is wanted
    std::string sound;            ///< "pluck", "drums", "bursts" or "speech"; empty for a file
    std::string text =            ///< what speech says
        "The sound moves round your head, from the front to the right, behind you, "
        "and back along the left.";
    std::vector<std::filesystem::path> scenes;  ///< scene files in place of one sound
    std::filesystem::path output;  ///< WAV file to write, empty for none; a directory for all rooms
    std::filesystem::path picture;  ///< SVG file to write; empty for none
    std::filesystem::path report;   ///< directory of the page to write; empty for none
    std::string title;              ///< of the page; empty: told by what is on it
    SampleFormat format = SampleFormat::Float;
    SourcePath path = OrbitPath{};
    std::optional<double> orbitPeriod;  ///< seconds a turn; decides the turns with the duration
    int room = 0;
    bool everyRoom = false;     ///< one sound file a room
    bool roomPictures = false;  ///< with everyRoom: a picture beside each
    std::vector<std::pair<std::string, float>> parameters;  ///< name or index and value, in order
    int sampleRate = 48000;
    int blockLength = 512;
    bool rateGiven = false;          ///< a scene plays at sampleRate, not at its own
    bool blockGiven = false;         ///< likewise
    std::optional<double> duration;  ///< seconds
    bool loop = false;               ///< repeat an input shorter than the duration
    std::filesystem::path dataDirectory;
    std::string library;  ///< empty: look beside the program
    bool list = false;
    bool verbose = false;
};

/// A request that cannot be understood; what() is one line.
class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// Text to print on standard output in place of any work: the help.
class HelpRequest : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// Reads and checks the command line.
/// @param defaultDataDirectory  taken if none is given
/// @throws UsageError, HelpRequest
RenderOptions parseOptions(int argumentCount,
                           const char* const* arguments,
                           const std::filesystem::path& defaultDataDirectory);

}  // namespace tessaly
