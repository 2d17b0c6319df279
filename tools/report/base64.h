// Bytes as text, for what lies inside the page.
#pragma once

#include <span>
#include <string>
#include <string_view>

namespace tessaly {

/// The bytes in base 64, padded, without line breaks.
std::string base64(std::span<const unsigned char> bytes);

/// An address that is the content itself.
/// @param mediaType  e.g. "image/png"
std::string dataUri(std::string_view mediaType, std::span<const unsigned char> bytes);

}  // namespace tessaly
