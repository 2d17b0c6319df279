// Picks the kernels by what the CPU has.
#include "convolution/simd/kernels.h"

#if defined(_MSC_VER) && !defined(__clang__) && (defined(_M_X64) || defined(_M_IX86))
#include <immintrin.h>
#include <intrin.h>
#endif

namespace tessaly {
namespace {

struct CpuFeatures {
    bool sse2 = false;
    bool avx2AndFma = false;
    bool avx512 = false;
};

CpuFeatures readCpuFeatures() noexcept {
    CpuFeatures features;
#if defined(_MSC_VER) && !defined(__clang__) && (defined(_M_X64) || defined(_M_IX86))
    int leaf1[4];
    int leaf7[4];
    __cpuid(leaf1, 1);
    __cpuidex(leaf7, 7, 0);
    features.sse2 = (leaf1[3] & (1 << 26)) != 0;
    if ((leaf1[2] & (1 << 27)) != 0) {
        const unsigned long long saved = _xgetbv(0);
        features.avx2AndFma =
            (saved & 0x6) == 0x6 && (leaf1[2] & (1 << 12)) != 0 && (leaf7[1] & (1 << 5)) != 0;
        features.avx512 =
            (saved & 0xe6) == 0xe6 && features.avx2AndFma && (leaf7[1] & (1 << 16)) != 0;
    }
#elif defined(__x86_64__) || defined(__i386__)
    // The compiler's own question also asks whether the system saves the wide registers.
    __builtin_cpu_init();
    features.sse2 = __builtin_cpu_supports("sse2") != 0;
    features.avx2AndFma = __builtin_cpu_supports("avx2") != 0 && __builtin_cpu_supports("fma") != 0;
    features.avx512 = features.avx2AndFma && __builtin_cpu_supports("avx512f") != 0;
#endif
    return features;
}

KernelList listKernels() noexcept {
    const CpuFeatures features = readCpuFeatures();
    KernelList list{{kernelsScalar}, 1};
    const auto offer = [&list](const Kernels* kernels, bool supported) {
        if (kernels != nullptr && supported) {
            list.tables[list.count] = kernels;
            ++list.count;
        }
    };
    offer(kernelsNeon, true);
    offer(kernelsSse2, features.sse2);
    offer(kernelsAvx2, features.avx2AndFma);
    offer(kernelsAvx512, features.avx512);
    return list;
}

constinit const Kernels* forced = nullptr;  // written by tests and benchmarks only

}  // namespace

const KernelList& availableKernels() noexcept {
    static const KernelList list = listKernels();
    return list;
}

const Kernels& selectKernels() noexcept {
    if (forced != nullptr) {
        return *forced;
    }
    const KernelList& list = availableKernels();
    return *list.tables[list.count - 1];
}

void forceKernels(const Kernels* kernels) noexcept { forced = kernels; }

}  // namespace tessaly
