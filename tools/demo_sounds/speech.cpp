// Runs espeak-ng into a temporary file and reads it back.
#include "demo_sounds/speech.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <sstream>
#include <stdexcept>
#include <vector>

#include "demo_sounds/demo_sounds.h"

namespace tessaly {

namespace {

constexpr const char* program = "espeak-ng";
constexpr double longestSpeech = 600.0;  // seconds
constexpr double highestPeak = 0.98;

// A file of our own that is gone when the object is.
class TemporaryFile {
public:
    TemporaryFile() {
        const std::filesystem::path folder = std::filesystem::temp_directory_path();
        std::string pattern = (folder / "tessaly-speech-XXXXXX").string();
        const int descriptor = mkstemp(pattern.data());
        if (descriptor < 0) {
            throw std::runtime_error("cannot make a temporary file in " + folder.string());
        }
        close(descriptor);
        path = pattern;
    }
    ~TemporaryFile() {
        std::error_code ignored;
        std::filesystem::remove(path, ignored);
    }
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    std::filesystem::path path;
};

// Output of the program goes nowhere: a sound server it may look for is none of our business.
bool runSilently(std::vector<std::string> words) {
    std::vector<char*> arguments;
    for (std::string& word : words) {
        arguments.push_back(word.data());
    }
    arguments.push_back(nullptr);
    posix_spawn_file_actions_t actions{};
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
    pid_t child = 0;
    const int failure = posix_spawnp(&child, program, &actions, nullptr, arguments.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    if (failure != 0) {
        return false;
    }
    int status = 0;
    while (waitpid(child, &status, 0) < 0) {
        if (errno != EINTR) {
            return false;
        }
    }
    return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

}  // namespace

bool speechAvailable() {
    const char* searchPath = std::getenv("PATH");
    std::istringstream folders(searchPath != nullptr ? searchPath : "");
    for (std::string folder; std::getline(folders, folder, ':');) {
        if (!folder.empty() && access((folder + "/" + program).c_str(), X_OK) == 0) {
            return true;
        }
    }
    return false;
}

Sound makeSpeech(const std::string& text, double sampleRate) {
    if (!speechAvailable()) {
        throw std::runtime_error("speech needs the program espeak-ng, which is not installed");
    }
    const TemporaryFile file;
    if (!runSilently({program, "-v", "en", "-s", "150", "-w", file.path.string(), "--", text})) {
        throw std::runtime_error("espeak-ng failed to speak");
    }
    Sound sound = resampled(readSoundFile(file.path, longestSpeech), sampleRate);
    double peak = 0.0;
    for (const float sample : sound.samples) {
        peak = std::max(peak, std::abs(static_cast<double>(sample)));
    }
    if (peak > 0.0) {
        const double factor = std::min(demoSoundRms / rmsOf(sound.samples), highestPeak / peak);
        for (float& sample : sound.samples) {
            sample = static_cast<float>(static_cast<double>(sample) * factor);
        }
    }
    return sound;
}

}  // namespace tessaly
