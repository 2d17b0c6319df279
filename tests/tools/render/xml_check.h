// A small check that a text is well-formed XML, as far as our pictures use it.
#pragma once

#include <string>
#include <string_view>

namespace tessaly {

/// Tags closed in order, one root, attributes quoted and unique, entities known.
/// @returns the fault found, empty if there is none
std::string xmlFault(std::string_view document);

/// Number of elements of that name.
int countElements(std::string_view document, std::string_view name);

}  // namespace tessaly
