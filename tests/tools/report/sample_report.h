// Reports as a rendering makes them, without one: sounds that move between the ears, rooms that
// decay as told.
#pragma once

#include <cstddef>
#include <vector>

#include "report/report.h"

namespace tessaly {

/// A text that would break out of any place where it is not escaped.
inline constexpr const char* hostileName = "\"><script>alert('x')</script><b a='&amp;";

/// Noise whose energy falls by 60 dB in the time given, from the start on.
/// @param seed  gives other noise
std::vector<float> decayingNoise(double decaySeconds,
                                 double seconds,
                                 int sampleRate,
                                 unsigned seed);

/// A built-in sound that circles the head, with a response of a room at two moments.
ReportEntry orbitEntry(double seconds, int sampleRate);

/// Six sources round a listener that turns, above full scale, with a remark.
ReportEntry crowdEntry(double seconds, int sampleRate);

/// A short sound with a hostile name everywhere, and a response without a room.
ReportEntry hostileEntry();

Report sampleReport();

}  // namespace tessaly
