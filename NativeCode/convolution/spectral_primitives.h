// The transform service, operations on complex arrays and the spectrum allocator of the convolver.
#pragma once

#include <cstdint>
#include <memory>

#include "base/audio_thread.h"
#include "convolution/complex_bin.h"

namespace tessaly {

struct TransformPlan;
struct TransformPlanDeleter {
    void operator()(TransformPlan* plan) const noexcept;
};

/// Owner of one plan; null while empty. Used by one thread at a time: it holds work memory.
using TransformHandle = std::unique_ptr<TransformPlan, TransformPlanDeleter>;

/// Statuses of the transform service.
constexpr std::int32_t transformOk = 0;
constexpr std::int32_t transformNoMemory = 1;      ///< no memory for the plan
constexpr std::int32_t transformBadLength = 2;     ///< not a power of two from 4 to 65536
constexpr std::int32_t transformEmptyHandle = 3;   ///< no plan behind the handle
constexpr std::int32_t transformBadSetting = 4;    ///< a setting this service does not offer
constexpr std::int32_t transformNotCommitted = 5;  ///< the plan was never committed
constexpr std::int32_t transformNullArray = 6;     ///< input or output is null
constexpr std::int32_t transformOtherKind = 7;     ///< the plan is for block spectra only

constexpr std::int32_t transformLengthMin = 4;
constexpr std::int32_t transformLengthMax = 65536;

/// Text of a status, never null.
const char* transformMessage(std::int32_t status) noexcept;

enum class TransformSetting : std::int32_t { conjugateEvenStorage = 10, placement = 11 };
enum class TransformValue : std::int32_t { complexComplex = 39, inPlace = 43, notInPlace = 44 };

/// Makes a plan for real blocks of `length` single-precision samples. Load time: allocates.
/// @return a status; on failure the handle is null
std::int32_t createTransform(TransformHandle& handle, std::int32_t length) noexcept;
/// Accepts separate arrays and complex storage, the only forms there are. Load time.
std::int32_t setTransformValue(const TransformHandle& handle,
                               TransformSetting setting,
                               TransformValue value) noexcept;
/// Makes the plan usable. Load time.
std::int32_t commitTransform(const TransformHandle& handle) noexcept;
/// 2B reals to B+1 bins, e^(-i...), no scale factor; the arrays must not overlap. Block time.
std::int32_t computeForward(const TransformHandle& handle,
                            const float* input,
                            ComplexBin* output) noexcept TESSALY_NONBLOCKING;
/// B+1 bins to 2B reals, e^(+i...), no scale factor: forward and backward multiply by 2B. The
/// imaginary parts of bins 0 and B are ignored; the arrays must not overlap. Block time.
std::int32_t computeBackward(const TransformHandle& handle,
                             const ComplexBin* input,
                             float* output) noexcept TESSALY_NONBLOCKING;

/// The transform of overlap-save blocks, of which only the second half of a result is heard: B bins
/// whose products stand for convolution with that half right, in an order of the chosen kernels'
/// own. Such spectra mix with each other only, and only if made with the same kernels.
/// 2B reals, the input window, to B bins. Block time.
std::int32_t computeWindow(const TransformHandle& handle,
                           const float* input,
                           ComplexBin* output) noexcept TESSALY_NONBLOCKING;
/// As computeWindow, of B reals that B zeros follow, a partition of a response; the zeros are not
/// read. Block time.
/// @param sounding  where bit k of 64 is 0, samples k B/64 to (k + 1) B/64 - 1 are zeros, too
std::int32_t computePartition(const TransformHandle& handle,
                              const float* input,
                              ComplexBin* output,
                              std::uint64_t sounding = ~std::uint64_t{
                                  0}) noexcept TESSALY_NONBLOCKING;
/// The start of the other half of such a result: what the half that is heard gives, continued by B
/// samples, is taken away there from the product's own start (in simd/negacyclic_template.h why).
struct WrappedSamples {
    float* output = nullptr;   ///< room for `samples` and 15 more, up to B; null: none wanted
    std::int32_t samples = 0;  ///< samples 0 to `samples` - 1 of the window, up to B
};
/// B bins to samples B to B + `samples` - 1 of the window, 2B times as computeBackward gives them.
/// `output` has room for B floats; those behind the samples are undefined. Block time.
std::int32_t computeBlock(const TransformHandle& handle,
                          const ComplexBin* input,
                          float* output,
                          std::int32_t samples,
                          WrappedSamples wrapped = {}) noexcept TESSALY_NONBLOCKING;
/// A committed plan of which only the three above can be used. Load time: allocates.
/// @return a status; on failure the handle is null
std::int32_t createBlockTransform(TransformHandle& handle, std::int32_t length) noexcept;

/// Creates, sets and commits a plan for `length` real samples. A failing step writes a trace line
/// and the next one runs all the same. Load time: allocates.
/// @return the status of the last step; `handle` is null if there is no plan
std::int32_t createFFT(TransformHandle& handle, std::int32_t length) noexcept;
/// Forward transform; a refusal is a line on the standard output log and leaves `output` as it
/// was. Block time, but for that line.
std::int32_t FFT(const float* input, ComplexBin* output, const TransformHandle& handle) noexcept;
/// Transforms of a window and of a partition to block spectra; likewise. Block time.
std::int32_t windowFFT(const float* input,
                       ComplexBin* output,
                       const TransformHandle& handle) noexcept;
std::int32_t partitionFFT(const float* input,
                          ComplexBin* output,
                          const TransformHandle& handle,
                          std::uint64_t sounding = ~std::uint64_t{0}) noexcept;
/// Backward transform; a refusal is a trace line and leaves `output` as it was. Block time.
std::int32_t IFFT(const ComplexBin* input, float* output, const TransformHandle& handle) noexcept;
/// Backward transform of a block spectrum, the first `samples` of its B samples; likewise. Block
/// time.
std::int32_t blockIFFT(const ComplexBin* input,
                       float* output,
                       std::int32_t samples,
                       const TransformHandle& handle,
                       WrappedSamples wrapped = {}) noexcept;

/// Fills `slot` with `count` zeroed bins on a 64-byte boundary; load time. On failure (no memory,
/// or a count below 1) the slot is null, `essError` is -202 and a trace line tells.
void allocSpectrum(ComplexBin*& slot, std::int32_t count) noexcept;
/// Releases a spectrum and empties its slot; a null slot is a trace line. Load time.
void freeSpectrum(ComplexBin*& slot) noexcept;
/// Zeroes bins 0 to `last` inclusive. A null spectrum or a negative `last` does nothing. Block
/// time.
void clearSpectrum(ComplexBin* spectrum, std::int32_t last) noexcept TESSALY_NONBLOCKING;

/// y[i] = a[i] * b[i] and y[i] = a[i] + b[i]; y may be a or b itself. Block time.
void vcMul(std::int32_t count,
           const ComplexBin* a,
           const ComplexBin* b,
           ComplexBin* y) noexcept TESSALY_NONBLOCKING;
void vcAdd(std::int32_t count,
           const ComplexBin* a,
           const ComplexBin* b,
           ComplexBin* y) noexcept TESSALY_NONBLOCKING;

/// Makes the service run out of plans or memory, for tests: each count is the number of requests
/// that still succeed, negative for no limit. Written by tests, read by the two allocators.
struct SpectralFaults {
    std::int32_t plansLeft = -1;
    std::int32_t spectraLeft = -1;
};
extern constinit SpectralFaults spectralFaults;

}  // namespace tessaly
