// Where sources and listener are, seen from above.
#pragma once

#include <string>

#include "report/report.h"

namespace tessaly {

/// The paths on a grid in metres, coloured along time, with the listener's head and marks that the
/// page's script moves while the sound plays.
/// @param duration  seconds of the sound, above 0
std::string topViewMarkup(const ReportEntry& entry, double duration);

}  // namespace tessaly
