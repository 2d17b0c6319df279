// A measured response: what arrives first, how it decays, reverberation times.
#pragma once

#include <string>

#include "report/report.h"

namespace tessaly {

/// Graphs and table of one response, under a heading of the third level.
std::string responseMarkup(const ReportResponse& response, int sampleRate);

}  // namespace tessaly
