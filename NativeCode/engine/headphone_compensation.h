// Headphone compensation: which filter, and loading it.
#pragma once

#include <cstdint>
#include <string>

namespace tessaly {

/// File of a selection in the data directory, with a leading "/"; null if there is none.
const char* headphoneFileName(int selection) noexcept;

/// Makes a new process-wide `hpTFfilter` and fills it by `qvHpTFcompSelect`. Load time: reads a
/// file, allocates; also called by the block in which engine 0 sees a new selection.
/// A response shorter than 256 frames takes the small filter, moved to end with the block.
void loadHpTF(int FIR_size, int blocklenght, const std::string& bundleBasePath);

/// Takes the live selection over; on a change, or with no engine counted, switches compensation
/// and loads the filter. For engine 0 only. Block time, but for the block of a change.
void watchHeadphoneSelection(std::int16_t selection,
                             int FIR_size,
                             int blocklenght,
                             const std::string& bundleBasePath);

}  // namespace tessaly
