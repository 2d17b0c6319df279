// SHA-256 checksums for the manifest.
#pragma once

#include <filesystem>
#include <string>
#include <string_view>

namespace tessaly::data {

/// 64 lower-case hexadecimal digits.
std::string sha256(std::string_view bytes);

/// @throws DataError if the file cannot be read
std::string sha256OfFile(const std::filesystem::path& path);

}  // namespace tessaly::data
