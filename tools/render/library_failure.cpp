// Error codes in words.
#include "render/library_failure.h"

#include <fmt/format.h>

#include <stdexcept>

#include "base/ess_error.h"

namespace tessaly {

namespace {

const char* meaningOf(int errorState) {
    switch (errorState) {
        case essErrorBlockSize:
            return "block size refused";
        case essErrorSampleRate:
            return "sample rate refused";
        case essErrorDatabaseMissing:
            return "HRIR file missing";
        case essErrorHrirMissing:
            return "a direction has no HRIR";
        case essErrorTailUnreadable:
            return "reverb file of this rate missing";
        case essErrorWavChannels:
            return "data file with a wrong channel count";
        case essErrorWavTooShort:
            return "data file too short";
        case essErrorWavBitDepth:
            return "data file with a wrong sample format";
        case essErrorWavUnreadable:
            return "data file missing";
        case essErrorTransformPlan:
            return "no transform of this length";
        case essErrorSpectrumMemory:
            return "out of memory";
        default:
            return "unknown reason";
    }
}

}  // namespace

void checkErrorState(int errorState) {
    if (errorState != essErrorNone) {
        throw std::runtime_error(
            fmt::format("the library reports error {}: {}", errorState, meaningOf(errorState)));
    }
}

}  // namespace tessaly
