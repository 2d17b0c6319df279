// The loops over samples, written once over lane types.
//
// In an unnamed namespace like the transforms: each kernel source gets copies of its own. Loops
// over pairs of singles take the lane types of the transforms. A lane type of doubles offers
//   Vector, pieces (stereo pairs in a vector), load, zero, add, subtract, multiply,
//   loadPair / storePair (a pair of singles of each piece), loadTwoPairs / storeTwoPairs,
// and one for look-ahead, if looksAhead,
//   Pair (2 doubles), Four (4 doubles), loadPair, storePair, loadFour, singles (4 floats, widened),
//   storeSingles, rounded (to single and back), low, lowTwice, highTwice, twice, swapped (within
//   each pair), add, multiply, multiplyAdd(a, b, c) = a b + c.
#pragma once

#include "convolution/simd/complex_lanes.h"
#include "convolution/simd/signal_kernels.h"

namespace tessaly {
namespace {

// ---- Filters side by side ----

/// One step of the recursion in every lane, in the order of the plain form and unfused.
template <class Lanes>
TESSALY_KERNEL_INLINE typename Lanes::Vector stepSection(typename Lanes::Vector x,
                                                         const double (&c)[5][2 * Lanes::pieces],
                                                         typename Lanes::Vector& z1,
                                                         typename Lanes::Vector& z2) {
    const auto times = [](const double* coefficient, typename Lanes::Vector value) {
        return Lanes::multiply(Lanes::load(coefficient), value);
    };
    const typename Lanes::Vector y = Lanes::add(times(c[0], x), z1);
    z1 = Lanes::subtract(Lanes::add(times(c[1], x), z2), times(c[3], y));
    z2 = Lanes::subtract(times(c[2], x), times(c[4], y));
    return y;
}

/// `Groups` vectors in flight hide the latency of the recursion. `count` filters of at most Groups
/// times Lanes::pieces; the lanes left over repeat the last one, result and all.
template <class Lanes, int Groups>
void filterPairGroups(std::size_t frames, std::size_t count, const PairFilter* filters) {
    constexpr int pieces = Lanes::pieces;
    alignas(64) double coefficients[Groups][5][2 * pieces];
    const float* inputs[Groups * pieces];
    float* outputs[Groups * pieces];
    for (int k = 0; k < Groups * pieces; ++k) {
        const auto number = static_cast<std::size_t>(k);
        const PairFilter& filter = filters[number < count ? number : count - 1];
        inputs[k] = filter.input;
        outputs[k] = filter.output;
        const SectionCoefficients& c = filter.coefficients;
        const double values[5] = {c.b0, c.b1, c.b2, c.a1, c.a2};
        for (int n = 0; n < 5; ++n) {
            coefficients[k / pieces][n][2 * (k % pieces)] = values[n];
            coefficients[k / pieces][n][2 * (k % pieces) + 1] = values[n];
        }
    }
    typename Lanes::Vector z1[Groups];
    typename Lanes::Vector z2[Groups];
    for (int g = 0; g < Groups; ++g) {
        z1[g] = Lanes::zero();
        z2[g] = Lanes::zero();
    }
    std::size_t frame = 0;
    for (; frame + 2 <= frames; frame += 2) {
        TESSALY_KERNEL_UNROLL
        for (int g = 0; g < Groups; ++g) {
            typename Lanes::Vector first;
            typename Lanes::Vector second;
            Lanes::loadTwoPairs(inputs + g * pieces, 2 * frame, first, second);
            first = stepSection<Lanes>(first, coefficients[g], z1[g], z2[g]);
            second = stepSection<Lanes>(second, coefficients[g], z1[g], z2[g]);
            Lanes::storeTwoPairs(outputs + g * pieces, 2 * frame, first, second);
        }
    }
    if (frame < frames) {
        for (int g = 0; g < Groups; ++g) {
            const typename Lanes::Vector x = Lanes::loadPair(inputs + g * pieces, 2 * frame);
            Lanes::storePair(outputs + g * pieces, 2 * frame,
                             stepSection<Lanes>(x, coefficients[g], z1[g], z2[g]));
        }
    }
}

template <class Lanes>
void filterPairsLanes(std::size_t frames, std::size_t count, const PairFilter* filters) {
    constexpr std::size_t pieces = Lanes::pieces;
    while (count > 4 * pieces) {
        filterPairGroups<Lanes, 4>(frames, 4 * pieces, filters);
        filters += 4 * pieces;
        count -= 4 * pieces;
    }
    switch ((count + pieces - 1) / pieces) {
        case 0:
            return;
        case 1:
            return filterPairGroups<Lanes, 1>(frames, count, filters);
        case 2:
            return filterPairGroups<Lanes, 2>(frames, count, filters);
        case 3:
            return filterPairGroups<Lanes, 3>(frames, count, filters);
        default:
            return filterPairGroups<Lanes, 4>(frames, count, filters);
    }
}

// ---- Sections in series ----

/// Sample by sample, for the samples that fill no vector and for the plain table.
template <int Sections>
TESSALY_KERNEL_INLINE void filterSeriesPlain(std::size_t count,
                                             float* samples,
                                             RunningSection* series) {
    RunningSection running[Sections];
    for (int s = 0; s < Sections; ++s) {
        running[s] = series[s];
    }
    for (std::size_t i = 0; i < count; ++i) {
        float sample = samples[i];
        TESSALY_KERNEL_UNROLL
        for (int s = 0; s < Sections; ++s) {
            const SectionCoefficients& c = running[s].coefficients;
            const double x = static_cast<double>(sample);
            const double y = x * c.b0 + running[s].z1;
            running[s].z1 = x * c.b1 + running[s].z2 - c.a1 * y;
            running[s].z2 = x * c.b2 - c.a2 * y;
            sample = static_cast<float>(y);
        }
        samples[i] = sample;
    }
    for (int s = 0; s < Sections; ++s) {
        series[s] = running[s];
    }
}

/// Four samples ahead: outputs and the next state as products of matrices with the four inputs and
/// the state. A 2 by 2 block M times (p, q) is the diagonal (M00, M11) times (p, q) and the other
/// diagonal (M01, M10) times (q, p); two blocks, one above the other, take the same pair twice.
struct LookAhead {
    alignas(32) double outputFromLow[2][4];
    alignas(32) double outputFromHigh[2][4];
    alignas(32) double outputFromState[2][4];
    alignas(16) double stateFromLow[2][2];
    alignas(16) double stateFromHigh[2][2];
    alignas(16) double stateFromState[2][2];
};

/// State (z1, z2).
struct SectionState {
    double first;
    double second;
};

/// The state a sample later, with no input.
inline SectionState freeStep(const SectionCoefficients& c, SectionState z) {
    return {z.second - c.a1 * z.first, -(c.a2 * z.first)};
}

inline LookAhead lookAheadOf(const SectionCoefficients& c) {
    // What an input of 1 leaves in the state, 0 to 3 samples later; each output is b0 times the
    // input and the first value of the state.
    SectionState input[4];
    SectionState first[5];   // of the state (1, 0)
    SectionState second[5];  // of the state (0, 1)
    input[0] = {c.b1 - c.a1 * c.b0, c.b2 - c.a2 * c.b0};
    first[0] = {1.0, 0.0};
    second[0] = {0.0, 1.0};
    for (int n = 1; n < 4; ++n) {
        input[n] = freeStep(c, input[n - 1]);
    }
    for (int n = 1; n < 5; ++n) {
        first[n] = freeStep(c, first[n - 1]);
        second[n] = freeStep(c, second[n - 1]);
    }
    const double h0 = c.b0;
    const double h1 = input[0].first;
    const double h2 = input[1].first;
    const double h3 = input[2].first;
    return {
        .outputFromLow = {{h0, h0, h2, h2}, {0.0, h1, h1, h3}},
        .outputFromHigh = {{0.0, 0.0, h0, h0}, {0.0, 0.0, 0.0, h1}},
        .outputFromState = {{first[0].first, second[1].first, first[2].first, second[3].first},
                            {second[0].first, first[1].first, second[2].first, first[3].first}},
        .stateFromLow = {{input[3].first, input[2].second}, {input[2].first, input[3].second}},
        .stateFromHigh = {{input[1].first, input[0].second}, {input[0].first, input[1].second}},
        .stateFromState = {{first[4].first, second[4].second}, {second[4].first, first[4].second}},
    };
}

template <class Lanes>
TESSALY_KERNEL_INLINE typename Lanes::Four stepLookAhead(typename Lanes::Four x,
                                                         const LookAhead& matrices,
                                                         typename Lanes::Pair& state) {
    using Four = typename Lanes::Four;
    using Pair = typename Lanes::Pair;
    const auto four = [](const double* p) { return Lanes::loadFour(p); };
    const auto pair = [](const double* p) { return Lanes::loadPair(p); };
    const Four low = Lanes::lowTwice(x);
    const Four high = Lanes::highTwice(x);
    const Four lowSwapped = Lanes::swapped(low);
    const Four highSwapped = Lanes::swapped(high);
    const Four z = Lanes::twice(state);
    const Pair stateSwapped = Lanes::swapped(state);

    // Short chains: what waits for a result blocks what could run beside it.
    const Four fromLow = Lanes::multiplyAdd(lowSwapped, four(matrices.outputFromLow[1]),
                                            Lanes::multiply(low, four(matrices.outputFromLow[0])));
    const Four fromHigh =
        Lanes::multiplyAdd(highSwapped, four(matrices.outputFromHigh[1]),
                           Lanes::multiply(high, four(matrices.outputFromHigh[0])));
    const Four fromState =
        Lanes::multiplyAdd(Lanes::swapped(z), four(matrices.outputFromState[1]),
                           Lanes::multiply(z, four(matrices.outputFromState[0])));
    const Four y = Lanes::add(Lanes::add(fromLow, fromHigh), fromState);

    const Pair nextFromLow =
        Lanes::multiplyAdd(Lanes::low(lowSwapped), pair(matrices.stateFromLow[1]),
                           Lanes::multiply(Lanes::low(low), pair(matrices.stateFromLow[0])));
    const Pair nextFromHigh =
        Lanes::multiplyAdd(Lanes::low(highSwapped), pair(matrices.stateFromHigh[1]),
                           Lanes::multiply(Lanes::low(high), pair(matrices.stateFromHigh[0])));
    const Pair next = Lanes::multiplyAdd(state, pair(matrices.stateFromState[0]),
                                         Lanes::add(nextFromLow, nextFromHigh));
    state = Lanes::multiplyAdd(stateSwapped, pair(matrices.stateFromState[1]), next);
    return y;
}

template <class Lanes, int Sections>
void filterSeriesAhead(std::size_t count, float* samples, RunningSection* series) {
    LookAhead matrices[Sections];
    typename Lanes::Pair state[Sections];
    for (int s = 0; s < Sections; ++s) {
        matrices[s] = lookAheadOf(series[s].coefficients);
        const double z[2] = {series[s].z1, series[s].z2};
        state[s] = Lanes::loadPair(z);
    }
    // Each section works one group of four behind the one before it, so that none waits for
    // another.
    typename Lanes::Four waiting[Sections];
    const auto advance = [&](std::size_t group, int s) {
        const auto section = static_cast<std::size_t>(s);
        const typename Lanes::Four y =
            stepLookAhead<Lanes>(s == 0 ? Lanes::singles(samples + 4 * group) : waiting[section],
                                 matrices[section], state[section]);
        if (s + 1 < Sections) {
            waiting[section + 1] = Lanes::rounded(y);
        } else {
            Lanes::storeSingles(samples + 4 * (group - section), y);
        }
    };
    const std::size_t groups = count / 4;
    for (std::size_t group = 0; group + 1 < Sections; ++group) {
        for (int s = static_cast<int>(group); s >= 0; --s) {
            advance(group, s);
        }
    }
    for (std::size_t group = Sections - 1; group < groups; ++group) {
        TESSALY_KERNEL_UNROLL
        for (int s = Sections - 1; s >= 0; --s) {
            advance(group, s);
        }
    }
    for (std::size_t group = groups; group < groups + Sections - 1; ++group) {
        for (int s = Sections - 1; s > static_cast<int>(group - groups); --s) {
            advance(group, s);
        }
    }
    const std::size_t i = 4 * groups;
    for (int s = 0; s < Sections; ++s) {
        double z[2];
        Lanes::storePair(z, state[s]);
        series[s].z1 = z[0];
        series[s].z2 = z[1];
    }
    filterSeriesPlain<Sections>(count - i, samples + i, series);
}

inline constexpr std::size_t fewestAhead = 16;  // samples that are worth the matrices; 4 groups

template <class Lanes, int Sections>
void filterSeriesOf(std::size_t count, float* samples, RunningSection* series) {
    if constexpr (Lanes::looksAhead) {
        if (count >= fewestAhead) {
            return filterSeriesAhead<Lanes, Sections>(count, samples, series);
        }
    }
    filterSeriesPlain<Sections>(count, samples, series);
}

template <class Lanes>
void filterSeriesLanes(std::size_t count,
                       float* samples,
                       std::size_t sections,
                       RunningSection* series) {
    switch (sections) {
        case 1:
            return filterSeriesOf<Lanes, 1>(count, samples, series);
        case 2:
            return filterSeriesOf<Lanes, 2>(count, samples, series);
        case 3:
            return filterSeriesOf<Lanes, 3>(count, samples, series);
        case 4:
            return filterSeriesOf<Lanes, 4>(count, samples, series);
        default:
            return;
    }
}

// ---- Pairs of singles ----

template <class Lanes>
void addPairsLanes(std::size_t frames, const float* pairs, float gain, float* even, float* odd) {
    using Vector = typename Lanes::Vector;
    constexpr std::size_t lanes = Lanes::count;
    const Vector gains = Lanes::broadcast(gain);
    std::size_t i = 0;
    for (; i + lanes <= frames; i += lanes) {
        Vector first;
        Vector second;
        Lanes::loadInterleaved(pairs + 2 * i, first, second);
        Lanes::store(even + i, Lanes::add(Lanes::load(even + i), Lanes::multiply(first, gains)));
        Lanes::store(odd + i, Lanes::add(Lanes::load(odd + i), Lanes::multiply(second, gains)));
    }
    for (; i < frames; ++i) {
        even[i] += pairs[2 * i] * gain;
        odd[i] += pairs[2 * i + 1] * gain;
    }
}

template <class Lanes>
void writePairsLanes(
    std::size_t frames, const float* pairs, float gain, float secondGain, float* even, float* odd) {
    using Vector = typename Lanes::Vector;
    constexpr std::size_t lanes = Lanes::count;
    const Vector gains = Lanes::broadcast(gain);
    const Vector secondGains = Lanes::broadcast(secondGain);
    std::size_t i = 0;
    for (; i + lanes <= frames; i += lanes) {
        Vector first;
        Vector second;
        Lanes::loadInterleaved(pairs + 2 * i, first, second);
        Lanes::store(even + i, Lanes::multiply(Lanes::multiply(first, gains), secondGains));
        Lanes::store(odd + i, Lanes::multiply(Lanes::multiply(second, gains), secondGains));
    }
    for (; i < frames; ++i) {
        even[i] = pairs[2 * i] * gain * secondGain;
        odd[i] = pairs[2 * i + 1] * gain * secondGain;
    }
}

template <class Lanes>
void interleaveLanes(
    std::size_t frames, const float* even, const float* odd, float gain, float* pairs) {
    using Vector = typename Lanes::Vector;
    constexpr std::size_t lanes = Lanes::count;
    const Vector gains = Lanes::broadcast(gain);
    std::size_t i = 0;
    for (; i + lanes <= frames; i += lanes) {
        Lanes::storeInterleaved(pairs + 2 * i, Lanes::multiply(Lanes::load(even + i), gains),
                                Lanes::multiply(Lanes::load(odd + i), gains));
    }
    for (; i < frames; ++i) {
        pairs[2 * i] = even[i] * gain;
        pairs[2 * i + 1] = odd[i] * gain;
    }
}

template <class Lanes>
bool isSilentLanes(std::size_t count, const float* samples) {
    constexpr std::size_t lanes = Lanes::count;
    constexpr std::size_t vectors = 8;  // between two looks at the result
    std::size_t i = 0;
    for (; i + vectors * lanes <= count; i += vectors * lanes) {
        auto first = Lanes::load(samples + i);
        auto second = Lanes::load(samples + i + lanes);
        TESSALY_KERNEL_UNROLL
        for (std::size_t k = 2; k < vectors; k += 2) {
            first = Lanes::orBits(first, Lanes::load(samples + i + k * lanes));
            second = Lanes::orBits(second, Lanes::load(samples + i + (k + 1) * lanes));
        }
        if (Lanes::anyBits(Lanes::orBits(first, second))) {
            return false;
        }
    }
    std::uint32_t rest = 0;
    for (; i < count; ++i) {
        rest |= bitsOf(samples[i]);
    }
    return rest == 0;
}

/// One table of a kernel source: the widest singles, the widest doubles side by side, the doubles
/// that look ahead.
template <class Lanes, class PairLanes, class AheadLanes>
inline constexpr SignalKernels signalKernelsOf{.filterPairs = filterPairsLanes<PairLanes>,
                                               .filterSeries = filterSeriesLanes<AheadLanes>,
                                               .addPairs = addPairsLanes<Lanes>,
                                               .writePairs = writePairsLanes<Lanes>,
                                               .interleave = interleaveLanes<Lanes>,
                                               .isSilent = isSilentLanes<Lanes>};

}  // namespace
}  // namespace tessaly
