// A debug log that leaves the streams alone, so that tests can catch them.
#include "handler/no_debug_log.h"

#include "base/log.h"

namespace tessaly {

namespace {

int installations = 0;

}  // namespace

void installDebugLog() { ++installations; }

namespace test {

int debugLogInstallations() { return installations; }

}  // namespace test

}  // namespace tessaly
