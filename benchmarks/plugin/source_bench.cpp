// One block of some sources, the whole Process call of each.
// Names: Source/<library>/<room>/<still, moving, leaving or silent>/<sources>/<block length>. A
// moving source goes round the head within 3 m, faster than things usually move; a leaving one is
// so far away that the level of the tail changes too; a silent one stands still and has been silent
// for longer than its response. Rooms: none, a hall's reflections without its tail, that hall with
// its 1.5 s, and 4.6 s of tail.
#include <benchmark/benchmark.h>

#include <memory>
#include <string>
#include <vector>

#include "plugin/game.h"

namespace tessaly::bench {
namespace {

enum class Motion { still, moving, leaving, silent };

struct Room {
    const char* name;
    float selection;
    bool tail;
    std::uint32_t response;  ///< frames
    int mostSources;
};
// clang-format off
constexpr Room rooms[] = {{"dry",         0.0f,          true,  128,    256},
                          {"reflections", hallSelection, false, 8192,   256},
                          {"hall",        hallSelection, true,  74340,  16},
                          {"longest",     31.0f,         true,  220245, 1}};
// clang-format on
constexpr const char* motionNames[] = {"still", "moving", "leaving", "silent"};

Vector3 start(int source, int sources) {
    return fromSpherical(30 + 360 * source / sources, 10.0, 2.0);
}

std::unique_ptr<Played> sourceIn(const Room& room,
                                 const PluginLibrary& library,
                                 std::uint32_t blockLength) {
    auto one = std::make_unique<Played>(library, "Tessaly Engine", blockLength);
    one->effect().setParameter("Room Selection", room.selection);
    one->effect().setParameter("Reverb disable", room.tail ? 0.0f : 1.0f);
    one->feed(true);
    return one;
}

void source(benchmark::State& state,
            const Candidate* candidate,
            const Room& room,
            Motion motion,
            int sources,
            std::uint32_t blockLength) {
    std::vector<std::unique_ptr<Played>> all;
    // Until every input that the response reaches is noise.
    const std::uint32_t warmUp = room.response / blockLength + 4;
    for (int k = 0; k < sources; ++k) {
        all.push_back(sourceIn(room, candidate->library, blockLength));
        all.back()->place(start(k, sources));
        for (std::uint32_t block = 0; block < warmUp; ++block) {
            all.back()->block();
        }
        if (motion == Motion::silent) {
            all.back()->feed(false);
            for (std::uint32_t block = 0; block < 6 * sampleRate / blockLength; ++block) {
                all.back()->block();
            }
        }
    }
    int step = 0;
    for (auto _ : state) {
        for (int k = 0; k < sources; ++k) {
            Played& one = *all[static_cast<std::size_t>(k)];
            if (motion == Motion::moving) {
                one.place(walk(step, k, sources));
            } else if (motion == Motion::leaving) {
                one.place(fromSpherical(step * 7 % 360, 0.0, 14.0 + 0.01 * (step % 1000)));
            }
            one.block();
        }
        ++step;
    }
    expectNoError(state, candidate->library);
}

void add(const Candidate& candidate,
         const Room& room,
         Motion motion,
         int sources,
         std::uint32_t blockLength) {
    const std::string name = "Source/" + candidate.name + "/" + room.name + "/" +
                             motionNames[static_cast<int>(motion)] + "/" + std::to_string(sources) +
                             "/" + std::to_string(blockLength);
    benchmark::internal::Benchmark* const row = benchmark::RegisterBenchmark(
        name.c_str(), source, &candidate, room, motion, sources, blockLength);
    // Each try of a longer run would set all sources up again.
    constexpr int turns = 2048;
    if (sources > 1) {
        row->Iterations(turns / sources);
    }
}

const bool registered = [] {
    const std::vector<Candidate>& all = candidates();
    for (const Candidate& candidate : all) {
        for (const Room& room : rooms) {
            for (const std::uint32_t blockLength : blockLengths) {
                for (const Motion motion :
                     {Motion::still, Motion::moving, Motion::leaving, Motion::silent}) {
                    add(candidate, room, motion, 1, blockLength);
                }
                for (const int sources : {16, 64, 256}) {
                    // The largest crowd for the built library alone, to save time.
                    if (sources > room.mostSources || (sources > 64 && &candidate != &all[0])) {
                        continue;
                    }
                    add(candidate, room, Motion::still, sources, blockLength);
                    add(candidate, room, Motion::moving, sources, blockLength);
                }
            }
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
