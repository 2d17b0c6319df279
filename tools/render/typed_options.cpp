// Reading numbers, places and names; refusing what makes no sense together.
#include "render/typed_options.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <optional>
#include <utility>

#include "render/rooms.h"
#include "render/text_numbers.h"

namespace tessaly {

namespace {

constexpr double longestDuration = 3600.0;  // seconds; everything is kept in memory
constexpr double farthest = 1000.0;         // metres
constexpr int smallestBlock = 32;
constexpr int largestBlock = 4096;
constexpr const char* everyRoomName = "all";

double numberIn(const std::string& text, const char* option, double low, double high) {
    const std::optional<double> number = numberFromText(text);
    if (!number) {
        throw UsageError(fmt::format("{} needs a number, got \"{}\"", option, text));
    }
    if (*number < low || *number > high) {
        throw UsageError(fmt::format("{} must be {:g} to {:g}, got {}", option, low, high, text));
    }
    return *number;
}

std::vector<double> numbersOf(const std::string& text, const char* option, std::size_t count) {
    const std::optional<std::vector<double>> numbers = numbersFromText(text);
    if (!numbers || numbers->size() != count) {
        throw UsageError(fmt::format("{} needs {} numbers with commas between, got \"{}\"", option,
                                     count, text));
    }
    return *numbers;
}

Vector3 pointOf(const std::string& text, const char* option) {
    const std::vector<double> numbers = numbersOf(text, option, 3);
    for (const double number : numbers) {
        if (std::abs(number) > farthest) {
            throw UsageError(fmt::format("{} must lie within {:g} m", option, farthest));
        }
    }
    return {numbers[0], numbers[1], numbers[2]};
}

int wholeNumber(const std::string& text, const char* option) {
    const double number = numberIn(text, option, 0.0, 1.0e6);
    if (number != std::floor(number)) {
        throw UsageError(fmt::format("{} needs a whole number, got \"{}\"", option, text));
    }
    return static_cast<int>(number);
}

double optional(
    const std::string& text, const char* option, double low, double high, double value) {
    return text.empty() ? value : numberIn(text, option, low, high);
}

void refuse(const std::string& text, const char* option, const char* kind) {
    if (!text.empty()) {
        throw UsageError(fmt::format("{} has no meaning for {}", option, kind));
    }
}

SourcePath fixedPath(const TypedOptions& typed) {
    if (!typed.atXyz.empty()) {
        return FixedPath{pointOf(typed.atXyz, "--at-xyz")};
    }
    const std::vector<double> at = numbersOf(typed.at, "--at", 3);
    if (std::abs(at[0]) > 360.0 || std::abs(at[1]) > 90.0 || at[2] < 0.0 || at[2] > farthest) {
        throw UsageError(
            fmt::format("--at takes azimuth -360 to 360, elevation -90 to 90 and distance 0 to "
                        "{:g} m, got \"{}\"",
                        farthest, typed.at));
    }
    return FixedPath{fromSpherical(at[0], at[1], at[2])};
}

SourcePath risePath(const TypedOptions& typed) {
    const std::vector<double> range = numbersOf(typed.rise, "--rise", 2);
    for (const double elevation : range) {
        if (elevation < -90.0 || elevation > 270.0) {
            throw UsageError(
                fmt::format("--rise takes elevations -90 to 270, got \"{}\"", typed.rise));
        }
    }
    RisePath rise;
    rise.fromElevation = range[0];
    rise.toElevation = range[1];
    rise.radius = optional(typed.radius, "--radius", 0.01, farthest, rise.radius);
    rise.azimuth = optional(typed.azimuth, "--azimuth", -360.0, 360.0, 0.0);
    return rise;
}

SourcePath orbitPath(const TypedOptions& typed) {
    OrbitPath orbit;
    orbit.radius = optional(typed.radius, "--radius", 0.01, farthest, orbit.radius);
    orbit.elevation = optional(typed.elevation, "--elevation", -90.0, 90.0, 0.0);
    orbit.startAzimuth = optional(typed.azimuth, "--azimuth", -360.0, 360.0, 0.0);
    orbit.turns = optional(typed.turns, "--turns", 0.0, 10000.0, orbit.turns);
    orbit.clockwise = typed.direction != "anticlockwise";
    return orbit;
}

// The path that the options name; an orbit if they name none.
SourcePath pathOf(const TypedOptions& typed) {
    const bool fixed = !typed.at.empty() || !typed.atXyz.empty();
    const bool line = !typed.from.empty() || !typed.to.empty();
    const bool rise = !typed.rise.empty();
    if ((!typed.at.empty() && !typed.atXyz.empty()) ||
        static_cast<int>(fixed) + static_cast<int>(line) + static_cast<int>(rise) +
                static_cast<int>(typed.orbit) >
            1) {
        throw UsageError("only one of --orbit, --from with --to, --at, --at-xyz and --rise");
    }
    const char* kind = fixed ? "a fixed position" : line ? "a line" : rise ? "a rise" : nullptr;
    if (kind != nullptr) {
        refuse(typed.turns, "--turns", kind);
        refuse(typed.period, "--period", kind);
        refuse(typed.elevation, "--elevation", kind);
        if (!rise) {
            refuse(typed.radius, "--radius", kind);
            refuse(typed.azimuth, "--azimuth", kind);
        }
    }
    if (fixed) {
        return fixedPath(typed);
    }
    if (line) {
        if (typed.from.empty() || typed.to.empty()) {
            throw UsageError("a line needs both --from and --to");
        }
        return LinePath{pointOf(typed.from, "--from"), pointOf(typed.to, "--to")};
    }
    return rise ? risePath(typed) : orbitPath(typed);
}

std::pair<std::string, float> settingOf(const std::string& text) {
    const std::size_t equals = text.find('=');
    if (equals == std::string::npos || equals == 0) {
        throw UsageError(fmt::format("--set needs NAME=VALUE, got \"{}\"", text));
    }
    const std::optional<double> value = numberFromText(std::string_view(text).substr(equals + 1));
    if (!value || std::abs(*value) > 1.0e30) {
        throw UsageError(fmt::format("--set needs a number after =, got \"{}\"", text));
    }
    return {text.substr(0, equals), static_cast<float>(*value)};
}

int roomOf(const std::string& text) {
    const std::optional<int> room = roomFromText(text);
    if (!room) {
        throw UsageError(fmt::format(
            "unknown room \"{}\": --list shows the {} rooms and their names", text, roomCount));
    }
    return *room;
}

int blockLengthOf(const std::string& text) {
    const int length = wholeNumber(text, "--block");
    if (length < smallestBlock || length > largestBlock || (length & (length - 1)) != 0) {
        throw UsageError(fmt::format("--block must be a power of two from {} to {}, got {}",
                                     smallestBlock, largestBlock, text));
    }
    return length;
}

int sampleRateOf(const std::string& text) {
    const int rate = wholeNumber(text, "--rate");
    if (rate != 24000 && rate != 44100 && rate != 48000) {
        throw UsageError(
            fmt::format("no data for {} Hz: --rate must be 24000, 44100 or 48000", text));
    }
    return rate;
}

SampleFormat formatOf(const std::string& text) {
    if (text.empty() || text == "float") {
        return SampleFormat::Float;
    }
    if (text == "16") {
        return SampleFormat::Int16;
    }
    if (text == "24") {
        return SampleFormat::Int24;
    }
    throw UsageError(fmt::format("--format must be float, 16 or 24, got \"{}\"", text));
}

void checkSource(const RenderOptions& options) {
    if (options.input.empty() == options.sound.empty()) {
        throw UsageError(options.sound.empty() ? "no sound given: name a file or use --sound"
                                               : "either a sound file or --sound, not both");
    }
    constexpr const char* known[] = {"pluck", "drums", "bursts", "speech"};
    const bool unknown =
        std::find(std::begin(known), std::end(known), options.sound) == std::end(known);
    if (!options.sound.empty() && unknown) {
        throw UsageError(
            fmt::format("unknown sound \"{}\": pluck, drums, bursts or speech", options.sound));
    }
}

void checkText(const RenderOptions& options, const TypedOptions& typed) {
    if (!typed.textGiven) {
        return;
    }
    if (options.sound != "speech") {
        throw UsageError("--text has no meaning without --sound speech");
    }
    if (typed.text.find_first_not_of(" \t\r\n") == std::string::npos) {
        throw UsageError("--text needs something to say");
    }
}

bool endsIn(const std::filesystem::path& file, const char* extension) {
    return foldedName(file.extension().string()) == extension;
}

void takeWavFile(RenderOptions& options, const TypedOptions& typed) {
    options.output = typed.output;
    if (!options.output.empty() && !endsIn(options.output, ".wav")) {
        throw UsageError("the output is a WAV file: " + typed.output + " must end in .wav");
    }
}

void takePicture(RenderOptions& options, const TypedOptions& typed) {
    if (typed.noPicture) {
        refuse(typed.picture, "--picture", "--no-picture");
        return;
    }
    if (typed.picture.empty()) {
        options.picture = options.output;
        if (!options.picture.empty()) {
            options.picture.replace_extension(".svg");
        }
        return;
    }
    options.picture = typed.picture;
    if (!endsIn(options.picture, ".svg")) {
        throw UsageError("the picture is an SVG file: " + typed.picture + " must end in .svg");
    }
}

void checkOneSound(RenderOptions& options, const TypedOptions& typed) {
    checkSource(options);
    checkText(options, typed);
    if (options.everyRoom) {
        refuse(typed.picture, "--picture", "--room all: each sound has its own");
        if (typed.output.empty() && typed.report.empty()) {
            throw UsageError("no output given: -o DIR for all rooms, or --report DIR");
        }
        options.output = typed.output;
        options.roomPictures = !typed.noPicture && !typed.output.empty();
        return;
    }
    if (typed.output.empty() && typed.report.empty()) {
        throw UsageError("no output given: -o FILE.wav or --report DIR");
    }
    takeWavFile(options, typed);
    takePicture(options, typed);
}

// What a scene file tells cannot be told by options too, but for rate and block length.
void checkScenes(RenderOptions& options, const TypedOptions& typed) {
    const std::pair<const std::string&, const char*> told[] = {
        {typed.input, "a sound file"},
        {typed.sound, "--sound"},
        {typed.at, "--at"},
        {typed.atXyz, "--at-xyz"},
        {typed.from, "--from"},
        {typed.to, "--to"},
        {typed.rise, "--rise"},
        {typed.radius, "--radius"},
        {typed.elevation, "--elevation"},
        {typed.azimuth, "--azimuth"},
        {typed.turns, "--turns"},
        {typed.period, "--period"},
        {typed.direction, "--direction"},
        {typed.room, "--room"},
        {typed.duration, "--duration"},
    };
    for (const auto& [text, option] : told) {
        refuse(text, option, "--scene: the file tells it");
    }
    refuse(typed.textGiven ? "given" : "", "--text", "--scene: the file tells it");
    refuse(typed.orbit ? "given" : "", "--orbit", "--scene: the file tells it");
    refuse(typed.loop ? "given" : "", "--loop", "--scene: the file tells it");
    refuse(typed.settings.empty() ? "" : typed.settings.front(), "--set",
           "--scene: the file tells it");
    refuse(typed.picture, "--picture", "--scene: use --report");
    if (typed.output.empty() && typed.report.empty()) {
        throw UsageError("no output given: -o FILE.wav or --report DIR");
    }
    if (typed.scenes.size() > 1 && !typed.output.empty()) {
        throw UsageError("-o takes one --scene: use --report DIR for several");
    }
    takeWavFile(options, typed);
}

void takeEffect(RenderOptions& options, const TypedOptions& typed) {
    options.everyRoom = foldedName(typed.room) == everyRoomName;
    options.room = options.everyRoom || typed.room.empty() ? 0 : roomOf(typed.room);
    for (const std::string& setting : typed.settings) {
        options.parameters.push_back(settingOf(setting));
    }
    options.rateGiven = !typed.rate.empty();
    if (options.rateGiven) {
        options.sampleRate = sampleRateOf(typed.rate);
    }
    options.blockGiven = !typed.block.empty();
    if (options.blockGiven) {
        options.blockLength = blockLengthOf(typed.block);
    }
    if (!typed.duration.empty()) {
        options.duration = numberIn(typed.duration, "--duration", 0.001, longestDuration);
    }
}

void takePath(RenderOptions& options, const TypedOptions& typed) {
    options.path = pathOf(typed);
    if (!typed.period.empty()) {
        if (!typed.turns.empty()) {
            throw UsageError("either --turns or --period, not both");
        }
        options.orbitPeriod = numberIn(typed.period, "--period", 0.01, longestDuration);
    }
}

}  // namespace

RenderOptions optionsFromTexts(const TypedOptions& typed,
                               const std::filesystem::path& defaultDataDirectory) {
    RenderOptions options;
    options.input = typed.input;
    options.sound = typed.sound;
    if (!typed.text.empty()) {
        options.text = typed.text;
    }
    options.scenes.assign(typed.scenes.begin(), typed.scenes.end());
    options.report = typed.report;
    if (typed.report.empty()) {
        refuse(typed.title, "--title", "sounds alone: use --report");
    }
    options.title = typed.title;
    options.dataDirectory =
        typed.data.empty() ? defaultDataDirectory : std::filesystem::path(typed.data);
    options.library = typed.library;
    options.loop = typed.loop;
    options.list = typed.list;
    options.verbose = typed.verbose;
    if (!typed.direction.empty() && typed.direction != "clockwise" &&
        typed.direction != "anticlockwise") {
        throw UsageError("--direction must be clockwise or anticlockwise, got \"" +
                         typed.direction + "\"");
    }
    takePath(options, typed);
    takeEffect(options, typed);
    options.format = formatOf(typed.format);
    if (options.list) {
        return options;
    }
    if (options.scenes.empty()) {
        checkOneSound(options, typed);
    } else {
        checkScenes(options, typed);
    }
    return options;
}

}  // namespace tessaly
