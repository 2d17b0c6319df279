// The three log channels. Each call writes one line and flushes once.
#pragma once

#include <iostream>

namespace tessaly {

#if defined(TESSALY_TRACE) && TESSALY_TRACE
inline constexpr bool traceEnabled = true;
#else
inline constexpr bool traceEnabled = false;
#endif

/// Puts the debugger's stream buffer behind the standard output stream. Defined by the host
/// folder, called by each new instance handler. Load time: allocates.
void installDebugLog();

/// One line on the standard output log. The caller gives the prefix, e.g. "Tessaly_h: ".
template <typename... Parts>
void logOutput(const Parts&... parts) {
    (std::cout << ... << parts) << std::endl;
}

/// One line on the standard error stream.
template <typename... Parts>
void logError(const Parts&... parts) {
    (std::cerr << ... << parts) << std::endl;
}

/// The same line on both channels, standard output first.
template <typename... Parts>
void logBoth(const Parts&... parts) {
    logOutput(parts...);
    logError(parts...);
}

/// A trace line: dropped, unless the build asks for tracing; then it joins the output log.
template <typename... Parts>
void logTrace([[maybe_unused]] const Parts&... parts) {
    if constexpr (traceEnabled) {
        logOutput(parts...);
    }
}

}  // namespace tessaly
