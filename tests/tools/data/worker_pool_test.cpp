// Work spread over threads, and sample-rate conversion.
#include "data/worker_pool.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cmath>
#include <numbers>
#include <stdexcept>

#include "data/resampler.h"

namespace tessaly::data {
namespace {

TEST(WorkerPool, DoesEveryPieceOnce) {
    std::vector<std::atomic<int>> done(1000);
    forEachParallel(done.size(), [&done](std::size_t i) { ++done[i]; });
    for (const std::atomic<int>& count : done) {
        EXPECT_EQ(count, 1);
    }
    forEachParallel(0, [](std::size_t) { FAIL(); });
}

TEST(WorkerPool, PassesAFailureOnAndEnds) {
    const auto failing = [](std::size_t i) {
        if (i == 3) {
            throw std::runtime_error("three");
        }
    };
    EXPECT_THROW(forEachParallel(100, failing), std::runtime_error);
}

TEST(Resampler, KeepsTimeAndShape) {
    constexpr double hertz = 440.0;
    std::vector<double> sine(2 * 9600);
    for (std::size_t i = 0; i < 9600; ++i) {
        const double turns = hertz * static_cast<double>(i) / 48000.0;
        sine[2 * i] = std::sin(2.0 * std::numbers::pi * turns);
        sine[2 * i + 1] = -sine[2 * i];
    }
    const std::vector<double> slower = resample(sine, 2, 48000.0, 44100.0, 8820);
    ASSERT_EQ(slower.size(), 2u * 8820u);
    for (std::size_t i = 2000; i < 6000; ++i) {
        const double turns = hertz * static_cast<double>(i) / 44100.0;
        ASSERT_NEAR(slower[2 * i], std::sin(2.0 * std::numbers::pi * turns), 1e-6) << i;
        ASSERT_NEAR(slower[2 * i + 1], -slower[2 * i], 1e-9) << i;
    }
    EXPECT_EQ(resample(sine, 2, 48000.0, 48000.0, 9600), sine);
    const std::vector<double> padded = resample(sine, 2, 48000.0, 48000.0, 9700);
    EXPECT_EQ(padded.size(), 2u * 9700u);
    EXPECT_EQ(padded.back(), 0.0);
}

TEST(Resampler, CutsSoundsThatAreLongerThanWanted) {
    const std::vector<double> constant(20000, 1.0);
    for (const double rate : {24000.0, 44100.0, 48000.0}) {
        const std::vector<double> part = resample(constant, 1, 32000.0, rate, 10000);
        ASSERT_EQ(part.size(), 10000u);
        EXPECT_NEAR(part.back(), 1.0, 1e-6) << rate;
    }
}

TEST(Resampler, ResponsesKeepTheirGainAtFrequencyZero) {
    std::vector<double> impulse(4000);
    impulse[2000] = 1.0;
    for (const double rate : {24000.0, 44100.0, 96000.0}) {
        const auto frames = static_cast<std::size_t>(4000.0 * rate / 48000.0);
        double sum = 0.0;
        for (const double sample : resampleResponse(impulse, 1, 48000.0, rate, frames)) {
            sum += sample;
        }
        EXPECT_NEAR(sum, 1.0, 1e-3) << rate;
    }
}

}  // namespace
}  // namespace tessaly::data
