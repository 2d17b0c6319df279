// tessaly-render: one moving source through the built library, into a sound file and a picture.
#include <fmt/format.h>
#include <unistd.h>

#include <algorithm>
#include <csignal>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <optional>
#include <stdexcept>
#include <system_error>

#include "demo_sounds/demo_sounds.h"
#include "demo_sounds/sound_file.h"
#include "demo_sounds/speech.h"
#include "render/binaural_measures.h"
#include "render/library_log.h"
#include "render/listing.h"
#include "render/offline_renderer.h"
#include "render/options.h"
#include "render/output_file.h"
#include "render/picture.h"
#include "render/progress.h"
#include "render/rooms.h"

namespace tessaly {
namespace {

constexpr double longestInput = 3600.0;  // seconds; everything is kept in memory
constexpr double defaultDuration = 8.0;  // seconds of a built-in sound
constexpr double finestHop = 0.02;       // seconds between the points of the picture
constexpr double mostPoints = 1000.0;    // in one picture
constexpr int usageFailure = 2;
constexpr int workFailure = 1;
constexpr int interruptedFailure = 130;

volatile std::sig_atomic_t interrupted = 0;

extern "C" void onSignal(int) { interrupted = 1; }

class Interrupted : public std::exception {};

std::filesystem::path defaultDataDirectory() {
    // Programs lie in build/<preset>/bin, the data in build/data.
    std::error_code ignored;
    const std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", ignored);
    return (program.parent_path() / ".." / ".." / "data").lexically_normal();
}

std::size_t framesOf(double seconds, int sampleRate) {
    const double frames = std::round(seconds * static_cast<double>(sampleRate));
    return static_cast<std::size_t>(std::max(frames, 1.0));
}

Sound loadInput(const RenderOptions& options) {
    const double rate = static_cast<double>(options.sampleRate);
    if (const std::optional<DemoSound> demo = demoSoundByName(options.sound)) {
        const double seconds = options.duration.value_or(defaultDuration);
        Sound sound;
        sound.sampleRate = rate;
        sound.samples = makeDemoSound(*demo, rate, framesOf(seconds, options.sampleRate));
        return sound;
    }
    if (options.sound == "speech") {
        return makeSpeech(options.text, rate);
    }
    return resampled(readSoundFile(options.input, options.duration.value_or(longestInput)), rate);
}

void repeatTo(Sound& sound, std::size_t frames) {
    const std::size_t once = sound.samples.size();
    const std::size_t wanted = frames * static_cast<std::size_t>(sound.channels);
    sound.samples.reserve(std::max(wanted, once));
    for (std::size_t i = 0; sound.samples.size() < wanted; ++i) {
        sound.samples.push_back(sound.samples[i]);
    }
}

RenderJob jobOf(const RenderOptions& options) {
    RenderJob job;
    job.dataDirectory = options.dataDirectory;
    job.sampleRate = options.sampleRate;
    job.blockLength = options.blockLength;
    job.room = options.room;
    job.parameters = options.parameters;
    job.path = options.path;
    job.input = loadInput(options);
    job.frames =
        options.duration ? framesOf(*options.duration, options.sampleRate) : job.input.frames();
    if (options.loop) {
        repeatTo(job.input, job.frames);
    }
    if (auto* orbit = std::get_if<OrbitPath>(&job.path); orbit && options.orbitPeriod) {
        const double seconds = static_cast<double>(job.frames) / options.sampleRate;
        orbit->turns = seconds / *options.orbitPeriod;
    }
    return job;
}

std::string pictureOf(const RenderOptions& options,
                      const RenderJob& job,
                      const RenderResult& result) {
    PictureContent content;
    const Room& room = roomAt(options.room);
    const double rate = static_cast<double>(options.sampleRate);
    content.title = fmt::format(
        "{}: {}", options.sound.empty() ? options.input.filename().string() : options.sound,
        describe(job.path));
    content.subtitle =
        fmt::format("Tessaly, {}, {} Hz, blocks of {} frames",
                    room.preset == 0 ? std::string("dry")
                                     : fmt::format("room {} ({})", options.room, room.name),
                    options.sampleRate, options.blockLength);
    for (const auto& [name, value] : options.parameters) {
        content.subtitle += fmt::format(", {} = {:g}", name, value);
    }
    content.path = job.path;
    content.duration = static_cast<double>(job.frames) / rate;
    const double hop = std::max(finestHop, content.duration / mostPoints);
    content.points = measureBinaural(result.stereo, rate, hop);
    return drawPicture(content);
}

void warn(const std::string& line) { fmt::print(stderr, "tessaly-render: warning: {}\n", line); }

void warnAbout(const RenderJob& job, const RenderResult& result, std::size_t cut) {
    if (result.allocations + result.releases > 0) {
        warn(fmt::format("the library made {} allocations and {} releases in normal blocks",
                         result.allocations, result.releases));
    }
    if (cut > 0) {
        warn(fmt::format("{} samples were cut at full scale: lower it, e.g. --set Gain=-6", cut));
    }
    const auto silent = [](float sample) { return sample == 0.0f; };
    const std::vector<float>& input = job.input.samples;
    if (std::all_of(result.stereo.begin(), result.stereo.end(), silent) &&
        !std::all_of(input.begin(), input.end(), silent)) {
        warn("the output is silent though the input is not");
    }
}

// The library writes its log while it works; a failure carries the last line of it.
RenderResult renderQuietly(const RenderOptions& options, const RenderJob& job) {
    LibraryLog log(options.verbose);
    try {
        const PluginLibrary library(PluginLibrary::locate(options.library));
        Progress progress(log.ownError(), "rendering");
        return render(library, job, [&](double fraction) {
            if (interrupted != 0) {
                throw Interrupted();
            }
            progress.update(fraction);
        });
    } catch (const std::runtime_error& failure) {
        const std::string line = log.lastLine();
        throw std::runtime_error(line.empty() ? failure.what()
                                              : fmt::format("{} (the library's last log line: {})",
                                                            failure.what(), line));
    }
}

void listQuietly(const RenderOptions& options) {
    const LibraryLog log(options.verbose);
    const PluginLibrary library(PluginLibrary::locate(options.library));
    fmt::print("{}", listing(library));
}

void refuseToOverwriteInput(const RenderOptions& options) {
    std::error_code ignored;
    if (!options.input.empty() &&
        std::filesystem::equivalent(options.input, options.output, ignored)) {
        throw std::runtime_error(
            fmt::format("{} is the input and cannot be the output too", options.output.string()));
    }
}

void renderToFiles(const RenderOptions& options) {
    // Everything that can be refused is refused before the work begins.
    PluginLibrary::locate(options.library);
    checkData(options.dataDirectory, options.sampleRate, options.room);
    refuseToOverwriteInput(options);
    PendingFile sound(options.output);
    std::optional<PendingFile> picture;
    if (!options.picture.empty()) {
        picture.emplace(options.picture);
    }
    const RenderJob job = jobOf(options);
    const RenderResult result = renderQuietly(options, job);
    const std::size_t cut = writeWav(sound, result.stereo, options.sampleRate, options.format);
    if (picture) {
        writeText(*picture, pictureOf(options, job, result));
        picture->complete();
    }
    sound.complete();
    warnAbout(job, result, cut);
    if (isatty(STDERR_FILENO) == 1) {
        fmt::print(stderr, "{}: {:.1f} s{}\n", options.output.string(),
                   static_cast<double>(job.frames) / options.sampleRate,
                   picture ? ", picture " + options.picture.string() : "");
    }
}

int run(int argumentCount, char** arguments) {
    try {
        const RenderOptions options =
            parseOptions(argumentCount, arguments, defaultDataDirectory());
        if (options.list) {
            listQuietly(options);
        } else {
            renderToFiles(options);
        }
        return 0;
    } catch (const HelpRequest& help) {
        fmt::print("{}", help.what());
        return 0;
    } catch (const UsageError& failure) {
        fmt::print(stderr, "tessaly-render: {}\n", failure.what());
        return usageFailure;
    } catch (const Interrupted&) {
        fmt::print(stderr, "tessaly-render: interrupted, nothing written\n");
        return interruptedFailure;
    } catch (const std::bad_alloc&) {
        fmt::print(stderr, "tessaly-render: out of memory\n");
        return workFailure;
    } catch (const std::exception& failure) {
        fmt::print(stderr, "tessaly-render: {}\n", failure.what());
        return workFailure;
    }
}

}  // namespace
}  // namespace tessaly

int main(int argumentCount, char** arguments) {
    std::signal(SIGINT, tessaly::onSignal);
    std::signal(SIGTERM, tessaly::onSignal);
    std::signal(SIGHUP, tessaly::onSignal);
    return tessaly::run(argumentCount, arguments);
}
