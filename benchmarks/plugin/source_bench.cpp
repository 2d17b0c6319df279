// One block of one source, the whole Process call.
// Names: Source/<room>/<still, moving, leaving or silent>/<block length>. A moving source walks
// round the head within 3 m; a leaving one is so far away that the level of the tail changes too;
// a silent one stands still and has been silent for a while.
#include <benchmark/benchmark.h>

#include <string>
#include <utility>

#include "plugin/game.h"

namespace tessaly::bench {
namespace {

enum class Motion { still, moving, leaving, silent };

struct Room {
    const char* name;
    float selection;
};

// Without a room, reflections alone, 1.5 s and 4.6 s of tail.
constexpr Room rooms[] = {{"dry", 0.0f}, {"reflections", 2.0f}, {"hall", 5.0f}, {"longest", 31.0f}};

constexpr std::pair<Motion, const char*> motions[] = {{Motion::still, "still"},
                                                      {Motion::moving, "moving"},
                                                      {Motion::leaving, "leaving"},
                                                      {Motion::silent, "silent"}};

void source(benchmark::State& state, float room, Motion motion, std::uint32_t blockLength) {
    Played one("Tessaly Engine", blockLength);
    one.effect().setParameter("Room Selection", room);
    one.place(30.0, 10.0, 2.0);
    one.feed(true);
    constexpr int warmUp = 20;
    for (int k = 0; k < warmUp; ++k) {
        one.block();
    }
    if (motion == Motion::silent) {
        one.feed(false);
        for (std::uint32_t k = 0; k < 6 * sampleRate / blockLength; ++k) {
            one.block();
        }
    }
    int step = 0;
    for (auto _ : state) {
        if (motion == Motion::moving) {
            one.place(step * 7 % 360, step % 60 - 30, 1.0 + 0.01 * (step % 200));
        } else if (motion == Motion::leaving) {
            one.place(step * 7 % 360, 0.0, 14.0 + 0.01 * (step % 1000));
        }
        ++step;
        one.block();
    }
    expectNoError(state);
}

const bool registered = [] {
    if (library() == nullptr) {
        return false;
    }
    for (const Room& room : rooms) {
        for (const auto& [motion, word] : motions) {
            for (const std::uint32_t blockLength : {256u, 1024u}) {
                const std::string name = std::string("Source/") + room.name + "/" + word + "/" +
                                         std::to_string(blockLength);
                benchmark::RegisterBenchmark(name.c_str(), source, room.selection, motion,
                                             blockLength);
            }
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
