// Resets process-wide state between tests.
#include "handler/process_fixture.h"

#include "base/ess_error.h"
#include "handler/fake_engine.h"
#include "handler/process_state.h"

namespace tessaly::test {

ProcessFixture::ProcessFixture() { resetProcess(); }

ProcessFixture::~ProcessFixture() { resetProcess(); }

void ProcessFixture::setAssetPath() {
    bundleBasePath = "/data/tessaly";
    assetPathSet = true;
}

void resetProcess() {
    essError = essErrorNone;
    bundleBasePath.clear();
    assetPathSet = false;
    bypass3DAudio = 0;
    roomDistances.fill(1.0f);
    roomDistancesSet = false;
    buffersizeSpat = 0;
    buffersizeReverb = 0;
    handlerCount = 0;
    fakeEngines() = {};
}

}  // namespace tessaly::test
