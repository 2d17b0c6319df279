// The transform service: statuses, refusals, texts and channels, and the spectrum allocator.
#include "convolution/spectral_primitives.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <bit>
#include <string>

#include "base/ess_error.h"
#include "base/log.h"
#include "convolution/kernel_fixture.h"
#include "support/log_capture.h"
#include "support/plain_spectral.h"

namespace tessaly::test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class SpectralPrimitives : public testing::Test {
protected:
    ~SpectralPrimitives() override {
        essError = essErrorNone;
        spectralFaults = SpectralFaults{};
    }
    /// What a list of trace lines looks like in this build.
    static std::vector<std::string> traced(std::vector<std::string> lines) {
        return traceEnabled ? std::move(lines) : std::vector<std::string>{};
    }

    LogCapture log_;
};

TEST_F(SpectralPrimitives, CreateFFTMakesAUsablePlanWithoutAWord) {
    TransformHandle handle;
    EXPECT_EQ(createFFT(handle, 256), transformOk);
    EXPECT_NE(handle, nullptr);
    std::vector<float> input(256);
    std::vector<ComplexBin> bins(129);
    EXPECT_EQ(FFT(input.data(), bins.data(), handle), transformOk);
    EXPECT_EQ(IFFT(bins.data(), input.data(), handle), transformOk);
    EXPECT_THAT(log_.lines(), IsEmpty());
}

TEST_F(SpectralPrimitives, EveryStepOfAFailedCreationRunsAndReports) {
    spectralFaults.plansLeft = 0;
    TransformHandle handle;
    EXPECT_EQ(createFFT(handle, 256), transformEmptyHandle) << "status of the last step";
    EXPECT_EQ(handle, nullptr);
    EXPECT_EQ(log_.outputLines(),
              traced({"ERROR: DftiCreateDescriptor not working! 1",
                      "ERROR: DftiSetValue not working! 3", "ERROR: DftiSetValue not working! 3",
                      "ERROR: DftiCommitDescriptor not working! 3"}));
    EXPECT_THAT(log_.errorLines(), IsEmpty());
    EXPECT_EQ(essError, essErrorNone) << "the convolver sets the code";
}

TEST_F(SpectralPrimitives, FailedCreationEmptiesTheSlot) {
    TransformHandle handle;
    createFFT(handle, 64);
    ASSERT_NE(handle, nullptr);
    spectralFaults.plansLeft = 0;
    createFFT(handle, 64);
    EXPECT_EQ(handle, nullptr);
}

TEST_F(SpectralPrimitives, OnlyPowersOfTwoInRangeHavePlans) {
    for (const std::int32_t length :
         {-8, -1, 0, 1, 2, 3, 5, 6, 12, 100, 1023, 131072, INT32_MIN, INT32_MAX}) {
        TransformHandle handle;
        EXPECT_EQ(createTransform(handle, length), transformBadLength) << length;
        EXPECT_EQ(handle, nullptr);
    }
    for (std::int32_t length = 4; length <= 65536; length *= 2) {
        TransformHandle handle;
        EXPECT_EQ(createTransform(handle, length), transformOk) << length;
        EXPECT_NE(handle, nullptr);
    }
}

TEST_F(SpectralPrimitives, SettingsOtherThanTheOfferedOnesAreRefused) {
    TransformHandle handle;
    ASSERT_EQ(createTransform(handle, 16), transformOk);
    EXPECT_EQ(setTransformValue(handle, TransformSetting::placement, TransformValue::notInPlace),
              transformOk);
    EXPECT_EQ(setTransformValue(handle, TransformSetting::conjugateEvenStorage,
                                TransformValue::complexComplex),
              transformOk);
    EXPECT_EQ(setTransformValue(handle, TransformSetting::placement, TransformValue::inPlace),
              transformBadSetting);
    EXPECT_EQ(
        setTransformValue(handle, TransformSetting::placement, TransformValue::complexComplex),
        transformBadSetting);
    EXPECT_EQ(static_cast<int>(TransformSetting::placement), 11);
    EXPECT_EQ(static_cast<int>(TransformValue::notInPlace), 44);
    EXPECT_EQ(static_cast<int>(TransformSetting::conjugateEvenStorage), 10);
    EXPECT_EQ(static_cast<int>(TransformValue::complexComplex), 39);
}

TEST_F(SpectralPrimitives, UncommittedPlanIsRefused) {
    TransformHandle handle;
    ASSERT_EQ(createTransform(handle, 4), transformOk);
    std::vector<float> samples(4, 5.0f);
    std::vector<ComplexBin> bins(3, ComplexBin{5.0f, 5.0f});
    EXPECT_EQ(computeForward(handle, samples.data(), bins.data()), transformNotCommitted);
    EXPECT_EQ(computeBackward(handle, bins.data(), samples.data()), transformNotCommitted);
    EXPECT_THAT(samples, testing::Each(5.0f));
    EXPECT_EQ(commitTransform(handle), transformOk);
    EXPECT_EQ(computeForward(handle, samples.data(), bins.data()), transformOk);
}

TEST_F(SpectralPrimitives, EmptyHandleIsRefusedAndOutputsStay) {
    const TransformHandle handle;
    std::vector<float> samples(8, 5.0f);
    std::vector<ComplexBin> bins(5, ComplexBin{6.0f, 7.0f});
    EXPECT_NE(FFT(samples.data(), bins.data(), handle), 0);
    EXPECT_NE(IFFT(bins.data(), samples.data(), handle), 0);
    EXPECT_THAT(samples, testing::Each(5.0f));
    EXPECT_EQ(bins[4].im, 7.0f);
    EXPECT_EQ(setTransformValue(handle, TransformSetting::placement, TransformValue::notInPlace),
              transformEmptyHandle);
    EXPECT_EQ(commitTransform(handle), transformEmptyHandle);
}

TEST_F(SpectralPrimitives, RefusedForwardTransformIsALineOnTheOutputLog) {
    const TransformHandle handle;
    std::vector<float> samples(8);
    std::vector<ComplexBin> bins(5);
    const std::int32_t status = FFT(samples.data(), bins.data(), handle);
    EXPECT_THAT(log_.outputLines(),
                ElementsAre("Tessaly ERROR: FFT not working! status " + std::to_string(status) +
                            " " + transformMessage(status)));
    EXPECT_THAT(log_.errorLines(), IsEmpty());
}

TEST_F(SpectralPrimitives, RefusedBackwardTransformIsATraceLine) {
    const TransformHandle handle;
    std::vector<float> samples(8);
    std::vector<ComplexBin> bins(5);
    const std::int32_t status = IFFT(bins.data(), samples.data(), handle);
    EXPECT_EQ(log_.outputLines(),
              traced({"Tessaly ERROR: IFFT not working! status " + std::to_string(status) + " " +
                      transformMessage(status)}));
    EXPECT_THAT(log_.errorLines(), IsEmpty());
}

TEST_F(SpectralPrimitives, NullArraysAreRefused) {
    TransformHandle handle;
    createFFT(handle, 8);
    std::vector<float> samples(8);
    std::vector<ComplexBin> bins(5);
    EXPECT_EQ(FFT(nullptr, bins.data(), handle), transformNullArray);
    EXPECT_EQ(FFT(samples.data(), nullptr, handle), transformNullArray);
    EXPECT_EQ(IFFT(nullptr, samples.data(), handle), transformNullArray);
    EXPECT_EQ(IFFT(bins.data(), nullptr, handle), transformNullArray);
}

TEST_F(SpectralPrimitives, EveryStatusHasATextOfItsOwn) {
    std::vector<std::string> texts;
    for (std::int32_t status = transformOk; status <= transformNullArray; ++status) {
        texts.emplace_back(transformMessage(status));
        EXPECT_FALSE(texts.back().empty());
    }
    texts.emplace_back(transformMessage(-5));
    std::sort(texts.begin(), texts.end());
    EXPECT_EQ(std::unique(texts.begin(), texts.end()), texts.end());
}

TEST_F(SpectralPrimitives, SpectraAreZeroedAndAligned) {
    for (const std::int32_t count : {1, 3, 9, 129, 1025}) {
        ComplexBin* spectrum = nullptr;
        allocSpectrum(spectrum, count);
        ASSERT_NE(spectrum, nullptr);
        EXPECT_EQ(std::bit_cast<std::uintptr_t>(spectrum) % 64, 0u);
        for (std::int32_t i = 0; i < count; ++i) {
            ASSERT_EQ(spectrum[i].re, 0.0f);
            ASSERT_EQ(spectrum[i].im, 0.0f);
        }
        freeSpectrum(spectrum);
        EXPECT_EQ(spectrum, nullptr);
    }
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_THAT(log_.lines(), IsEmpty());
}

TEST_F(SpectralPrimitives, FailedAllocationSetsTheCodeAndLeavesNull) {
    spectralFaults.spectraLeft = 1;
    ComplexBin* first = nullptr;
    ComplexBin* second = reinterpret_cast<ComplexBin*>(8);
    allocSpectrum(first, 4);
    EXPECT_NE(first, nullptr);
    EXPECT_EQ(essError, essErrorNone);
    allocSpectrum(second, 4);
    EXPECT_EQ(second, nullptr);
    EXPECT_EQ(essError, -202);
    EXPECT_EQ(log_.outputLines(), traced({"Tessaly_c: calloc not sucessfull yet!"}));
    EXPECT_THAT(log_.errorLines(), IsEmpty());
    freeSpectrum(first);
}

TEST_F(SpectralPrimitives, CountsBelowOneHaveNoSpectrum) {
    for (const std::int32_t count : {0, -1, INT32_MIN}) {
        essError = essErrorNone;
        ComplexBin* spectrum = nullptr;
        allocSpectrum(spectrum, count);
        EXPECT_EQ(spectrum, nullptr);
        EXPECT_EQ(essError, -202);
    }
}

TEST_F(SpectralPrimitives, ReleaseOfNothingIsATraceLine) {
    ComplexBin* spectrum = nullptr;
    freeSpectrum(spectrum);
    EXPECT_EQ(log_.outputLines(), traced({">>DEBUG_CONV: can not delete 0"}));
    EXPECT_THAT(log_.errorLines(), IsEmpty());
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(SpectralPrimitives, ClearSpectrumTakesTheLastBinAlong) {
    for (const std::int32_t last : {0, 1, 3, 4, 7}) {
        std::vector<ComplexBin> bins(9, ComplexBin{1.0f, 2.0f});
        clearSpectrum(bins.data(), last);
        for (std::int32_t i = 0; i < 9; ++i) {
            const ComplexBin& bin = bins[static_cast<std::size_t>(i)];
            EXPECT_EQ(bin.re, i <= last ? 0.0f : 1.0f) << i << ' ' << last;
            EXPECT_EQ(bin.im, i <= last ? 0.0f : 2.0f) << i << ' ' << last;
        }
    }
    std::vector<ComplexBin> bins(1, ComplexBin{1.0f, 2.0f});
    clearSpectrum(bins.data(), -1);
    EXPECT_EQ(bins[0].re, 1.0f);
    clearSpectrum(nullptr, 3);
}

TEST_F(SpectralPrimitives, VectorOperationsEqualPlainOnesAndIgnoreEmptyCounts) {
    Noise noise(3);
    const std::vector<ComplexBin> a = noise.bins(33);
    const std::vector<ComplexBin> b = noise.bins(33);
    std::vector<ComplexBin> expected(33);
    std::vector<ComplexBin> y = a;
    plainMultiply(33, a.data(), b.data(), expected.data());
    vcMul(33, y.data(), b.data(), y.data());
    for (std::size_t i = 0; i < y.size(); ++i) {
        EXPECT_EQ(y[i].re, expected[i].re);
        EXPECT_EQ(y[i].im, expected[i].im);
    }
    y = b;
    plainAdd(33, a.data(), b.data(), expected.data());
    vcAdd(33, a.data(), y.data(), y.data());
    for (std::size_t i = 0; i < y.size(); ++i) {
        EXPECT_EQ(y[i].re, expected[i].re);
        EXPECT_EQ(y[i].im, expected[i].im);
    }
    vcMul(0, nullptr, nullptr, nullptr);
    vcAdd(-3, nullptr, nullptr, nullptr);
}

}  // namespace
}  // namespace tessaly::test
