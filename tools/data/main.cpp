// tessaly-data: makes and checks the data files of the plug-in.
#include <fmt/format.h>

#include <CLI/CLI.hpp>
#include <cstdio>
#include <exception>
#include <string>
#include <vector>

#include "data/build_command.h"
#include "data/data_error.h"
#include "data/import_sofa.h"
#include "data/verify_command.h"

namespace {

using namespace tessaly::data;

constexpr int usageFailure = 2;

/// What the command line gives as words, shared by the building commands.
struct Words {
    std::vector<std::string> rates = {"44100", "48000", "24000"};
    std::string symmetry = "auto";
    std::string level = "rule";
    std::string headphoneRate = "48000";
};

void addSourceOptions(CLI::App& application, BuildCommand& command, Words& words) {
    CLI::Option* sofa =
        application
            .add_option("--sofa", command.source.sofa, "measured set, SOFA SimpleFreeFieldHRIR")
            ->capture_default_str();
    application
        .add_option("--wav-list", command.source.wavList,
                    "measured set as a text list of two-channel WAV files, left ear first; "
                    "lines: file azimuth_ccw elevation")
        ->excludes(sofa);
    application.add_option("--out", command.directory, "directory to write into")->required();
    application.add_flag("!--no-dfeq", command.hrirOptions.diffuseFieldEqualisation,
                         "leave loudspeaker and ear canal in: no diffuse-field equalisation");
    application
        .add_option("--symmetry", words.symmetry,
                    "average left and right: auto (if they differ by less than 1 dB), on, off")
        ->capture_default_str();
    application.add_option("--taps", command.hrirOptions.taps,
                           "length of each response instead of the engine's for the rate; 256 for "
                           "its long form, in a directory of its own");
    application
        .add_option("--gain", command.hrirOptions.gainDb, "dB on top of the reference level")
        ->capture_default_str();
    application.add_option("--lowest", command.hrirOptions.lowestElevation,
                           "elevation in degrees below which the measurement is not used");
}

void addRates(CLI::App& application, Words& words, const char* help) {
    application.add_option("--rates", words.rates, help)->delimiter(',')->capture_default_str();
}

void addTailOptions(CLI::App& application, BuildCommand& command, Words& words) {
    application.add_option("--tails", command.measuredTails,
                           "directory of measured tails, preset_15.wav to preset_60.wav and, for "
                           "details, tails.ini; other presets get a synthetic one");
    application.add_option("--wet", command.tailOptions.wetDb, "dB on top, of all tails")
        ->capture_default_str();
    application
        .add_option("--level", words.level,
                    "level of each tail: rule (by volume and decay), peak (0.9 each)")
        ->capture_default_str();
}

void addHeadphoneOptions(CLI::App& application, BuildCommand& command, Words& words) {
    application
        .add_option("--hp-rate", words.headphoneRate,
                    "rate that the headphone filters are made for; the engine uses them at all")
        ->capture_default_str();
    application.add_flag("--hp-flat-bass", command.headphoneOptions.flatBass,
                         "without the bass shelf of the settings");
    application.add_option("--hp-filter", command.filters,
                           "ROW=FILE: another filter for a row 1 to 10, a mono WAV file or a text "
                           "of lines \"Filter 1: ON PK Fc 105 Hz Gain 1.0 dB Q 0.70\"");
    application.add_flag("--hp-minimum-phase", command.minimumPhaseFilters,
                         "keep the level of such WAV files and drop their phase");
}

/// Sets what the words say.
void readWords(const Words& words, BuildCommand& command) {
    command.hrirOptions.symmetry = symmetryFromText(words.symmetry);
    command.tailOptions.level = tailLevelFromText(words.level);
    command.headphoneOptions.sampleRate = rateFromText(words.headphoneRate);
    for (const std::string& rate : words.rates) {
        command.rates.push_back(rateFromText(rate));
    }
}

/// Prints help, version, or in one line what cannot be understood; gives the exit code.
int answerTo(const CLI::App& application, const CLI::ParseError& error) {
    if (error.get_exit_code() == 0) {
        return application.exit(error);
    }
    std::string text = error.what();
    text = text.substr(0, text.find('\n'));
    const std::vector<std::string> unknown = application.remaining();
    if (application.get_subcommands().empty() && !unknown.empty()) {
        const bool option = unknown.front().rfind('-', 0) == 0;
        text = fmt::format("unknown {} \"{}\": all, hrir, tails, headphones or verify comes first",
                           option ? "option" : "subcommand", unknown.front());
    }
    std::fprintf(stderr, "tessaly-data: %s\n", text.c_str());
    return usageFailure;
}

int run(int argumentCount, char** arguments) {
    CLI::App application("Makes and checks the data files of the Tessaly plug-in", "tessaly-data");
    application.require_subcommand(1);
    application.set_version_flag("--version", TESSALY_VERSION_TEXT);

    BuildCommand command;
    command.source.sofa = defaultSofaPath;
    Words words;
    constexpr const char* hrirRates = "sample rates; of the HRIR files 44100 is always built";

    CLI::App* all = application.add_subcommand(
        "all", "Build everything: HRIR set, reverb tails, headphone filters");
    addSourceOptions(*all, command, words);
    addRates(*all, words, hrirRates);
    addTailOptions(*all, command, words);
    addHeadphoneOptions(*all, command, words);

    CLI::App* hrir = application.add_subcommand(
        "hrir", "Build the packed HRIR files TSLdata120.dat (44100 Hz), 121 (48000), 122 (24000)");
    addSourceOptions(*hrir, command, words);
    addRates(*hrir, words, hrirRates);

    CLI::App* tails = application.add_subcommand(
        "tails",
        "Build the packed reverb tails TSLdata510.dat (44100 Hz), 511 (48000), 512 (24000)");
    addSourceOptions(*tails, command, words);
    addRates(*tails, words, "sample rates");
    addTailOptions(*tails, command, words);

    CLI::App* headphones =
        application.add_subcommand("headphones", "Build the headphone filters and the small one");
    addSourceOptions(*headphones, command, words);
    addHeadphoneOptions(*headphones, command, words);

    std::filesystem::path directory;
    std::filesystem::path sofa;
    CLI::App* verify = application.add_subcommand(
        "verify", "Read a data directory as the plug-in does, measure it, print all figures");
    verify->add_option("directory", directory, "data directory")->required();
    verify->add_option("--sofa", sofa, "measured set to compare with, if not the recorded one");

    try {
        application.parse(argumentCount, arguments);
    } catch (const CLI::ParseError& error) {
        return answerTo(application, error);
    }
    if (verify->parsed()) {
        return runVerify(directory, sofa) ? 0 : 1;
    }
    command.hrir = all->parsed() || hrir->parsed();
    command.tails = all->parsed() || tails->parsed();
    command.headphones = all->parsed() || headphones->parsed();
    readWords(words, command);
    runBuild(command);
    return 0;
}

}  // namespace

int main(int argumentCount, char** arguments) {
    try {
        return run(argumentCount, arguments);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "tessaly-data: %s\n", error.what());
        return 1;
    }
}
