// Puts the process-wide values of handler and host back around each test.
#pragma once

#include <gtest/gtest.h>

namespace tessaly::test {

/// Start values of the process, no engine built. Destroy handlers before the test ends.
class ProcessFixture : public ::testing::Test {
protected:
    ProcessFixture();
    ~ProcessFixture() override;

    /// What lets handlers load: a data path that was found.
    static void setAssetPath();
};

/// Restores the start values of the handler's process-wide state, `essError` and the fake engines.
void resetProcess();

}  // namespace tessaly::test
