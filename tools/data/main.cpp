// tessaly-data: makes and checks the data files of the plug-in.
#include <CLI/CLI.hpp>
#include <cstdio>
#include <exception>

#include "data/data_error.h"
#include "data/hrir_command.h"
#include "data/import_sofa.h"
#include "data/verify_command.h"

namespace {

using namespace tessaly::data;

/// What the command line gives as words.
struct HrirWords {
    std::vector<std::string> rates = {"44100", "48000", "24000"};
    std::string symmetry = "auto";
};

void addHrirCommand(CLI::App& application, HrirCommand& command, HrirWords& words) {
    CLI::App* hrir = application.add_subcommand(
        "hrir", "Build the packed HRIR files TSLdata120.dat (44100 Hz), 121 (48000), 122 (24000)");
    command.source.sofa = defaultSofaPath;
    CLI::Option* sofa =
        hrir->add_option("--sofa", command.source.sofa, "measured set, SOFA SimpleFreeFieldHRIR")
            ->capture_default_str();
    hrir->add_option("--wav-list", command.source.wavList,
                     "measured set as a text list of two-channel WAV files, left ear first; "
                     "lines: file azimuth_ccw elevation")
        ->excludes(sofa);
    hrir->add_option("--out", command.directory, "directory to write into")->required();
    hrir->add_option("--rates", words.rates, "sample rates; 44100 is always built")
        ->delimiter(',')
        ->capture_default_str();
    hrir->add_flag("!--no-dfeq", command.options.diffuseFieldEqualisation,
                   "leave loudspeaker and ear canal in: no diffuse-field equalisation");
    hrir->add_option("--symmetry", words.symmetry,
                     "average left and right: auto (if they differ by less than 1 dB), on, off")
        ->capture_default_str();
    hrir->add_option("--taps", command.options.taps,
                     "length of each response instead of the engine's for the rate; 256 for its "
                     "long form, in a directory of its own");
    hrir->add_option("--gain", command.options.gainDb, "dB on top of the reference level")
        ->capture_default_str();
    hrir->add_option("--lowest", command.options.lowestElevation,
                     "elevation in degrees below which the measurement is not used");
}

int run(int argumentCount, char** arguments) {
    CLI::App application("Makes and checks the data files of the Tessaly plug-in", "tessaly-data");
    application.require_subcommand(1);
    application.set_version_flag("--version", TESSALY_VERSION_TEXT);

    HrirCommand hrir;
    HrirWords words;
    addHrirCommand(application, hrir, words);

    std::filesystem::path directory;
    std::filesystem::path sofa;
    CLI::App* verify = application.add_subcommand(
        "verify", "Read a data directory as the plug-in does, measure it, print all figures");
    verify->add_option("directory", directory, "data directory")->required();
    verify->add_option("--sofa", sofa, "measured set to compare with, if not the recorded one");

    CLI11_PARSE(application, argumentCount, arguments);
    if (verify->parsed()) {
        return runVerify(directory, sofa) ? 0 : 1;
    }
    hrir.options.symmetry = symmetryFromText(words.symmetry);
    for (const std::string& rate : words.rates) {
        hrir.rates.push_back(rateFromText(rate));
    }
    runHrir(hrir);
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
