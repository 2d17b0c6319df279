// The loops over samples, written once over lane types.
//
// In an unnamed namespace like the transforms: each kernel source gets copies of its own. Loops
// over pairs of singles take the lane types of the transforms. A lane type of doubles offers
//   Vector, pieces (stereo pairs in a vector), load, zero, add, subtract, multiply,
//   loadPair / storePair (a pair of singles of each piece), loadTwoPairs / storeTwoPairs,
// and one for look-ahead, if looksAhead,
//   Vector (of `lanes` doubles), ahead (samples, a multiple of them), load, store, add, multiply,
//   multiplyAdd(a, b, c) = a b + c, lane<i> and broadcast (one value, of a vector or in memory, in
//   all lanes), fromSingles, toSingles, rounded (to single and back).
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

/// State (z1, z2).
struct SectionState {
    double first;
    double second;
};

/// The state a sample later, with no input.
inline SectionState freeStep(const SectionCoefficients& c, SectionState z) {
    return {z.second - c.a1 * z.first, -(c.a2 * z.first)};
}

template <int...>
struct SectionNumbers {};

/// Some samples ahead of a section: their outputs are sums over their inputs and what the last two
/// inputs and outputs before them leave behind. Only the latter waits for a result, once in so many
/// samples.
template <int Ahead>
struct LookAhead {
    /// The outputs from an input of 1, in each of its places: zeros in front of it.
    alignas(64) double fromInputs[Ahead][Ahead] = {};
    double fromLastInput[Ahead];
    double fromInputBefore[Ahead];
    double fromLastOutput[Ahead];
    double fromOutputBefore[Ahead];
    /// What the state that a block begins with adds.
    double fromState[Ahead];

    explicit LookAhead(const RunningSection& section) {
        const SectionCoefficients& c = section.coefficients;
        SectionState first = {1.0, 0.0};   // what remains of z1 = 1
        SectionState second = {0.0, 1.0};  // and of z2 = 1
        double last = c.b0;
        for (int n = 0; n < Ahead; ++n) {
            const double p = first.first;
            const double q = second.first;
            for (int i = 0; i + n < Ahead; ++i) {
                fromInputs[i][i + n] = last;
            }
            fromLastInput[n] = c.b1 * p + c.b2 * q;
            fromInputBefore[n] = c.b2 * p;
            fromLastOutput[n] = -(c.a1 * p + c.a2 * q);
            fromOutputBefore[n] = -(c.a2 * p);
            fromState[n] = section.z1 * p + section.z2 * q;
            // The output of the next sample from this input: by its state, b - a b0.
            last = (c.b1 - c.a1 * c.b0) * p + (c.b2 - c.a2 * c.b0) * q;
            first = freeStep(c, first);
            second = freeStep(c, second);
        }
    }
};

/// One section of several in series, some samples at a time. Its sums over the inputs are kept
/// apart, so that this stays in registers.
template <class Lanes>
class AheadSection {
public:
    using Vector = typename Lanes::Vector;
    static constexpr int ahead = Lanes::ahead;
    static constexpr int lanes = Lanes::lanes;
    static constexpr int vectors = ahead / lanes;

    using From = LookAhead<ahead>;

    TESSALY_KERNEL_INLINE explicit AheadSection(const From& from) {
        TESSALY_KERNEL_UNROLL
        for (int v = 0; v < vectors; ++v) {
            carry_[v] = Lanes::load(from.fromState + v * lanes);
        }
        const double none = 0.0;
        lastInput_ = inputBefore_ = lastOutput_ = outputBefore_ = Lanes::broadcast(&none);
    }

    /// Outputs of as many inputs.
    TESSALY_KERNEL_INLINE void step(const From& from, const double* x, Vector (&y)[vectors]) {
        addInputs<0>(from, x, y);
        TESSALY_KERNEL_UNROLL
        for (int v = 0; v < vectors; ++v) {
            y[v] = Lanes::add(y[v], carry_[v]);  // last of all, since this one waits
        }
        lastOutput_ = Lanes::template lane<lanes - 1>(y[vectors - 1]);
        outputBefore_ = Lanes::template lane<lanes - 2>(y[vectors - 1]);
        TESSALY_KERNEL_UNROLL
        for (int v = 0; v < vectors; ++v) {
            const Vector fromInputs = Lanes::multiplyAdd(
                Lanes::load(from.fromLastInput + v * lanes), lastInput_,
                Lanes::multiply(Lanes::load(from.fromInputBefore + v * lanes), inputBefore_));
            carry_[v] = Lanes::multiplyAdd(
                Lanes::load(from.fromLastOutput + v * lanes), lastOutput_,
                Lanes::multiplyAdd(Lanes::load(from.fromOutputBefore + v * lanes), outputBefore_,
                                   fromInputs));
        }
    }

    /// The state behind the last step.
    void storeState(RunningSection& section) const {
        const auto first = [](const Vector& a) {
            double values[lanes];
            Lanes::store(values, a);
            return values[0];
        };
        const SectionCoefficients& c = section.coefficients;
        const double z2Before = c.b2 * first(inputBefore_) - c.a2 * first(outputBefore_);
        section.z1 = c.b1 * first(lastInput_) + z2Before - c.a1 * first(lastOutput_);
        section.z2 = c.b2 * first(lastInput_) - c.a2 * first(lastOutput_);
    }

private:
    /// Inputs `First` and the one behind it, in sums of their own, and all that follow.
    template <int First>
    TESSALY_KERNEL_INLINE void addInputs(const From& from,
                                         const double* x,
                                         Vector (&sum)[vectors]) {
        const Vector even = Lanes::broadcast(x + First);
        const Vector odd = Lanes::broadcast(x + First + 1);
        Vector part[vectors];
        TESSALY_KERNEL_UNROLL
        for (int v = First / lanes; v < vectors; ++v) {
            part[v] = Lanes::multiply(Lanes::load(from.fromInputs[First] + v * lanes), even);
            part[v] = Lanes::multiplyAdd(Lanes::load(from.fromInputs[First + 1] + v * lanes), odd,
                                         part[v]);
        }
        if constexpr (First + 2 < ahead) {
            addInputs<First + 2>(from, x, sum);
        } else {
            lastInput_ = odd;
            inputBefore_ = even;
        }
        TESSALY_KERNEL_UNROLL
        for (int v = First / lanes; v < vectors; ++v) {
            const bool isFirst = v < (First + 2) / lanes || First + 2 >= ahead;
            sum[v] = isFirst ? part[v] : Lanes::add(sum[v], part[v]);
        }
    }

    Vector carry_[vectors];
    // In all lanes.
    Vector lastInput_;
    Vector inputBefore_;
    Vector lastOutput_;
    Vector outputBefore_;
};

/// Between two sections in series samples wait in memory, as doubles: there each is read into all
/// lanes for nothing, which from a register takes a shuffle. A store is read in parts only when it
/// has left the core, some steps later.
constexpr std::size_t stepsBetween = 4;
constexpr std::size_t stepsKept = 8;  // a power of two above
template <class Lanes>
struct WaitingSamples {
    alignas(64) double steps[stepsKept][Lanes::ahead];

    TESSALY_KERNEL_INLINE double* at(std::size_t step) { return steps[step % stepsKept]; }
};

/// The `Number`th of the sections takes the step that it is at when the first samples are read at
/// `step`.
template <int Number, class Lanes, int Sections>
TESSALY_KERNEL_INLINE void advanceSection(const LookAhead<Lanes::ahead> (&from)[Sections],
                                          AheadSection<Lanes> (&running)[Sections],
                                          WaitingSamples<Lanes> (&waiting)[Sections],
                                          float* samples,
                                          std::size_t step) {
    constexpr int vectors = AheadSection<Lanes>::vectors;
    const std::size_t mine = step - stepsBetween * (Number + 1);
    typename Lanes::Vector y[vectors];
    running[Number].step(from[Number], waiting[Number].at(mine), y);
    TESSALY_KERNEL_UNROLL
    for (int v = 0; v < vectors; ++v) {
        if constexpr (Number + 1 < Sections) {
            Lanes::store(waiting[Number + 1].at(mine) + v * Lanes::lanes, Lanes::rounded(y[v]));
        } else {
            Lanes::toSingles(samples + Lanes::ahead * mine + v * Lanes::lanes, y[v]);
        }
    }
}

template <class Lanes>
TESSALY_KERNEL_INLINE void readSamples(WaitingSamples<Lanes>& waiting,
                                       const float* samples,
                                       std::size_t step) {
    TESSALY_KERNEL_UNROLL
    for (int n = 0; n < Lanes::ahead; n += Lanes::lanes) {
        Lanes::store(waiting.at(step) + n, Lanes::fromSingles(samples + Lanes::ahead * step + n));
    }
}

/// @param count  a multiple of Lanes::ahead
template <class Lanes, int... Section>
void filterSeriesAhead(std::size_t count,
                       float* samples,
                       RunningSection* series,
                       SectionNumbers<Section...>) {
    constexpr int sections = sizeof...(Section);
    const LookAhead<Lanes::ahead> from[sections] = {LookAhead<Lanes::ahead>(series[Section])...};
    AheadSection<Lanes> running[sections] = {AheadSection<Lanes>(from[Section])...};
    WaitingSamples<Lanes> waiting[sections];
    const std::size_t steps = count / Lanes::ahead;
    constexpr std::size_t behind = stepsBetween * sections;  // the last section behind the samples
    // Sections in any order: none takes what another one leaves in the same step.
    for (std::size_t step = 0; step < steps + behind; ++step) {
        if (step >= behind && step < steps) {
            (advanceSection<Section>(from, running, waiting, samples, step), ...);
            readSamples(waiting[0], samples, step);
            continue;
        }
        const auto works = [&](std::size_t number) {
            return step >= stepsBetween * number && step < steps + stepsBetween * number;
        };
        ((works(Section + 1) ? advanceSection<Section>(from, running, waiting, samples, step)
                             : void()),
         ...);
        if (works(0)) {
            readSamples(waiting[0], samples, step);
        }
    }
    (running[Section].storeState(series[Section]), ...);
}

template <class Lanes, int... Section>
void filterSeriesOf(std::size_t count,
                    float* samples,
                    RunningSection* series,
                    SectionNumbers<Section...> numbers) {
    std::size_t done = 0;
    if constexpr (Lanes::looksAhead) {
        // Worth the sums.
        constexpr std::size_t fewest = 4 * Lanes::ahead;
        if (count >= fewest) {
            done = count / Lanes::ahead * Lanes::ahead;
            filterSeriesAhead<Lanes>(done, samples, series, numbers);
        }
    }
    filterSeriesPlain<sizeof...(Section)>(count - done, samples + done, series);
}

template <class Lanes>
void filterSeriesLanes(std::size_t count,
                       float* samples,
                       std::size_t sections,
                       RunningSection* series) {
    switch (sections) {
        case 1:
            return filterSeriesOf<Lanes>(count, samples, series, SectionNumbers<0>{});
        case 2:
            return filterSeriesOf<Lanes>(count, samples, series, SectionNumbers<0, 1>{});
        case 3:
            return filterSeriesOf<Lanes>(count, samples, series, SectionNumbers<0, 1, 2>{});
        case 4:
            return filterSeriesOf<Lanes>(count, samples, series, SectionNumbers<0, 1, 2, 3>{});
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
