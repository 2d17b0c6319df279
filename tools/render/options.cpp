// The command line's options and their help.
#include "render/options.h"

#include <CLI/CLI.hpp>

#include "render/typed_options.h"

namespace tessaly {

namespace {

// Of a message of several lines only the first is shown.
std::string firstLine(const std::string& text) { return text.substr(0, text.find('\n')); }

}  // namespace

RenderOptions parseOptions(int argumentCount,
                           const char* const* arguments,
                           const std::filesystem::path& defaultDataDirectory) {
    TypedOptions typed;
    CLI::App app{
        "Plays one moving sound source, or whole scenes, through the Tessaly library, block by "
        "block as a\ngame's mixer does, and writes what the two ears hear, with a picture of it or "
        "a page about it.\n"
        "Positions: +x right, +y up, +z ahead, metres; azimuth is positive to the right, "
        "degrees.",
        "tessaly-render"};
    app.add_option("input", typed.input,
                   "Sound file; of more than two channels the first two are used")
        ->type_name("FILE");
    app.add_option("--sound", typed.sound, "Built-in sound: pluck, drums, bursts or speech")
        ->type_name("NAME");
    const CLI::Option* text =
        app.add_option("--text", typed.text, "What speech says")->type_name("TEXT");
    app.add_option("--scene", typed.scenes,
                   "Scene file in place of one sound; may be repeated with --report")
        ->type_name("FILE.json")
        ->allow_extra_args(false);
    app.add_option("-o,--output", typed.output, "WAV file to write; a directory with --room all")
        ->type_name("FILE");
    app.add_option("--report", typed.report,
                   "Directory for a page, index.html, with sounds, pictures and measurements")
        ->type_name("DIR");
    app.add_option("--title", typed.title, "Heading of the page")->type_name("TEXT");
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

    app.add_option("--room", typed.room,
                   "Room by number or name, default 0: dry; all: one file a room")
        ->type_name("ROOM")
        ->group("Effect");
    app.add_option("--set", typed.settings,
                   "Parameter by name or index, e.g. \"Direct=-6\"; may be repeated, kept in order")
        ->type_name("NAME=VALUE")
        ->allow_extra_args(false)
        ->group("Effect");
    app.add_option("--rate", typed.rate, "24000, 44100 or 48000 (default) Hz; overrides a scene's")
        ->type_name("HZ")
        ->group("Effect");
    app.add_option("--block", typed.block,
                   "Frames a block, a power of two, default 512; overrides a scene's")
        ->type_name("N")
        ->group("Effect");
    app.add_option("--duration", typed.duration,
                   "Seconds; default: the sound file's or the speech's, 8 for built-in sounds")
        ->type_name("S")
        ->group("Effect");
    app.add_flag("--loop", typed.loop, "Repeat a sound that is shorter than the duration")
        ->group("Effect");

    app.add_option("--data", typed.data,
                   "Data directory; default: " + defaultDataDirectory.string())
        ->type_name("DIR")
        ->group("Files");
    app.add_option("--library", typed.library, "Library; default: ../lib/ beside this program")
        ->type_name("FILE")
        ->group("Files");
    app.add_flag("--list", typed.list, "Print effects, parameters and rooms, and stop");
    app.add_flag("--verbose", typed.verbose, "Show the library's log lines");

    try {
        app.parse(argumentCount, arguments);
    } catch (const CLI::CallForHelp&) {
        throw HelpRequest(app.help());
    } catch (const CLI::ParseError& error) {
        throw UsageError(firstLine(error.what()));
    }
    typed.textGiven = text->count() > 0;
    return optionsFromTexts(typed, defaultDataDirectory);
}

}  // namespace tessaly
