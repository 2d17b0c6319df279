// Prints figures as a table, one column a rate.
#pragma once

#include <string>
#include <vector>

#include "data/acceptance.h"

namespace tessaly::data {

struct FigureColumn {
    std::string title;  ///< e.g. "44100/128"
    std::vector<Figure> figures;
};

/// Rows are matched by name; a value outside its range is marked with "!".
std::string figureTable(const std::vector<FigureColumn>& columns);

/// One line for each figure outside its range.
std::vector<std::string> failedFigures(const std::vector<FigureColumn>& columns);

}  // namespace tessaly::data
