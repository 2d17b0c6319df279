// Numbers in the texts a user types: strict reading, no locale.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tessaly {

/// @returns the finite number that the whole text spells, or nothing
std::optional<double> numberFromText(std::string_view text) noexcept;

/// @returns the numbers of a comma-separated text, or nothing if any part is none
std::optional<std::vector<double>> numbersFromText(std::string_view text);

/// @returns the text in lower case without blanks, underscores and hyphens, for comparing names
std::string foldedName(std::string_view text);

}  // namespace tessaly
