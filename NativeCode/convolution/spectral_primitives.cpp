// The transform service and its reports, vector operations and the spectrum allocator.
#include "convolution/spectral_primitives.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstring>
#include <new>

#include "base/aligned_array.h"
#include "base/aligned_memory.h"
#include "base/ess_error.h"
#include "base/log.h"
#include "convolution/simd/kernels.h"
#include "convolution/transform_tables.h"

namespace tessaly {
namespace {

/// Transforms up to this length work on the stack, which all sources of a thread share: memory of
/// their own would be out of the nearest caches whenever they come round.
constexpr std::int32_t stackLength = 2048;
constexpr std::size_t stackFloats = transformWorkFloats(stackLength / 2);

/// Takes one request from a count that tests may have limited.
bool stillAllowed(std::int32_t& left) noexcept {
    if (left == 0) {
        return false;
    }
    if (left > 0) {
        --left;
    }
    return true;
}

}  // namespace

constinit SpectralFaults spectralFaults;

struct TransformPlan {
    TransformPlan(std::int32_t length, bool blocksOnly)
        : kernels(selectKernels()),
          tables(blocksOnly ? nullptr
                            : transformTables(length / 2, kernels.transformLanes(length / 2))),
          blocks(blockTables(length / 2, kernels.transformLanes(length / 2))),
          work(length > stackLength ? transformWorkFloats(length / 2) : 0) {}

    const Kernels& kernels;
    const TransformTables* tables;  ///< null in a plan for block spectra only
    const BlockTables* blocks;
    AlignedArray<float> work;  ///< of long transforms; short ones work on the stack
    bool committed = false;
};

void TransformPlanDeleter::operator()(TransformPlan* plan) const noexcept {
    std::default_delete<TransformPlan>{}(plan);
}

const char* transformMessage(std::int32_t status) noexcept {
    switch (status) {
        case transformOk:
            return "no error";
        case transformNoMemory:
            return "no memory for the transform";
        case transformBadLength:
            return "transform length is not supported";
        case transformEmptyHandle:
            return "transform handle is empty";
        case transformBadSetting:
            return "transform setting is not supported";
        case transformNotCommitted:
            return "transform is not committed";
        case transformNullArray:
            return "transform input or output is missing";
        case transformOtherKind:
            return "transform is for block spectra only";
        default:
            return "unknown transform status";
    }
}

namespace {

std::int32_t createPlan(TransformHandle& handle, std::int32_t length, bool blocksOnly) noexcept {
    handle.reset();
    if (length < transformLengthMin || length > transformLengthMax ||
        !std::has_single_bit(static_cast<std::uint32_t>(length))) {
        return transformBadLength;
    }
    if (!stillAllowed(spectralFaults.plansLeft)) {
        return transformNoMemory;
    }
    try {
        handle.reset(std::make_unique<TransformPlan>(length, blocksOnly).release());
    } catch (const std::bad_alloc&) {
        return transformNoMemory;
    }
    if (handle->blocks == nullptr || (handle->tables == nullptr && !blocksOnly)) {
        handle.reset();
        return transformNoMemory;
    }
    return transformOk;
}

}  // namespace

std::int32_t createTransform(TransformHandle& handle, std::int32_t length) noexcept {
    return createPlan(handle, length, false);
}

std::int32_t createBlockTransform(TransformHandle& handle, std::int32_t length) noexcept {
    const std::int32_t status = createPlan(handle, length, true);
    return status == transformOk ? commitTransform(handle) : status;
}

std::int32_t setTransformValue(const TransformHandle& handle,
                               TransformSetting setting,
                               TransformValue value) noexcept {
    if (handle == nullptr) {
        return transformEmptyHandle;
    }
    const bool offered =
        (setting == TransformSetting::placement && value == TransformValue::notInPlace) ||
        (setting == TransformSetting::conjugateEvenStorage &&
         value == TransformValue::complexComplex);
    return offered ? transformOk : transformBadSetting;
}

std::int32_t commitTransform(const TransformHandle& handle) noexcept {
    if (handle == nullptr) {
        return transformEmptyHandle;
    }
    handle->committed = true;
    return transformOk;
}

namespace {

/// Runs `transform` if the plan and both arrays are there. @return a status
template <typename Input, typename Output, typename Transform>
std::int32_t compute(const TransformHandle& handle,
                     const Input* input,
                     Output* output,
                     Transform&& transform) noexcept {
    if (handle == nullptr) {
        return transformEmptyHandle;
    }
    if (!handle->committed) {
        return transformNotCommitted;
    }
    if (input == nullptr || output == nullptr) {
        return transformNullArray;
    }
    if (handle->work.empty()) {
        alignas(AlignedArray<float>::alignment) float work[stackFloats];
        return transform(*handle, static_cast<float*>(work));
    }
    return transform(*handle, handle->work.data());
}

/// A transform of the handle's plan for natural order.
template <typename Transform>
auto inOrder(Transform&& transform) noexcept {
    return [transform](const TransformPlan& plan, float* work) noexcept {
        if (plan.tables == nullptr) {
            return transformOtherKind;
        }
        transform(plan.kernels, *plan.tables, work);
        return transformOk;
    };
}

/// A transform of its plan for block spectra.
template <typename Transform>
auto ofBlocks(Transform&& transform) noexcept {
    return [transform](const TransformPlan& plan, float* work) noexcept {
        transform(plan.kernels, *plan.blocks, work);
        return transformOk;
    };
}

std::int32_t reportForward(std::int32_t status) noexcept {
    if (status != transformOk) {
        logOutput("Tessaly ERROR: FFT not working! status ", status, ' ', transformMessage(status));
    }
    return status;
}

std::int32_t reportBackward(std::int32_t status) noexcept {
    if (status != transformOk) {
        logTrace("Tessaly ERROR: IFFT not working! status ", status, ' ', transformMessage(status));
    }
    return status;
}

}  // namespace

std::int32_t computeForward(const TransformHandle& handle,
                            const float* input,
                            ComplexBin* output) noexcept {
    return compute(handle, input, output,
                   inOrder([=](const Kernels& kernels, const TransformTables& tables, float* work) {
                       kernels.forward(tables, input, output, work);
                   }));
}

std::int32_t computeBackward(const TransformHandle& handle,
                             const ComplexBin* input,
                             float* output) noexcept {
    return compute(handle, input, output,
                   inOrder([=](const Kernels& kernels, const TransformTables& tables, float* work) {
                       kernels.backward(tables, input, output, work);
                   }));
}

std::int32_t computeWindow(const TransformHandle& handle,
                           const float* input,
                           ComplexBin* output) noexcept {
    return compute(handle, input, output,
                   ofBlocks([=](const Kernels& kernels, const BlockTables& tables, float*) {
                       kernels.window(tables, input, output);
                   }));
}

std::int32_t computePartition(const TransformHandle& handle,
                              const float* input,
                              ComplexBin* output,
                              std::uint64_t sounding) noexcept {
    return compute(handle, input, output,
                   ofBlocks([=](const Kernels& kernels, const BlockTables& tables, float*) {
                       kernels.partition(tables, input, output, sounding);
                   }));
}

std::int32_t computeBlock(const TransformHandle& handle,
                          const ComplexBin* input,
                          float* output,
                          std::int32_t samples,
                          WrappedSamples wrapped) noexcept {
    return compute(handle, input, output,
                   ofBlocks([=](const Kernels& kernels, const BlockTables& tables, float* work) {
                       const auto upTo = [&](std::int32_t wanted) {
                           return static_cast<std::size_t>(std::clamp(wanted, 0, tables.points));
                       };
                       kernels.block(tables, input, output, work, upTo(samples), wrapped.output,
                                     wrapped.output != nullptr ? upTo(wrapped.samples) : 0);
                   }));
}

std::int32_t createFFT(TransformHandle& handle, std::int32_t length) noexcept {
    std::int32_t status = createTransform(handle, length);
    if (status != transformOk) {
        logTrace("ERROR: DftiCreateDescriptor not working! ", status);
    }
    status = setTransformValue(handle, TransformSetting::placement, TransformValue::notInPlace);
    if (status != transformOk) {
        logTrace("ERROR: DftiSetValue not working! ", status);
    }
    status = setTransformValue(handle, TransformSetting::conjugateEvenStorage,
                               TransformValue::complexComplex);
    if (status != transformOk) {
        logTrace("ERROR: DftiSetValue not working! ", status);
    }
    status = commitTransform(handle);
    if (status != transformOk) {
        logTrace("ERROR: DftiCommitDescriptor not working! ", status);
    }
    return status;
}

std::int32_t FFT(const float* input, ComplexBin* output, const TransformHandle& handle) noexcept {
    return reportForward(computeForward(handle, input, output));
}

std::int32_t windowFFT(const float* input,
                       ComplexBin* output,
                       const TransformHandle& handle) noexcept {
    return reportForward(computeWindow(handle, input, output));
}

std::int32_t partitionFFT(const float* input,
                          ComplexBin* output,
                          const TransformHandle& handle,
                          std::uint64_t sounding) noexcept {
    return reportForward(computePartition(handle, input, output, sounding));
}

std::int32_t IFFT(const ComplexBin* input, float* output, const TransformHandle& handle) noexcept {
    return reportBackward(computeBackward(handle, input, output));
}

std::int32_t blockIFFT(const ComplexBin* input,
                       float* output,
                       std::int32_t samples,
                       const TransformHandle& handle,
                       WrappedSamples wrapped) noexcept {
    return reportBackward(computeBlock(handle, input, output, samples, wrapped));
}

void allocSpectrum(ComplexBin*& slot, std::int32_t count) noexcept {
    slot = nullptr;
    if (count > 0 && stillAllowed(spectralFaults.spectraLeft)) {
        slot = static_cast<ComplexBin*>(
            allocateZeroed(static_cast<std::size_t>(count) * sizeof(ComplexBin)));
    }
    if (slot == nullptr) {
        logTrace("Tessaly_c: calloc not sucessfull yet!");
        essError = essErrorSpectrumMemory;
    }
}

void freeSpectrum(ComplexBin*& slot) noexcept {
    if (slot == nullptr) {
        logTrace(">>DEBUG_CONV: can not delete ", static_cast<const void*>(slot));
        return;
    }
    releaseAligned(slot);
    slot = nullptr;
}

void clearSpectrum(ComplexBin* spectrum, std::int32_t last) noexcept {
    if (spectrum != nullptr && last >= 0) {
        const std::size_t bins = static_cast<std::size_t>(last) + 1;
        std::memset(static_cast<void*>(spectrum), 0, bins * sizeof(ComplexBin));
    }
}

void vcMul(std::int32_t count, const ComplexBin* a, const ComplexBin* b, ComplexBin* y) noexcept {
    if (count > 0) {
        selectKernels().multiply(static_cast<std::size_t>(count), a, b, y);
    }
}

void vcAdd(std::int32_t count, const ComplexBin* a, const ComplexBin* b, ComplexBin* y) noexcept {
    if (count > 0) {
        selectKernels().add(static_cast<std::size_t>(count), a, b, y);
    }
}

}  // namespace tessaly
