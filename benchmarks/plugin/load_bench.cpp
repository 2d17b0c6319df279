// The block that changes a room: the Process call that builds the new engine, swaps it in, deletes
// the old one and renders. Names: Load/<library>/<room>. From the room before it in the menu, at
// 48000 Hz in blocks of 1024, files in memory; each repetition is one change. The counter
// "heap_bytes" is what an engine of the room holds once it is loaded.
#include <benchmark/benchmark.h>

#include <chrono>
#include <map>
#include <string>
#include <utility>

#if defined(__GLIBC__)
#include <malloc.h>
#endif

#include "plugin/game.h"

namespace tessaly::bench {
namespace {

constexpr std::uint32_t blockLength = 1024;

/// Bytes in use on the heap, large blocks of their own included; 0 where nobody knows.
double heapInUse() {
#if defined(__GLIBC__) && __GLIBC_PREREQ(2, 33)
    const struct mallinfo2 info = mallinfo2();
    return static_cast<double>(info.uordblks) + static_cast<double>(info.hblkhd);
#else
    return 0.0;
#endif
}

double engineHeap(const PluginLibrary& library, int room) {
    Played source(library, "Tessaly Engine", blockLength);
    source.feed(true);
    const double before = heapInUse();
    source.effect().setParameter("Room Selection", static_cast<float>(room));
    source.block();
    source.block();
    return heapInUse() - before;
}

void load(benchmark::State& state, const Candidate* candidate, int room) {
    static std::map<std::pair<std::string, int>, double> heap;
    Played source(candidate->library, "Tessaly Engine", blockLength);
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
    const auto [entry, isNew] = heap.try_emplace({candidate->name, room}, 0.0);
    if (isNew) {
        entry->second = engineHeap(candidate->library, room);
    }
    state.counters["heap_bytes"] = entry->second;
    expectNoError(state, candidate->library);
}

const bool registered = [] {
    for (const Candidate& candidate : candidates()) {
        for (int room = 0; room < roomCount; ++room) {
            const std::string name = "Load/" + candidate.name + "/" + std::to_string(room);
            benchmark::RegisterBenchmark(name.c_str(), load, &candidate, room)
                ->Iterations(1)
                ->UseManualTime();
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
