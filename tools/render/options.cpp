// Command line of the renderer.
#include "render/options.h"

#include <fmt/format.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cmath>

#include "render/rooms.h"
#include "render/text_numbers.h"

namespace tessaly {

namespace {

constexpr double longestDuration = 3600.0;  // seconds; everything is kept in memory
constexpr double farthest = 1000.0;         // metres
constexpr int smallestBlock = 32;
constexpr int largestBlock = 4096;

// The texts as typed; numbers are read by ourselves so that each failure has its own plain line.
struct Typed {
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
    std::string direction = "clockwise";
    std::string room = "0";
    std::vector<std::string> settings;
    std::string rate = "48000";
    std::string block = "512";
    std::string duration;
    std::string format = "float";
    std::string picture;
    bool orbit = false;
    bool noPicture = false;
};

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

SourcePath fixedPath(const Typed& typed) {
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

SourcePath risePath(const Typed& typed) {
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

SourcePath orbitPath(const Typed& typed) {
    OrbitPath orbit;
    orbit.radius = optional(typed.radius, "--radius", 0.01, farthest, orbit.radius);
    orbit.elevation = optional(typed.elevation, "--elevation", -90.0, 90.0, 0.0);
    orbit.startAzimuth = optional(typed.azimuth, "--azimuth", -360.0, 360.0, 0.0);
    orbit.turns = optional(typed.turns, "--turns", 0.0, 10000.0, orbit.turns);
    orbit.clockwise = typed.direction == "clockwise";
    return orbit;
}

// The path that the options name; an orbit if they name none.
SourcePath pathOf(const Typed& typed) {
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
    if (text == "float") {
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

void checkOutput(RenderOptions& options, const Typed& typed) {
    if (options.output.empty()) {
        throw UsageError("no output given: -o FILE.wav");
    }
    if (foldedName(options.output.extension().string()) != ".wav") {
        throw UsageError("the output is a WAV file: " + options.output.string() +
                         " must end in .wav");
    }
    if (typed.noPicture) {
        refuse(typed.picture, "--picture", "--no-picture");
        return;
    }
    options.picture = typed.picture.empty() ? options.output : std::filesystem::path(typed.picture);
    if (typed.picture.empty()) {
        options.picture.replace_extension(".svg");
    } else if (foldedName(options.picture.extension().string()) != ".svg") {
        throw UsageError("the picture is an SVG file: " + typed.picture + " must end in .svg");
    }
}

void complete(RenderOptions& options, const Typed& typed) {
    options.path = pathOf(typed);
    if (!typed.period.empty()) {
        if (!typed.turns.empty()) {
            throw UsageError("either --turns or --period, not both");
        }
        options.orbitPeriod = numberIn(typed.period, "--period", 0.01, longestDuration);
    }
    options.room = roomOf(typed.room);
    for (const std::string& setting : typed.settings) {
        options.parameters.push_back(settingOf(setting));
    }
    options.sampleRate = sampleRateOf(typed.rate);
    options.blockLength = blockLengthOf(typed.block);
    options.format = formatOf(typed.format);
    if (!typed.duration.empty()) {
        options.duration = numberIn(typed.duration, "--duration", 0.001, longestDuration);
    }
    if (!options.list) {
        checkSource(options);
        checkOutput(options, typed);
    }
}

// Of a message of several lines only the first is shown.
std::string firstLine(const std::string& text) { return text.substr(0, text.find('\n')); }

}  // namespace

RenderOptions parseOptions(int argumentCount,
                           const char* const* arguments,
                           const std::filesystem::path& defaultDataDirectory) {
    RenderOptions options;
    options.dataDirectory = defaultDataDirectory;
    options.text =
        "The sound moves round your head, from the front to the right, behind you, "
        "and back along the left.";
    Typed typed;
    std::string input;
    std::string output;
    std::string data;

    CLI::App app{
        "Plays one moving sound source through the Tessaly library, block by block as a "
        "game's mixer does,\nand writes what the two ears hear, with a picture of it.\n"
        "Positions: +x right, +y up, +z ahead, metres; azimuth is positive to the right, "
        "degrees.",
        "tessaly-render"};
    app.add_option("input", input, "Sound file; of more than two channels the first two are used")
        ->type_name("FILE");
    app.add_option("--sound", options.sound, "Built-in sound: pluck, drums, bursts or speech")
        ->type_name("NAME");
    app.add_option("--text", options.text, "What speech says")->type_name("TEXT");
    app.add_option("-o,--output", output, "WAV file to write")->type_name("FILE");
    app.add_option("--format", typed.format, "Samples: float (default), 16 or 24 bits")
        ->type_name("NAME");
    app.add_option("--picture", typed.picture, "SVG to write; default: the output's name")
        ->type_name("FILE");
    app.add_flag("--no-picture", typed.noPicture, "Write no picture");

    app.add_flag("--orbit", typed.orbit, "Circle round the head (default)")->group("Path");
    app.add_option("--radius", typed.radius, "Orbit, rise: metres from the head, default 1.5")
        ->type_name("M")
        ->group("Path");
    app.add_option("--turns", typed.turns, "Orbit: turns in all, default 1")
        ->type_name("N")
        ->group("Path");
    app.add_option("--period", typed.period, "Orbit: seconds a turn, in place of --turns")
        ->type_name("S")
        ->group("Path");
    app.add_option("--elevation", typed.elevation, "Orbit: degrees above the ears, default 0")
        ->type_name("DEG")
        ->group("Path");
    app.add_option("--azimuth", typed.azimuth, "Orbit: where it starts; rise: its plane; default 0")
        ->type_name("DEG")
        ->group("Path");
    app.add_option("--direction", typed.direction, "Orbit: clockwise (default) or anticlockwise")
        ->type_name("NAME")
        ->group("Path");
    app.add_option("--from", typed.from, "Straight path: its start")
        ->type_name("X,Y,Z")
        ->group("Path");
    app.add_option("--to", typed.to, "Straight path: its end")->type_name("X,Y,Z")->group("Path");
    app.add_option("--at", typed.at, "Fixed position by azimuth, elevation, distance")
        ->type_name("AZ,EL,M")
        ->group("Path");
    app.add_option("--at-xyz", typed.atXyz, "Fixed position")->type_name("X,Y,Z")->group("Path");
    app.add_option("--rise", typed.rise,
                   "Arc over the head between two elevations; past 90 it goes down the far side")
        ->type_name("EL,EL")
        ->group("Path");

    app.add_option("--room", typed.room, "Room by number or name, default 0: dry")
        ->type_name("ROOM")
        ->group("Effect");
    app.add_option("--set", typed.settings,
                   "Parameter by name or index, e.g. \"Direct=-6\"; may be repeated, kept in order")
        ->type_name("NAME=VALUE")
        ->allow_extra_args(false)
        ->group("Effect");
    app.add_option("--rate", typed.rate, "24000, 44100 or 48000 (default) Hz")
        ->type_name("HZ")
        ->group("Effect");
    app.add_option("--block", typed.block, "Frames a block, a power of two, default 512")
        ->type_name("N")
        ->group("Effect");
    app.add_option("--duration", typed.duration,
                   "Seconds; default: the sound file's or the speech's, 8 for built-in sounds")
        ->type_name("S")
        ->group("Effect");
    app.add_flag("--loop", options.loop, "Repeat a sound that is shorter than the duration")
        ->group("Effect");

    app.add_option("--data", data, "Data directory; default: " + defaultDataDirectory.string())
        ->type_name("DIR")
        ->group("Files");
    app.add_option("--library", options.library, "Library; default: ../lib/ beside this program")
        ->type_name("FILE")
        ->group("Files");
    app.add_flag("--list", options.list, "Print effects, parameters and rooms, and stop");
    app.add_flag("--verbose", options.verbose, "Show the library's log lines");

    try {
        app.parse(argumentCount, arguments);
    } catch (const CLI::CallForHelp&) {
        throw HelpRequest(app.help());
    } catch (const CLI::ParseError& error) {
        throw UsageError(firstLine(error.what()));
    }
    if (typed.direction != "clockwise" && typed.direction != "anticlockwise") {
        throw UsageError("--direction must be clockwise or anticlockwise, got \"" +
                         typed.direction + "\"");
    }
    options.input = input;
    options.output = output;
    if (!data.empty()) {
        options.dataDirectory = data;
    }
    complete(options, typed);
    return options;
}

}  // namespace tessaly
