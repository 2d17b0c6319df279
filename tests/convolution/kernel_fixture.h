// Every kernel table that can run here, and seeded noise to feed it.
#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <ostream>
#include <random>
#include <string>
#include <vector>

#include "base/aligned_array.h"
#include "convolution/complex_bin.h"
#include "convolution/simd/kernels.h"

#if defined(TESSALY_EMULATED_KERNELS)
namespace tessaly {
// Sources for other machines, built over an emulation of their instructions.
extern const Kernels* const kernelsAvx512Emulated;
extern const Kernels* const kernelsNeonEmulated;
}  // namespace tessaly
#endif

namespace tessaly {

inline void PrintTo(const Kernels* kernels, std::ostream* out) { *out << kernels->name; }

}  // namespace tessaly

namespace tessaly::test {

/// The tables this CPU can run, and the emulated ones where they were built.
inline std::vector<const Kernels*> testableKernels() {
    const KernelList& list = availableKernels();
    std::vector<const Kernels*> tables(list.tables, list.tables + list.count);
#if defined(TESSALY_EMULATED_KERNELS)
    if (tables.back() == kernelsAvx2 || tables.back() == kernelsAvx512) {
        tables.push_back(kernelsAvx512Emulated);
    }
    tables.push_back(kernelsNeonEmulated);
#endif
    return tables;
}

/// Names a test by its table; an emulated one has the name of a native one.
inline std::string kernelTestName(const testing::TestParamInfo<const Kernels*>& tested) {
    const KernelList& list = availableKernels();
    const bool native = tested.index < list.count;
    return std::string(tested.param->name) + (native ? "" : "Emulated");
}

/// Noise between -1 and 1, the same for a seed on every machine.
class Noise {
public:
    explicit Noise(std::uint32_t seed) : generator_(seed) {}

    float operator()() {
        return static_cast<float>(generator_() >> 8) * (2.0f / 16777216.0f) - 1.0f;
    }
    std::vector<float> samples(std::size_t count) {
        std::vector<float> values(count);
        for (float& value : values) {
            value = (*this)();
        }
        return values;
    }
    std::vector<ComplexBin> bins(std::size_t count) {
        std::vector<ComplexBin> values(count);
        for (ComplexBin& value : values) {
            value.re = (*this)();
            value.im = (*this)();
        }
        return values;
    }

private:
    std::mt19937 generator_;
};

/// Ends a forced choice of kernels with the scope.
class ForcedKernels {
public:
    explicit ForcedKernels(const Kernels* kernels) { forceKernels(kernels); }
    ~ForcedKernels() { forceKernels(nullptr); }
    ForcedKernels(const ForcedKernels&) = delete;
    ForcedKernels& operator=(const ForcedKernels&) = delete;
};

}  // namespace tessaly::test
