// The block that changes a room: the Process call that builds the new engine, swaps it in, deletes
// the old one and renders. Names: Load/<room>. From the room before it in the menu, at 48000 Hz in
// blocks of 1024, files in memory; each repetition is one change.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <string>
#include <vector>

#include "plugin/game.h"

namespace tessaly::bench {
namespace {

constexpr std::uint32_t blockLength = 1024;

void load(benchmark::State& state, int room) {
    Played source("Tessaly Engine", blockLength);
    source.feed(true);
    for (auto _ : state) {
        source.effect().setParameter("Room Selection",
                                     static_cast<float>((room + roomCount - 1) % roomCount));
        source.block();
        source.block();
        source.effect().setParameter("Room Selection", static_cast<float>(room));
        const auto start = std::chrono::steady_clock::now();
        source.block();
        state.SetIterationTime(
            std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
    }
    expectNoError(state);
}

const bool registered = [] {
    if (library() == nullptr) {
        return false;
    }
    for (int room = 0; room < roomCount; ++room) {
        benchmark::RegisterBenchmark(("Load/" + std::to_string(room)).c_str(), load, room)
            ->Iterations(1)
            ->UseManualTime()
            ->ComputeStatistics("max", [](const std::vector<double>& times) {
                return *std::max_element(times.begin(), times.end());
            });
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
