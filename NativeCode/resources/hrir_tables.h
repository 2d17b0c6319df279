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
/// Steps whenever samples behind the table may have changed, so that a reader who keeps what it
/// made of them knows. Written by database loads.
extern constinit std::uint32_t hrirTablesVersion;

/// Steps with each packed set, counted from 1; 0 before the first.
extern constinit std::uint32_t hrirStreamNumber;
/// Whether the samples of a set are still there: those of the present one, and those of the one
/// before it where it was kept. Block time.
bool hrirStreamLives(std::uint32_t number) noexcept;

/// The cell of a direction, or null for indices off the grid. Block time.
HrirSlot* filterTableCell(int indexPhi, int indexTheta) noexcept;

/// The pair array behind a slot: frames of (right, left) floats, at least `hrirMaxLength` of them
/// readable. Null if the slot is null or its entry is. Block time.
inline const float* hrirOf(HrirSlot slot) noexcept { return slot != nullptr ? *slot : nullptr; }

/// The pair array of a direction, null where nothing is mapped or off the grid. Block time.
const float* hrirAt(int indexPhi, int indexTheta) noexcept;

/// Replaces the packed set by `hrirCount` HRIRs of silence and points `hrirTable` at them, all of
/// it, so that readers through older cells find memory whatever the file read then brings. Load
/// time: allocates.
/// @param hrirLength  frames per HRIR, the stride of the new set
/// @param keepFormer  the set before lives until the next call; else it is released
void replaceHrirStream(int hrirLength, bool keepFormer = false);

/// Puts an HRIR of silence with an array of its own into the entry `nextFreeHrir` and steps that.
/// The array lives until the process ends. Load time: allocates.
/// @return the entry, or null if `hrirTable` is full
HrirSlot appendHrir(int hrirLength);

/// Releases everything and restores the start values. Only for tests, with no engine alive.
void resetHrirTables();

}  // namespace tessaly
