// Values that game scripts set for all effects of the process, and the count of handlers.
#pragma once

#include <array>
#include <cstdint>
#include <string>

namespace tessaly {

// Plain values without guards: scripts write them on their own thread, the mixer's thread reads
// them at the next block.

/// Directory of the data files, no trailing slash. Written by the exported path functions, read
/// by a handler's load only.
extern std::string& bundleBasePath;
/// A path was given once in which the data files were found. Written with `bundleBasePath`; until
/// then no handler loads.
extern constinit bool assetPathSet;
/// 1: all engines pan instead of using HRIRs. Kept as the byte the script handed over; a handler
/// that loaded with another one reloads.
extern constinit std::uint8_t bypass3DAudio;
/// Metres: above, below, front, back, positive side, negative side; -1: no such wall. Written by
/// the exported function, copied into an engine in every block with auralisation.
extern constinit std::array<float, 6> roomDistances;
/// Set with `roomDistances`, never cleared: before that a room keeps its preset's walls.
extern constinit bool roomDistancesSet;
/// Block size of the spatializers, frames. Scripts may set it; a host that tells its own replaces
/// it in every block.
extern constinit int buffersizeSpat;
/// The same for the reverbs.
extern constinit int buffersizeReverb;
/// Handlers alive; written by their constructors and destructors.
extern constinit std::int16_t handlerCount;

}  // namespace tessaly
