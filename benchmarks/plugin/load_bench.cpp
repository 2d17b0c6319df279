// The block that changes a room: the Process call that builds the new engine, swaps it in, deletes
// the old one and renders. Names: Load/<library>/<room>. From the room before it in the menu, at
// 48000 Hz in blocks of 1024, files in memory; each repetition is one change. Counters tell what an
// engine of the room holds: "heap_bytes" asked for, "resident_bytes" of memory in use after it has
// played for as long as its response, since pages that nobody touches cost nothing.
#include <benchmark/benchmark.h>

#include <fstream>
#include <map>
#include <string>
#include <utility>

#if defined(__GLIBC__)
#include <malloc.h>
#endif
#if defined(__linux__)
#include <unistd.h>
#endif

#include "plugin/game.h"
#include "render/rooms.h"

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

/// Bytes of memory in use by the program, to a page; 0 where nobody knows.
double residentBytes() {
#if defined(__linux__)
    double size = 0.0;
    double resident = 0.0;
    std::ifstream("/proc/self/statm") >> size >> resident;
    return resident * static_cast<double>(sysconf(_SC_PAGESIZE));
#else
    return 0.0;
#endif
}

struct Memory {
    double heap = 0.0;
    double resident = 0.0;
};

Memory memoryOf(const PluginLibrary& library, int room) {
    Played source(library, "Tessaly Engine", blockLength);
    source.feed(true);
#if defined(__GLIBC__)
    malloc_trim(0);  // pages that are free would be taken again unnoticed
#endif
    const double heap = heapInUse();
    const double resident = residentBytes();
    source.effect().setParameter("Room Selection", static_cast<float>(room));
    for (std::uint32_t frames = 0; frames < 5 * sampleRate; frames += blockLength) {
        source.block();
    }
    return {heapInUse() - heap, residentBytes() - resident};
}

void load(benchmark::State& state, const Candidate* candidate, int room) {
    static std::map<std::pair<std::string, int>, Memory> memory;
    Played source(candidate->library, "Tessaly Engine", blockLength);
    source.feed(true);
    for (auto _ : state) {
        source.effect().setParameter("Room Selection",
                                     static_cast<float>((room + roomCount - 1) % roomCount));
        source.block();
        source.block();
        source.effect().setParameter("Room Selection", static_cast<float>(room));
        const double start = threadSeconds();
        source.block();
        state.SetIterationTime(threadSeconds() - start);
    }
    const auto [entry, isNew] = memory.try_emplace({candidate->name, room});
    if (isNew) {
        entry->second = memoryOf(candidate->library, room);
    }
    state.SetLabel(std::string(roomAt(room).name));
    state.counters["heap_bytes"] = entry->second.heap;
    state.counters["resident_bytes"] = entry->second.resident;
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
