// One block of zita-convolver under the same responses, still, mono to two ears.
// Names: Convolver/still/<zita_uniform, zita_measured or zita_default>/<block length>/<taps>: all
// partitions of the block's length in vector mode, the same with transforms whose plans it
// measures, or the partitions it chooses by itself and no option. In the last form a thread for
// each larger partition size works beside the caller. A block here waits for what they still owe,
// and the time is that of the processor for all threads of the program.
#include <benchmark/benchmark.h>
#include <unistd.h>
#include <zita-convolver.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "convolution/convolver.h"

namespace tessaly::bench {
namespace {

/// All threads of the program but this one are asleep.
bool othersWait() {
    const std::string self = std::to_string(gettid());
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/task")) {
        if (entry.path().filename() == self) {
            continue;
        }
        std::ifstream file(entry.path() / "stat");
        std::string number;
        std::string name;
        std::string state;
        file >> number >> name >> state;
        if (state == "R") {
            return false;
        }
    }
    return true;
}

struct Form {
    const char* name;
    bool uniform;
    std::uint32_t options;
};
constexpr Form forms[] = {
    {"zita_uniform", true, Convproc::OPT_VECTOR_MODE},
    {"zita_measured", true, Convproc::OPT_VECTOR_MODE | Convproc::OPT_FFTW_MEASURE},
    {"zita_default", false, 0}};

class Peer {
public:
    Peer(const Form& form, std::int32_t blockLength, std::int32_t taps)
        : length_(static_cast<std::size_t>(blockLength)) {
        // Plans as it makes them, not those that another row has measured.
        fftwf_forget_wisdom();
        const auto block = static_cast<std::uint32_t>(blockLength);
        const std::uint32_t largest = form.uniform ? block : std::uint32_t{Convproc::MAXPART};
        process_.set_options(form.options);
        good_ = process_.configure(1, 2, static_cast<std::uint32_t>(taps), block, block, largest,
                                   0.0f) == 0;
        for (unsigned ear = 0; ear < 2; ++ear) {
            std::vector<float> response = noiseResponse(taps, ear);
            good_ = good_ && process_.impdata_create(0, ear, 1, response.data(), 0, taps) == 0;
        }
        good_ = good_ && process_.start_process(0, SCHED_OTHER) == 0;
        // Stopped before it has begun a thread would go on after its memory.
        while (!othersWait()) {
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
    }
    ~Peer() {
        process_.stop_process();
        while (process_.state() == Convproc::ST_WAIT && !process_.check_stop()) {
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        process_.cleanup();
    }
    Peer(const Peer&) = delete;
    Peer& operator=(const Peer&) = delete;

    bool good() const { return good_; }
    void block(const float* input) {
        std::copy_n(input, length_, process_.inpdata(0));
        good_ = process_.process(true) == 0 && good_;
    }
    const float* output(unsigned ear) const { return process_.outdata(ear); }

private:
    std::size_t length_;
    bool good_ = false;
    Convproc process_;
};

/// Both convolvers must have made the same sound, at our scale of 2B.
bool agrees(const Convolver& ours, const Peer& peer, std::int32_t blockLength) {
    const float scale = 1.0f / (2.0f * static_cast<float>(blockLength));
    for (unsigned ear = 0; ear < 2; ++ear) {
        float largest = 0.0f;
        float difference = 0.0f;
        for (std::int32_t i = 0; i < blockLength; ++i) {
            const float expected = ours.output(ear)[i] * scale;
            largest = std::max(largest, std::abs(expected));
            difference = std::max(difference, std::abs(peer.output(ear)[i] - expected));
        }
        if (!(difference <= 1e-4f * largest)) {
            return false;
        }
    }
    return true;
}

void convolve(benchmark::State& state,
              const Form& form,
              std::int32_t blockLength,
              std::int32_t taps) {
    Peer peer(form, blockLength, taps);
    Convolver ours(blockLength, taps);
    InputBlocks input(blockLength);
    for (std::int32_t k = 0; k < taps; k += blockLength) {
        const float* const block = input.next();
        ours.still(block);
        peer.block(block);
    }
    if (!peer.good() || !agrees(ours, peer, blockLength)) {
        state.SkipWithError("its output differs from ours");
        return;
    }
    for (auto _ : state) {
        peer.block(input.next());
        benchmark::ClobberMemory();
    }
}

const bool registered = [] {
    for (const std::int32_t blockLength : blockLengths) {
        for (const std::int32_t taps : tapCounts) {
            for (const Form& form : forms) {
                const std::string name = std::string("Convolver/still/") + form.name + "/" +
                                         std::to_string(blockLength) + "/" + std::to_string(taps);
                benchmark::RegisterBenchmark(name.c_str(), convolve, form, blockLength, taps)
                    ->MeasureProcessCPUTime();
            }
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
