// A shared return and the sources that send to it.
// Names: Return/<whole or alone>/<sources>/<block length>: one block of all sources and the return,
// or of the return while the sources' blocks are not counted. The return plays a concert hall, the
// sources have its reflections and walk.
#include <benchmark/benchmark.h>

#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "plugin/game.h"

namespace tessaly::bench {
namespace {

constexpr float hall = 5.0f;
constexpr float reverbId = 1.0f;

std::unique_ptr<Played> sender(std::uint32_t blockLength) {
    auto one = std::make_unique<Played>("Tessaly Engine", blockLength);
    EffectInstance& effect = one->effect();
    effect.setParameter("Room Selection", hall);
    effect.setParameter("Reverb disable", 1.0f);
    effect.setParameter("Reverb Size", 1.0f);
    effect.setParameter("Reverb ID", reverbId);
    effect.setParameter("Reverb Send", -12.0f);
    one->feed(true);
    return one;
}

void sharedReturn(benchmark::State& state, bool alone, int sources, std::uint32_t blockLength) {
    Played reverb("Tessaly Reverb", blockLength);
    reverb.effect().setParameter("Room Selection", hall);
    reverb.effect().setParameter("ReverbID", reverbId);
    std::vector<std::unique_ptr<Played>> senders;
    for (int k = 0; k < sources; ++k) {
        senders.push_back(sender(blockLength));
    }
    int step = 0;
    const auto playSenders = [&] {
        int k = 0;
        for (const auto& one : senders) {
            one->place((step * 5 + 360 * k / sources) % 360, k % 60 - 30, 1.0 + 0.1 * (k % 10));
            one->block();
            ++k;
        }
        ++step;
    };
    constexpr int warmUp = 4;
    for (int k = 0; k < warmUp; ++k) {
        playSenders();
        reverb.block();
    }
    for (auto _ : state) {
        playSenders();
        if (!alone) {
            reverb.block();
            continue;
        }
        const auto start = std::chrono::steady_clock::now();
        reverb.block();
        state.SetIterationTime(
            std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
    }
    expectNoError(state);
}

const bool registered = [] {
    if (library() == nullptr) {
        return false;
    }
    for (const bool alone : {false, true}) {
        for (const int sources : {1, 16, 64}) {
            for (const std::uint32_t blockLength : {256u, 1024u}) {
                const std::string name = std::string("Return/") + (alone ? "alone/" : "whole/") +
                                         std::to_string(sources) + "/" +
                                         std::to_string(blockLength);
                benchmark::internal::Benchmark* const row = benchmark::RegisterBenchmark(
                    name.c_str(), sharedReturn, alone, sources, blockLength);
                if (alone) {
                    row->UseManualTime();
                }
            }
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
