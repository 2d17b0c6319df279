// Three bytes become four letters.
#include "report/base64.h"

#include <cstddef>
#include <cstdint>

namespace tessaly {

std::string base64(std::span<const unsigned char> bytes) {
    constexpr std::string_view letters =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string text;
    text.reserve((bytes.size() + 2) / 3 * 4);
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        const std::size_t count = bytes.size() - i < 3 ? bytes.size() - i : 3;
        std::uint32_t group = 0;
        for (std::size_t k = 0; k < 3; ++k) {
            group = group << 8 | (k < count ? bytes[i + k] : 0u);
        }
        for (std::size_t k = 0; k < 4; ++k) {
            text += k <= count ? letters[group >> (18 - 6 * k) & 63u] : '=';
        }
    }
    return text;
}

std::string dataUri(std::string_view mediaType, std::span<const unsigned char> bytes) {
    std::string text = "data:";
    text += mediaType;
    text += ";base64,";
    text += base64(bytes);
    return text;
}

}  // namespace tessaly
