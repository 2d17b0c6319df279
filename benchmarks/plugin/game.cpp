// A game for benchmarks: the built library with its data, and effects that are fed blocks.
#include "plugin/game.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <filesystem>
#include <fstream>
#include <memory>
#include <stdexcept>
#include <string>

#include "convolution/bench_noise.h"
#include "minihost/pose.h"

namespace tessaly::bench {

namespace {

namespace fs = std::filesystem;

/// So that a load finds the file in memory, as in a game's second round.
void readThrough(const fs::path& file) {
    std::ifstream stream(file, std::ios::binary);
    std::vector<char> piece(1 << 20);
    while (stream.read(piece.data(), static_cast<std::streamsize>(piece.size()))) {
    }
}

std::unique_ptr<PluginLibrary> openLibrary() {
    auto opened = std::make_unique<PluginLibrary>(PluginLibrary::locate(""));
    const char* given = std::getenv("TESSALY_DATA");
    const fs::path data = given != nullptr && *given != '\0'
                              ? fs::path(given)
                              : (opened->file().parent_path() / "../../data").lexically_normal();
    for (const char* name : {"TSLdata120.dat", "TSLdata121.dat", "TSLdata511.dat"}) {
        if (!fs::exists(data / name)) {
            std::fprintf(stderr,
                         "bench_plugin: left out, no data set in %s; tessaly-data all --out %s "
                         "makes one\n",
                         data.c_str(), data.c_str());
            return nullptr;
        }
        readThrough(data / name);
    }
    if (!opened->setStreamingAssetsPath(data.string())) {
        throw std::runtime_error("the library refuses " + data.string());
    }
    return opened;
}

}  // namespace

const PluginLibrary* library() {
    static const std::unique_ptr<PluginLibrary> opened = [] {
        try {
            return openLibrary();
        } catch (const std::exception& failure) {
            std::fprintf(stderr, "bench_plugin: %s\n", failure.what());
            std::exit(1);
        }
    }();
    return opened.get();
}

void expectNoError(benchmark::State& state) {
    if (library()->getErrorState() != 1) {
        state.SkipWithError("the library reports a failure");
    }
}

Played::Played(const char* effect, std::uint32_t blockLength)
    : frames_(blockLength),
      effect_(library()->effect(effect), sampleRate, blockLength),
      in_(2 * static_cast<std::size_t>(blockLength)),
      out_(in_.size()) {}

void Played::place(double azimuth, double elevation, double distance) {
    Pose source;
    source.position = fromSpherical(azimuth, elevation, distance);
    effect_.place(Pose{}, source);
}

void Played::feed(bool noise) {
    fillNoise(in_.data(), in_.size());
    for (float& sample : in_) {
        sample = noise ? 0.25f * sample : 0.0f;
    }
}

void Played::block() {
    if (effect_.processBlock(in_.data(), out_.data(), frames_) != 0) {
        throw std::runtime_error("a block failed");
    }
}

}  // namespace tessaly::bench
