// A game for benchmarks: the built library with its data, and effects that are fed blocks.
#include "plugin/game.h"

#include <time.h>

#include <cstdio>
#include <cstdlib>
#include <exception>
#include <filesystem>
#include <fstream>
#include <map>
#include <stdexcept>
#include <string>

#include "convolution/bench_noise.h"

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

/// The directory of the data set, empty if there is none.
fs::path findData(const fs::path& library) {
    const char* given = std::getenv("TESSALY_DATA");
    const fs::path data = given != nullptr && *given != '\0'
                              ? fs::path(given)
                              : (library.parent_path() / "../../data").lexically_normal();
    for (const char* name : {"TSLdata120.dat", "TSLdata121.dat", "TSLdata511.dat"}) {
        if (!fs::exists(data / name)) {
            std::fprintf(stderr,
                         "bench_plugin: left out, no data set in %s; tessaly-data all --out %s "
                         "makes one\n",
                         data.c_str(), data.c_str());
            return {};
        }
        readThrough(data / name);
    }
    return data;
}

std::vector<Candidate> openCandidates() {
    const fs::path built = PluginLibrary::locate("");
    const fs::path data = findData(built);
    std::vector<Candidate> opened;
    if (data.empty()) {
        return opened;
    }
    opened.push_back({"tessaly", PluginLibrary(built)});
    const char* other = std::getenv("TESSALY_AGAINST");
    if (other != nullptr && *other != '\0') {
        // A copy: also the same file has a state of its own then.
        opened.push_back({"against", PluginLibrary::privateCopy(PluginLibrary::locate(other))});
    }
    for (const Candidate& one : opened) {
        if (!one.library.setStreamingAssetsPath(data.string())) {
            throw std::runtime_error("the library refuses " + data.string());
        }
    }
    return opened;
}

HostBuffers& hostBuffers(std::uint32_t frames) {
    static std::map<std::uint32_t, HostBuffers> all;
    HostBuffers& buffers = all[frames];
    if (buffers.out.empty()) {
        const std::size_t samples = 2 * static_cast<std::size_t>(frames);
        buffers.silence.resize(samples);
        buffers.out.resize(samples);
        buffers.noise.resize(samples);
        fillNoise(buffers.noise.data(), samples);
        for (float& sample : buffers.noise) {
            sample *= 0.25f;
        }
    }
    return buffers;
}

}  // namespace

const std::vector<Candidate>& candidates() {
    static const std::vector<Candidate> opened = [] {
        try {
            return openCandidates();
        } catch (const std::exception& failure) {
            std::fprintf(stderr, "bench_plugin: %s\n", failure.what());
            std::exit(1);
        }
    }();
    return opened;
}

void expectNoError(benchmark::State& state, const PluginLibrary& library) {
    if (library.getErrorState() != 1) {
        state.SkipWithError("the library reports a failure");
    }
}

double threadSeconds() {
    timespec now{};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return static_cast<double>(now.tv_sec) + 1e-9 * static_cast<double>(now.tv_nsec);
}

Vector3 walk(int step, int source, int sources) {
    return fromSpherical((step * 7 + 360 * source / sources) % 360, (step + 11 * source) % 60 - 30,
                         1.0 + 0.01 * ((step + 37 * source) % 200));
}

Played::Played(const PluginLibrary& library, const char* effect, std::uint32_t blockLength)
    : frames_(blockLength),
      effect_(library.effect(effect), sampleRate, blockLength),
      buffers_(hostBuffers(blockLength)),
      in_(buffers_.silence.data()) {}

void Played::place(const Vector3& position) {
    Pose source;
    source.position = position;
    effect_.place(Pose{}, source);
}

void Played::feed(bool noise) { in_ = noise ? buffers_.noise.data() : buffers_.silence.data(); }

void Played::block() {
    if (effect_.processBlock(in_, buffers_.out.data(), frames_) != 0) {
        throw std::runtime_error("a block failed");
    }
}

}  // namespace tessaly::bench
