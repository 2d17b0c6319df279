// A process of the library and one of the reference, side by side, each as if freshly started.
#pragma once

#include <gtest/gtest.h>

#include <array>
#include <map>
#include <memory>
#include <utility>

#include "comparison/compared_source.h"
#include "comparison/deviation.h"
#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/reference/reference_hrir.h"
#include "support/reference/reference_process.h"
#include "support/test_data.h"

namespace tessaly::test {

inline constexpr std::array<int, 3> sampleRates = {24000, 44100, 48000};

/// HRIRs of 256 frames by quality value.
constexpr bool usesLongHrirs(int quality) { return quality >= 2 && quality != 6 && quality != 8; }

/// Tells at its end how far the two were apart, on the console and in the result file.
class ComparisonFixture : public EngineFixture {
protected:
    void TearDown() override;

    /// A pair of engines. The set of its rate and length is written on first use.
    std::unique_ptr<ComparedSource> source(const reference::EngineOptions& options,
                                           const SourceValues& values = {});

    /// Both processes back to their start. No source may be alive.
    void restart();

    /// Blocks that fill a span of time at a rate, at least `least`.
    static int blocksOf(double seconds, int sampleRate, int blockLength, int least);

    reference::Process process;
    Deviation deviation;
    /// What the loudest sample has to reach, lest silence is compared with silence.
    double leastPeak = 0.05;

private:
    const TempDirectory& directoryOf(int sampleRate, bool use256);
    LogCapture quiet_;  ///< loads write pages of log
    std::map<std::pair<int, bool>, TempDirectory> directories_;
    std::map<std::pair<int, int>, reference::HrirFile> files_;
};

}  // namespace tessaly::test
