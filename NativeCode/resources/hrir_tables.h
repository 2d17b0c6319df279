// The process-wide HRIR tables: samples, entries and the direction table.
#pragma once

#include <cstdint>

#include "resources/hrir_grid.h"

namespace tessaly {

/// A cell of the direction table: the address of an `hrirTable` entry, null if nothing is mapped.
/// A reader follows two pointers, so a cell stays good when the set behind it is replaced.
using HrirSlot = float**;

// Written by engine construction only (database load), read by the composition of every engine.
// They outlive all engines: engines of other handlers read through them until the process ends.

/// The packed set, `databaseFrames` frames of (right, left) pairs, followed by `hrirMaxLength`
/// zero frames: an engine whose HRIRs are longer than the stored ones reads on into the next
/// entry and, behind the last one, zeros. Null before the first load.
extern constinit float* HRTFStream;
/// One pointer per stored HRIR.
extern constinit float* hrirTable[hrirCount];
/// Indexed `indexPhi` * gridThetaCount + `indexTheta`.
extern constinit HrirSlot filterTable[gridCellCount];
/// Next free entry of `hrirTable` when HRIRs come one file a direction; never restarts.
extern constinit int nextFreeHrir;
/// The `bypass3DAudio` value with which `filterTable` was last built.
extern constinit std::uint8_t databaseBypassMode;

/// The cell of a direction, or null for indices off the grid. Block time.
HrirSlot* filterTableCell(int indexPhi, int indexTheta) noexcept;

/// The pair array behind a slot: frames of (right, left) floats, at least `hrirMaxLength` of them
/// readable. Null if the slot is null or its entry is. Block time.
inline const float* hrirOf(HrirSlot slot) noexcept {
    return slot != nullptr ? *slot : nullptr;
}

/// The pair array of a direction, null where nothing is mapped or off the grid. Block time.
const float* hrirAt(int indexPhi, int indexTheta) noexcept;

/// Releases everything and restores the start values. Only for tests, with no engine alive.
void resetHrirTables();

}  // namespace tessaly
