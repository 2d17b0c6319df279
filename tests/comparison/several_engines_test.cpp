// What engines of one process share: block counter, flags, HRIR tables, the pan pair, the bed.
#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <vector>

#include "base/numeric_conversion.h"
#include "comparison/comparison_fixture.h"
#include "engine/shared_state.h"

namespace tessaly::test {
namespace {

using reference::EngineOptions;
using Sources = std::vector<std::unique_ptr<ComparedSource>>;

class SeveralEngines : public ComparisonFixture {
protected:
    /// One round of the mixer: each source in order, each in a motion of its own.
    void round(Sources& sources, int block) {
        for (std::size_t k = 0; k < sources.size(); ++k) {
            if (sources[k] == nullptr) {
                continue;
            }
            SourceValues& values = sources[k]->values;
            const int step = 3 + 5 * static_cast<int>(k);
            values.azimuth = wrapToInt16((block * step + 180) % 360 - 180);
            values.distance = 0.6f + 0.2f * static_cast<float>((block + static_cast<int>(k)) % 9);
            ASSERT_TRUE(sources[k]->play(deviation)) << "engine " << k << " round " << block;
            ASSERT_EQ(blockCounter, process.blockCounter);
        }
    }

    static EngineOptions optionsOf(int blockLength) {
        EngineOptions options;
        options.blockLength = blockLength;
        return options;
    }
};

TEST_F(SeveralEngines, RoundsShareOneCounter) {
    EngineOptions options = optionsOf(256);
    options.qvUpdateInterval = 3;
    Sources sources;
    for (int k = 0; k < 4; ++k) {
        options.alwaysUpdateFilter = k != 2;
        options.fading = k != 1;
        options.earlyFlexRefPreset = k == 3 ? 1 : 0;
        sources.push_back(source(options));
    }
    sources[3]->setRecords(roomRecords(8, 700, 51));
    for (int block = 0; block < 40; ++block) {
        round(sources, block);
    }
}

TEST_F(SeveralEngines, ALoadedEngineThatDoesNotRunHoldsTheCounter) {
    EngineOptions options = optionsOf(128);
    options.earlyFlexRefPreset = 1;
    Sources sources;
    sources.push_back(source(options));
    sources[0]->setRecords(roomRecords(8, 700, 52));
    for (int block = 0; block < 12; ++block) {
        round(sources, block);
    }
    const auto waiting = source(options);
    for (int block = 12; block < 30; ++block) {
        round(sources, block);
        ASSERT_EQ(blockCounter, 0u);  // no crossfade and no second ring for anyone
    }
    for (int block = 30; block < 60; ++block) {
        round(sources, block);
        ASSERT_TRUE(waiting->play(deviation));
        ASSERT_EQ(blockCounter, process.blockCounter);
    }
}

TEST_F(SeveralEngines, EnginesComeAndGoAsHandlersReload) {
    EngineOptions options = optionsOf(64);
    options.qvUpdateInterval = 2;
    Sources sources(3);
    int block = 0;
    for (int turn = 0; turn < 14; ++turn) {
        const std::size_t slot = static_cast<std::size_t>(turn) % sources.size();
        options.alwaysUpdateFilter = turn % 3 != 0;
        options.qvInterpolateFilters = turn % 4 == 1;
        auto fresh = source(options);  // stands beside the old one until that goes
        sources[slot] = std::move(fresh);
        if (turn % 5 == 4) {
            sources[(slot + 1) % sources.size()].reset();
        }
        for (int k = 0; k < 9; ++k, ++block) {
            round(sources, block);
        }
    }
}

TEST_F(SeveralEngines, LaterEnginesUseTheSetThatIsThere) {
    // Whatever rate comes second reads the first one's HRIRs, at their distance in memory.
    for (const int first : sampleRates) {
        for (const int second : sampleRates) {
            SCOPED_TRACE(::testing::Message() << first << " then " << second);
            restart();
            EngineOptions options = optionsOf(256);
            options.sampleRate = first;
            Sources sources;
            sources.push_back(source(options));
            options.sampleRate = second;
            options.qvUse256HRIR = first == second;
            sources.push_back(source(options));
            for (int block = 0; block < 12; ++block) {
                round(sources, block);
            }
        }
    }
}

TEST_F(SeveralEngines, PanPairReplacesTheSetForAll) {
    for (const int rate : sampleRates) {
        restart();
        EngineOptions options = optionsOf(256);
        options.sampleRate = rate;
        Sources sources;
        for (int turn = 0; turn < 5; ++turn) {
            options.bypass3DAudio = turn % 2 == 1;
            options.fading = turn != 3;
            sources.push_back(source(options));
            for (int block = 0; block < 14; ++block) {
                round(sources, 14 * turn + block);
            }
        }
        sources.clear();
        restart();
        options.bypass3DAudio = true;
        sources.push_back(source(options));
        for (int block = 0; block < 40; ++block) {
            round(sources, block);
        }
    }
}

TEST_F(SeveralEngines, TheBedPlaysUnderTheFirstEngineOnly) {
    EngineOptions options = optionsOf(512);
    options.atmoSelect = 1;
    constexpr std::size_t loopFrames = 1064960;
    options.ambience.resize(2 * loopFrames);
    for (std::size_t i = 0; i < options.ambience.size(); ++i) {
        const double t = static_cast<double>(i);
        options.ambience[i] = static_cast<double>(
            static_cast<float>(0.1 * std::sin(0.013 * t) + 0.05 * std::sin(0.4 * t)));
    }
    Sources sources;
    sources.push_back(source(options));
    sources.push_back(source(options));
    for (int block = 0; block < 12; ++block) {
        sources[0]->values.gainDb = -12.0f;  // the bed does not follow
        round(sources, block);
    }
    blockCounter = process.blockCounter = loopFrames / 512 - 3;  // and on round the loop's end
    for (int block = 0; block < 8; ++block) {
        round(sources, block);
    }
}

}  // namespace
}  // namespace tessaly::test
