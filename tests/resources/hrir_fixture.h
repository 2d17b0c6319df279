// A data directory, a caught log and clean process-wide tables for each test of HRIR loading.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "base/ess_error.h"
#include "resources/hrir_database.h"
#include "resources/hrir_tables.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {

/// The direction fields of an engine, and the host's values behind them.
struct DirectionFields {
    std::int16_t phi = 0;
    std::int16_t theta = 0;
    std::int16_t phiNew = 0;
    std::int16_t indexPhi = 0;
    std::int16_t indexTheta = 0;
    std::int16_t phiIn = 0;
    std::int16_t thetaIn = 0;

    HrirRequest request() { return {phi, theta, phiNew, indexPhi, indexTheta, phiIn, thetaIn}; }
};

class HrirTest : public ::testing::Test {
protected:
    HrirTest() { putBack(); }
    ~HrirTest() override { putBack(); }

    /// Full limits, tracking, no bypass.
    HrirDatabaseSettings settings(int sampleRate) const {
        HrirDatabaseSettings made;
        made.bundleBasePath = directory_.path();
        made.sampleRate = sampleRate;
        made.hrirLength = static_cast<std::int16_t>(testHrirTaps(sampleRate));
        return made;
    }

    /// Loads a set as the first engine of a process does.
    bool loadAsFirst(HrirDatabase& database) { return database.load(0, fields_.request()); }

    TempDirectory directory_;
    DirectionFields fields_;
    LogCapture log_;

private:
    static void putBack() {
        resetHrirTables();
        essError = essErrorNone;
    }
};

/// Counts the frames of one stored HRIR that differ from testHrirSample() of number k.
inline int framesUnlike(const float* pairs, int frames, int k) {
    int unlike = 0;
    for (int n = 0; n < frames; ++n) {
        if (pairs[2 * n] != testHrirSample(k, n, 0) ||
            pairs[2 * n + 1] != testHrirSample(k, n, 1)) {
            ++unlike;
        }
    }
    return unlike;
}

/// Whether `frames` pairs are all zero.
inline bool isSilent(const float* pairs, int frames) {
    for (int n = 0; n < 2 * frames; ++n) {
        if (pairs[n] != 0.0f) {
            return false;
        }
    }
    return true;
}

}  // namespace tessaly::test
