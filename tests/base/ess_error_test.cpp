// Tests of the process-wide error state: the codes are known outside of the library.
#include "base/ess_error.h"

#include <gtest/gtest.h>

namespace tessaly {
namespace {

// Initialised before main, so no test has touched it yet.
const int valueAtStart = essError;

TEST(EssError, StartsWithoutAnError) {
    EXPECT_EQ(valueAtStart, 1);
    EXPECT_EQ(essErrorNone, 1);
}

TEST(EssError, CodesKeepTheirNumbers) {
    EXPECT_EQ(essErrorBlockSize, -101);
    EXPECT_EQ(essErrorSampleRate, -102);
    EXPECT_EQ(essErrorDatabaseMissing, -103);
    EXPECT_EQ(essErrorHrirMissing, -104);
    EXPECT_EQ(essErrorTailUnreadable, -105);
    EXPECT_EQ(essErrorWavChannels, -107);
    EXPECT_EQ(essErrorWavTooShort, -108);
    EXPECT_EQ(essErrorWavBitDepth, -109);
    EXPECT_EQ(essErrorWavUnreadable, -110);
    EXPECT_EQ(essErrorTransformPlan, -201);
    EXPECT_EQ(essErrorSpectrumMemory, -202);
}

}  // namespace
}  // namespace tessaly
