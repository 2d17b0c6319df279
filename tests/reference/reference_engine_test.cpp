// The reference engine against cases that can be worked out by hand.
#include "support/reference/reference_engine.h"

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <numbers>
#include <random>
#include <vector>

#include "base/precision.h"
#include "base/units.h"

namespace tessaly::reference {
namespace {

/// A process, the cells an engine reads, and the signal that went in and came out.
struct Rig {
    Process process;
    SourceInputs inputs;
    MixLevels mix;
    EngineOptions options;
    std::unique_ptr<Engine> engine;
    std::vector<double> in;
    std::vector<double> left;
    std::vector<double> right;

    explicit Rig(std::function<double(int, int, int)> hrir) { process.hrirSource = setOf(hrir); }

    void build() { engine = std::make_unique<Engine>(process, inputs, mix, options); }

    void play(const std::vector<double>& signal) {
        const int b = options.blockLength;
        for (std::size_t at = 0; at + b <= signal.size(); at += b) {
            std::vector<double> block(static_cast<std::size_t>(2 * b), 0.0);
            for (int i = 0; i < b; ++i) {
                block[2 * i] = signal[at + i];
                block[2 * i + 1] = 1e6;  // the right slots never count
            }
            std::vector<double> out;
            engine->process(std::span<const double>(block), out);
            in.insert(in.end(), signal.begin() + at, signal.begin() + at + b);
            for (int i = 0; i < b; ++i) {
                left.push_back(out[2 * i]);
                right.push_back(out[2 * i + 1]);
            }
        }
    }

    void playBlocks(int count, unsigned seed) {
        std::mt19937 generator(seed);
        std::uniform_real_distribution<double> value(-1.0, 1.0);
        std::vector<double> signal(static_cast<std::size_t>(count * options.blockLength));
        for (double& sample : signal) {
            sample = value(generator);
        }
        play(signal);
    }

    /// The input behind the two filters that always run, for a source at a constant distance
    /// below 10 metres.
    std::vector<double> filteredInput() const {
        const double d = wide(inputs.distance);
        const double rate = options.sampleRate;
        Filter high(0, 0.0, (20000.0 - 900.0 * d) / rate);
        Filter low(1, 0.0, (10.0 + 170.0 * d / 30.0) / rate);
        std::vector<double> out;
        for (const double x : in) {
            out.push_back(low.run(high.run(x)));
        }
        return out;
    }
};

/// One tap of 1 at frame 10 (right) and 20 (left), whatever the direction.
double twoTaps(int, int frame, int ear) { return frame == (ear == 1 ? 20 : 10) ? 1.0 : 0.0; }

/// Different for each direction, frame and ear, without a pattern.
double mixedTaps(int k, int frame, int ear) {
    return std::sin(1.0 + k * 12.9898 + frame * 78.233 + ear * 37.719);
}

/// A tail of 4096 pairs, so that every tap of an 8-, 4- or 2-fold response sounds.
Tail longTail() {
    Tail tail;
    tail.presetGain = 0.05f;
    for (int i = 0; i < 2 * 4096; ++i) {
        tail.pairs.push_back(single(std::sin(0.5 + i * 91.7)));
    }
    return tail;
}

double convolvedAt(const std::vector<double>& x, const std::vector<double>& h, int n) {
    double sum = 0.0;
    for (int m = 0; m < static_cast<int>(h.size()) && m <= n; ++m) {
        sum += h[m] * x[n - m];
    }
    return sum;
}

/// Partition `p` (b taps from p * b on) acting on a window whose newest block is `block` of x,
/// output sample i of the block; blocks before the first are silent.
double partitionAt(
    const std::vector<double>& x, const std::vector<double>& h, int b, int p, int block, int i) {
    double sum = 0.0;
    for (int j = 0; j < b; ++j) {
        const int n = block * b + i - j;
        sum += n >= 0 ? h[p * b + j] * x[n] : 0.0;
    }
    return sum;
}

const double nearGain = 1.0 / (std::pow(1.4, 0.75) + 0.22);

TEST(ReferenceEngine, StillSourceAtOneMetreIsFilteredDelayedAndScaled) {
    for (const int rate : {24000, 44100, 48000}) {
        for (const int b : {64, 512}) {
            Rig rig(twoTaps);
            rig.options.sampleRate = rate;
            rig.options.blockLength = b;
            rig.inputs.gainDb = -6.0f;
            rig.build();
            rig.playBlocks(6, 1);
            const std::vector<double> x = rig.filteredInput();
            const double gain = nearGain * std::pow(10.0, -0.3);
            for (int n = 20; n < 6 * b; ++n) {
                // Where the crossfade's two weights meet they sum to 1 up to a rounded step.
                ASSERT_NEAR(rig.left[n], gain * x[n - 20], 1e-6);
                ASSERT_NEAR(rig.right[n], gain * x[n - 10], 1e-6);
            }
        }
    }
}

TEST(ReferenceEngine, ConstantInputDiesAway) {
    Rig rig(twoTaps);
    rig.build();
    rig.play(std::vector<double>(40 * 1024, 1.0));
    EXPECT_NEAR(rig.left.back(), 0.0, 1e-12);
    // The low shelf comes first and changes nothing of that.
    rig.engine->controls.bassBoost = true;
    rig.play(std::vector<double>(40 * 1024, 1.0));
    EXPECT_NEAR(rig.left.back(), 0.0, 1e-12);
}

TEST(ReferenceEngine, UnchangedResponseOfEightPartitionsIsAPlainConvolution) {
    Rig rig(mixedTaps);
    rig.options.blockLength = 512;
    rig.options.qvReverb = 2;
    rig.options.tail = longTail();
    rig.options.alwaysUpdateFilter = false;
    rig.build();
    ASSERT_EQ(rig.engine->partitions(), 8);
    rig.playBlocks(12, 2);
    const std::vector<double> x = rig.filteredInput();
    std::vector<double> h = rig.engine->responseLeft();
    h.resize(4096);
    for (int n = 0; n < static_cast<int>(x.size()); n += 7) {
        ASSERT_NEAR(rig.left[n], convolvedAt(x, h, n), 1e-10) << n;
    }
}

TEST(ReferenceEngine, SteadyUpdatesLoseTheFirstBlocksWindowInLaterPartitions) {
    const int b = 512;
    Rig rig(mixedTaps);
    rig.options.blockLength = b;
    rig.options.qvReverb = 2;
    rig.options.tail = longTail();
    rig.build();
    rig.playBlocks(11, 3);
    const std::vector<double> x = rig.filteredInput();
    std::vector<double> h = rig.engine->responseLeft();
    h.resize(4096);
    for (int n = 0; n < static_cast<int>(x.size()); n += 5) {
        const int block = n / b;
        double expected = convolvedAt(x, h, n);
        if (block >= 1 && block < 8) {
            expected -= partitionAt(x, h, b, block, 0, n % b);  // block 0 went to the first ring
        }
        ASSERT_NEAR(rig.left[n], expected, 1e-5) << n;
    }
}

TEST(ReferenceEngine, StaleSlotsSoundAroundAnUpdateBlock) {
    const int b = 2048;
    Rig rig(mixedTaps);
    rig.options.blockLength = b;
    rig.options.qvReverb = 2;
    rig.options.tail = longTail();
    rig.options.alwaysUpdateFilter = false;
    rig.build();
    ASSERT_EQ(rig.engine->partitions(), 2);
    rig.playBlocks(4, 4);  // blocks 0 to 3, all plain
    std::vector<double> before = rig.engine->responseRight();
    rig.mix.direct = 0.25;
    rig.playBlocks(1, 5);  // block 4: update
    std::vector<double> after = rig.engine->responseRight();
    rig.playBlocks(2, 6);  // blocks 5 and 6: plain again
    const std::vector<double> x = rig.filteredInput();
    for (int i = 0; i < b; i += 3) {
        // The second ring knows its own window only; its other slot was never written.
        const double oldPart = partitionAt(x, before, b, 0, 4, i);
        const double newPart = partitionAt(x, after, b, 0, 4, i);
        const double w = i < 64 ? i / 63.0 : 1.0;
        ASSERT_NEAR(rig.right[4 * b + i], (1.0 - w) * oldPart + w * newPart, 1e-5) << i;
        // The first ring skipped block 4: there it still has the window of block 2.
        ASSERT_NEAR(rig.right[5 * b + i],
                    partitionAt(x, after, b, 0, 5, i) + partitionAt(x, after, b, 1, 2, i), 1e-10);
        ASSERT_NEAR(rig.right[6 * b + i],
                    partitionAt(x, after, b, 0, 6, i) + partitionAt(x, after, b, 1, 5, i), 1e-10);
    }
}

TEST(ReferenceEngine, CrossfadeRunsOverSixtyFourSamplesOrTheBlock) {
    for (const int b : {32, 128}) {
        Rig rig([](int, int frame, int) { return frame == 0 ? 1.0 : 0.0; });
        rig.options.blockLength = b;
        rig.options.alwaysUpdateFilter = false;
        rig.build();
        rig.playBlocks(3, 7);
        rig.mix.direct = 0.5;
        rig.playBlocks(1, 8);
        const std::vector<double> x = rig.filteredInput();
        for (int i = 0; i < b; ++i) {
            const double w = i < 64 ? i / 63.0 : 1.0;
            ASSERT_NEAR(rig.left[3 * b + i], nearGain * (1.0 - 0.5 * w) * x[3 * b + i], 1e-6);
        }
    }
}

TEST(ReferenceEngine, ShortBlockHearsOnlyTheTapsThatFit) {
    Rig rig([](int, int, int) { return 1.0; });
    rig.options.blockLength = 32;
    rig.options.alwaysUpdateFilter = false;
    rig.build();
    rig.playBlocks(8, 9);
    const std::vector<double> x = rig.filteredInput();
    std::vector<double> h(32, nearGain);
    for (int j = 0; j < 15; ++j) {
        h[17 + j] /= 4.0 * (j + 1);
    }
    for (int n = 0; n < 8 * 32; ++n) {
        ASSERT_NEAR(rig.left[n], convolvedAt(x, h, n), 1e-11);
    }
}

TEST(ReferenceEngine, DistanceLaws) {
    Rig rig(twoTaps);
    rig.build();
    const auto gainAt = [&](float distance) {
        rig.inputs.distance = distance;
        rig.playBlocks(1, 10);
        return rig.engine->directGain();
    };
    EXPECT_NEAR(gainAt(1.0f), 1.0 / (std::pow(1.4, 0.75) + 0.22), 1e-12);
    EXPECT_NEAR(gainAt(2.0f), 1.0 / (std::pow(2.7, 0.75) + 0.3265), 1e-12);
    EXPECT_NEAR(gainAt(0.0f), 1.0 / (std::pow(0.5, 0.75) + 0.22), 1e-7);
    EXPECT_EQ(rig.engine->distance(), 0.1f);
    EXPECT_NEAR(gainAt(7.0f), 1.0 / (std::pow(7.7, 0.75) + 0.3265), 1e-12);
    EXPECT_NEAR(gainAt(17.5f), 0.5 / (std::pow(18.2, 0.75) + 0.3265), 1e-12);
    EXPECT_EQ(gainAt(28.0f), 0.0);
    rig.mix.unityDistance = true;
    EXPECT_EQ(gainAt(5.0f), 1.0);
}

TEST(ReferenceEngine, ReverbLawNeedsReflectionsSwitchedOn) {
    for (const bool on : {false, true}) {
        Rig rig(twoTaps);
        rig.options.qvEarlyReflections = on;
        rig.build();
        rig.inputs.distance = 35.0f;
        rig.playBlocks(1, 11);
        const double x = 35.0 * 0.07299270072992702;
        EXPECT_NEAR(rig.engine->reverbDistanceGain(), on ? 0.5 / (x * x) : 1.0, 1e-12);
        EXPECT_EQ(rig.engine->earlyDistanceGain(), 0.0);
    }
}

TEST(ReferenceEngine, DelayLineOfAStillSource) {
    Rig rig(twoTaps);
    rig.options.doppler = true;
    rig.options.blockLength = 256;
    rig.inputs.distance = 5.0f;
    rig.build();
    rig.playBlocks(8, 12);
    const std::vector<double> x = rig.filteredInput();
    const int delay = static_cast<int>(48000 * samplesPerMetrePerHertz * 5.0);
    EXPECT_EQ(delay, 698);
    const double gain = rig.engine->directGain();
    for (int n = delay + 20; n < 8 * 256; ++n) {
        ASSERT_NEAR(rig.left[n], gain * x[n - delay - 20], 1e-6);
    }
}

TEST(ReferenceEngine, DelayLineGlidesWithinTheBlockOfAMove) {
    // A sine through the gliding delay equals the sine at the glided times, fed to an engine
    // without a line.
    const int b = 512;
    const double pitch = 2.0 * std::numbers::pi * 300.0 / 48000.0;
    Rig rig(twoTaps);
    rig.options.blockLength = b;
    rig.options.doppler = true;
    rig.inputs.distance = 1.0f;
    Rig plain = Rig(twoTaps);
    plain.options.blockLength = b;
    plain.inputs.distance = 1.0f;
    rig.build();
    plain.build();
    for (int block = 0; block < 6; ++block) {
        const float distance = block < 3 ? 1.0f : 2.0f;
        rig.inputs.distance = distance;
        plain.inputs.distance = distance;
        const double delayOld = block < 4 ? 139.0 : 279.0;  // trunc of 139.77 and 279.54
        const double delayNew = block < 3 ? 139.0 : 279.0;
        std::vector<double> straight;
        std::vector<double> glided;
        for (int i = 0; i < b; ++i) {
            const double n = block * b + i;
            straight.push_back(std::sin(pitch * n));
            const double at = n - delayOld + (delayOld - delayNew) / b * i;
            glided.push_back(at < 0.0 ? 0.0 : std::sin(pitch * at));
        }
        rig.play(straight);
        plain.play(glided);
    }
    for (int n = 0; n < 6 * b; ++n) {
        ASSERT_NEAR(rig.left[n], plain.left[n], 3e-4) << n;  // a chord under the sine
    }
}

TEST(ReferenceEngine, AzimuthIsClampedFourDegreesAboveTheLimitOnly) {
    Rig rig(mixedTaps);
    rig.options.blockLength = 64;
    rig.options.limitPhi = 92;  // rounds to 90
    rig.build();
    const auto phiFor = [&](int azimuth) {
        rig.inputs.azimuth = static_cast<std::int16_t>(azimuth);
        rig.playBlocks(1, 13);
        return rig.engine->phi();
    };
    EXPECT_EQ(phiFor(0), 0);
    EXPECT_EQ(phiFor(-93), 93);
    EXPECT_EQ(phiFor(-94), 90);
    EXPECT_EQ(phiFor(90), -90);
    EXPECT_EQ(phiFor(91), -90);
    EXPECT_EQ(rig.engine->indexPhi(), 18);
}

TEST(ReferenceEngine, SmoothStepsMoveFiveDegreesEverySecondBlock) {
    Rig rig(mixedTaps);
    rig.options.blockLength = 64;
    rig.options.qualityValue = 5;
    rig.build();
    std::vector<int> seen;
    for (int block = 0; block < 7; ++block) {
        if (block == 1) {
            rig.inputs.azimuth = -17;
        }
        rig.playBlocks(1, 14);
        seen.push_back(rig.engine->phi());
    }
    EXPECT_EQ(seen, (std::vector<int>{0, 0, 5, 5, 10, 10, 15}));
}

TEST(ReferenceEngine, InterpolationBlendsTheGridNeighboursByFifths) {
    // Both grid points have their peak at frame 0, so nothing is shifted.
    Rig rig([](int k, int frame, int) {
        return frame == 0 ? 10.0 : (k == 18 ? 1.0 : 3.0) / (1.0 + frame);
    });
    rig.options.blockLength = 256;
    rig.options.qvInterpolateFilters = true;
    rig.options.alwaysUpdateFilter = false;
    rig.build();
    rig.playBlocks(1, 15);
    const auto tap = [&](int i) { return rig.engine->responseLeft()[i] / nearGain; };
    EXPECT_NEAR(tap(1), 0.5, 1e-6);
    for (int degree = 1; degree < 5; ++degree) {
        rig.inputs.azimuth = static_cast<std::int16_t>(-degree);
        rig.playBlocks(1, 16);
        EXPECT_NEAR(tap(1), (1.0 + 2.0 * degree / 5.0) / 2.0, 1e-6) << degree;
        EXPECT_NEAR(tap(0), 10.0, 1e-6);
    }
}

TEST(ReferenceEngine, InterpolationAlignsTheOnsets) {
    // The next grid point's peak comes 10 frames later; two fifths of the way it stands at 4.
    Rig rig([](int k, int frame, int) { return frame == (k == 18 ? 20 : 30) ? 1.0 : 0.0; });
    rig.options.blockLength = 256;
    rig.options.qvInterpolateFilters = true;
    rig.options.alwaysUpdateFilter = false;
    rig.build();
    rig.playBlocks(1, 17);
    rig.inputs.azimuth = -1;
    rig.playBlocks(1, 18);
    rig.inputs.azimuth = -2;
    rig.playBlocks(1, 19);
    for (int i = 0; i < 139; ++i) {
        ASSERT_NEAR(rig.engine->responseRight()[i], i == 24 ? nearGain : 0.0, 1e-6) << i;
    }
}

TEST(ReferenceEngine, LastEngineAloneAdvancesTheCounter) {
    Process process;
    process.hrirSource = setOf(twoTaps);
    SourceInputs inputs;
    MixLevels mix;
    EngineOptions options;
    options.blockLength = 64;
    const std::vector<double> silence(128, 0.0);
    std::vector<double> out;
    Engine first(process, inputs, mix, options);
    first.process(std::span<const double>(silence), out);
    EXPECT_EQ(process.blockCounter, 1u);
    {
        Engine second(process, inputs, mix, options);
        EXPECT_EQ(process.blockCounter, 0u);
        first.process(std::span<const double>(silence), out);
        EXPECT_EQ(process.blockCounter, 0u);
        second.process(std::span<const double>(silence), out);
        EXPECT_EQ(process.blockCounter, 1u);
    }
    first.process(std::span<const double>(silence), out);
    EXPECT_EQ(process.blockCounter, 2u);
}

TEST(ReferenceEngine, QualityDecidesWhichHrirIsHeard) {
    for (int quality = 1; quality <= 10; ++quality) {
        Rig rig(mixedTaps);
        rig.options.blockLength = 512;
        rig.options.qualityValue = quality;
        rig.inputs.azimuth = 90;
        rig.build();
        for (int block = 0; block < 80; ++block) {
            rig.playBlocks(1, 20);  // long enough for limited steps to arrive
        }
        EXPECT_EQ(rig.engine->hrirLength(),
                  quality == 1 || quality == 6 || quality == 8 ? 139 : 256);
        // Up to 3 the direction is fixed and takes the first HRIR; 5 never gets an elevation
        // and stays at the pole; 4 looks at cells that its limits leave unmapped; 6 sees half
        // of the rows, filled in file order; from 7 on the set is mapped as it should be.
        const int hrir = quality <= 3 || quality == 5 ? 0 : quality == 6 ? 18 : 649;
        const double tap = rig.engine->responseLeft()[100] / nearGain;
        EXPECT_NEAR(tap, quality == 4 ? 0.0 : mixedTaps(hrir, 100, 1), 1e-6) << quality;
    }
}

TEST(ReferenceEngine, FixedPairStandsAtItsDelayOrAtTheEnd) {
    for (const int b : {256, 1024}) {
        Rig rig([](int k, int frame, int) { return frame == 0 ? k : 0.0; });
        rig.options.blockLength = b;
        rig.options.qvEarlyReflections = true;
        rig.inputs.distance = 2.0f;
        rig.mix.direct = 0.0;
        rig.mix.early = 0.5;
        rig.build();
        rig.playBlocks(1, 21);
        const int delay = b == 1024 ? 664 : 256 - 139;
        const double expected = 0.5 * (0.1 * hrirNumber(-90, 0) + 0.11 * hrirNumber(85, 0));
        EXPECT_NEAR(rig.engine->responseLeft()[delay], expected, 1e-4);
    }
}

TEST(ReferenceEngine, RecordsAddDelayedCopiesThatFollowTheSource) {
    Rig rig([](int k, int frame, int) { return frame == 0 ? k : 0.0; });
    rig.options.blockLength = 256;
    rig.options.sampleRate = 44100;
    rig.options.earlyFlexRefPreset = 1;
    rig.options.presetRow.phi = {-30, 35, 175};
    rig.options.presetRow.theta = {25, -80, 0};
    rig.options.presetRow.delay = {255, 300, 1024 - 128};
    rig.options.presetRow.gain = {0.5f, 0.5f, 0.5f};
    rig.inputs.azimuth = -10;
    rig.mix.direct = 0.0;
    rig.build();
    ASSERT_EQ(rig.engine->partitions(), 4);
    rig.playBlocks(1, 22);
    const std::vector<double>& h = rig.engine->responseLeft();
    const double gain = wide(single(wide(0.5f) * 0.55));
    EXPECT_NEAR(h[255], gain * hrirNumber(-20, 25), 1e-9);
    EXPECT_NEAR(h[300], gain * hrirNumber(45, -75), 1e-9);
    EXPECT_EQ(h[1024 - 128], 0.0);  // ends exactly at the response's end: rejected
    EXPECT_EQ(rig.engine->records[2].phi, -175);
}

TEST(ReferenceEngine, LengthsOfTailsAndTheirPartitions) {
    EXPECT_EQ(tailFrames(23147, 44100), 21266);
    EXPECT_EQ(tailFrames(220245, 48000), 220244);
    EXPECT_EQ(tailFrames(4096, 24000), 2048);
    EXPECT_EQ(tailFrames(4096, 44100), 3763);
    Rig rig(twoTaps);
    rig.options.blockLength = 512;
    rig.options.qvReverb = 15;
    rig.options.tail.pairs.assign(2 * 23147, 0.0f);
    rig.build();
    EXPECT_EQ(rig.engine->partitions(), 46);
    EXPECT_EQ(rig.engine->firSize(), 23552);
}

TEST(ReferenceEngine, MissingFileStopsConstruction) {
    Process process;
    SourceInputs inputs;
    MixLevels mix;
    const Engine engine(process, inputs, mix, EngineOptions{});
    EXPECT_FALSE(engine.built());
    EXPECT_EQ(process.essError, -103);
    EXPECT_EQ(process.engineCount, 1);
}

}  // namespace
}  // namespace tessaly::reference
