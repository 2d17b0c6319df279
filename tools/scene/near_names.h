// Finds what a misspelt name was meant to be.
#pragma once

#include <span>
#include <string>
#include <string_view>

namespace tessaly {

/// @returns the candidate that differs least from the name, if it differs by no more than a third
///          of its letters; case, blanks and underscores do not count; empty if there is none
std::string_view nearestName(std::string_view name, std::span<const std::string_view> candidates);

/// Words to add to a message: ", did you mean "position"?", or nothing.
std::string didYouMean(std::string_view name, std::span<const std::string_view> candidates);

/// A text from a file in a form fit for a one-line message: quoted, printable ASCII only, the rest
/// as question marks, cut after 40 characters.
std::string inQuotes(std::string_view text);

}  // namespace tessaly
