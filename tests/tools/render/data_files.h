// Data files of the right size that hold silence, sparse on disk.
#pragma once

#include <cstdint>
#include <filesystem>
#include <fstream>

namespace tessaly {

inline void putSized(const std::filesystem::path& file, std::uintmax_t bytes) {
    std::ofstream(file, std::ios::binary | std::ios::trunc).close();
    std::filesystem::resize_file(file, bytes);
}

/// @param taps  frames of a response
inline void putResponses(const std::filesystem::path& file, unsigned taps) {
    putSized(file, 44 + std::uintmax_t{2522} * taps * 8);
}

/// All tails at the start of the file, which is as long as the longest at 48000 Hz needs.
inline void putTails(const std::filesystem::path& file) {
    putSized(file, 242 + std::uintmax_t{220245} * 8);
}

}  // namespace tessaly
