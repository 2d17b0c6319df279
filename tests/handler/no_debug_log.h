// Counts the debug logs that handlers ask for, in a program without the host's folder.
#pragma once

namespace tessaly::test {

/// Calls of installDebugLog() so far.
int debugLogInstallations();

}  // namespace tessaly::test
