// Shared returns and the sources that send to them.
// Names: Return/<library>/<whole or alone>/<sources>/<returns>/<block length>: one block of all
// sources and returns, or of the returns while the sources' blocks are not counted. Each return
// plays a hall with its 1.5 s, the sources have its reflections, walk and send to every return.
#include <benchmark/benchmark.h>

#include <memory>
#include <string>
#include <vector>

#include "plugin/game.h"

namespace tessaly::bench {
namespace {

std::unique_ptr<Played> sender(const PluginLibrary& library,
                               int returns,
                               std::uint32_t blockLength) {
    auto one = std::make_unique<Played>(library, "Tessaly Engine", blockLength);
    EffectInstance& effect = one->effect();
    effect.setParameter("Room Selection", hallSelection);
    effect.setParameter("Reverb disable", 1.0f);
    effect.setParameter("Reverb Size", static_cast<float>(returns));
    for (int id = 1; id <= returns; ++id) {
        effect.setParameter("Reverb ID", static_cast<float>(id));
        effect.setParameter("Reverb Send", -12.0f);
    }
    one->feed(true);
    return one;
}

std::unique_ptr<Played> receiver(const PluginLibrary& library, int id, std::uint32_t blockLength) {
    auto one = std::make_unique<Played>(library, "Tessaly Reverb", blockLength);
    one->effect().setParameter("Room Selection", hallSelection);
    one->effect().setParameter("ReverbID", static_cast<float>(id));
    return one;
}

void sharedReturn(benchmark::State& state,
                  const Candidate* candidate,
                  bool alone,
                  int sources,
                  int returns,
                  std::uint32_t blockLength) {
    std::vector<std::unique_ptr<Played>> receivers;
    for (int id = 1; id <= returns; ++id) {
        receivers.push_back(receiver(candidate->library, id, blockLength));
    }
    std::vector<std::unique_ptr<Played>> senders;
    for (int k = 0; k < sources; ++k) {
        senders.push_back(sender(candidate->library, returns, blockLength));
    }
    int step = 0;
    const auto playSenders = [&] {
        int k = 0;
        for (const auto& one : senders) {
            one->place(walk(step, k, sources));
            one->block();
            ++k;
        }
        ++step;
    };
    const auto playReceivers = [&] {
        for (const auto& one : receivers) {
            one->block();
        }
    };
    // Until every input that the returns' response reaches is noise; one source is enough.
    for (std::uint32_t k = 0; k < 2 * sampleRate / blockLength; ++k) {
        senders.front()->block();
        playReceivers();
    }
    constexpr int warmUp = 4;
    for (int k = 0; k < warmUp; ++k) {
        playSenders();
        playReceivers();
    }
    for (auto _ : state) {
        playSenders();
        if (!alone) {
            playReceivers();
            continue;
        }
        const double start = threadSeconds();
        playReceivers();
        state.SetIterationTime(threadSeconds() - start);
    }
    expectNoError(state, candidate->library);
}

void add(
    const Candidate& candidate, bool alone, int sources, int returns, std::uint32_t blockLength) {
    const std::string name = "Return/" + candidate.name + (alone ? "/alone/" : "/whole/") +
                             std::to_string(sources) + "/" + std::to_string(returns) + "/" +
                             std::to_string(blockLength);
    benchmark::internal::Benchmark* const row = benchmark::RegisterBenchmark(
        name.c_str(), sharedReturn, &candidate, alone, sources, returns, blockLength);
    // Each try of a longer run would set all of it up again.
    constexpr int turns = 2048;
    row->Iterations(sources > 16 ? turns / sources : turns / 16);
    if (alone) {
        row->UseManualTime();
    }
}

const bool registered = [] {
    for (const Candidate& candidate : candidates()) {
        for (const std::uint32_t blockLength : blockLengths) {
            for (const bool alone : {false, true}) {
                for (const int sources : {1, 16, 64}) {
                    add(candidate, alone, sources, 1, blockLength);
                }
            }
            add(candidate, false, 64, 2, blockLength);
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
