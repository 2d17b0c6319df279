// Strict reading of numbers and lenient comparing of names.
#include "render/text_numbers.h"

#include <charconv>
#include <cmath>
#include <string>

namespace tessaly {

std::optional<double> numberFromText(std::string_view text) noexcept {
    if (!text.empty() && text.front() == '+') {
        text.remove_prefix(1);
    }
    double value = 0.0;
    const char* end = text.data() + text.size();
    const std::from_chars_result result = std::from_chars(text.data(), end, value);
    if (result.ec != std::errc{} || result.ptr != end || !std::isfinite(value)) {
        return std::nullopt;
    }
    return value;
}

std::optional<std::vector<double>> numbersFromText(std::string_view text) {
    std::vector<double> numbers;
    for (;;) {
        const std::size_t comma = text.find(',');
        const std::optional<double> number = numberFromText(text.substr(0, comma));
        if (!number) {
            return std::nullopt;
        }
        numbers.push_back(*number);
        if (comma == std::string_view::npos) {
            return numbers;
        }
        text.remove_prefix(comma + 1);
    }
}

std::string foldedName(std::string_view text) {
    std::string folded;
    for (const char c : text) {
        if (c == ' ' || c == '_' || c == '-') {
            continue;
        }
        const bool upper = c >= 'A' && c <= 'Z';
        folded.push_back(upper ? static_cast<char>(c - 'A' + 'a') : c);
    }
    return folded;
}

}  // namespace tessaly
