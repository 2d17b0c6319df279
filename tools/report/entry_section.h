// One output on the page: its player, its pictures, its figures.
#pragma once

#include <cstddef>
#include <string>

#include "report/report.h"

namespace tessaly {

/// Identifier of the section of an entry, for links.
std::string sectionId(std::size_t index);

/// @param index  place in the report, from 0
/// @throws std::runtime_error with one line if the sound or a picture cannot be encoded
std::string entrySection(const ReportEntry& entry, std::size_t index);

}  // namespace tessaly
