// Edit distances between names.
#include "scene/near_names.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstddef>
#include <vector>

#include "render/text_numbers.h"

namespace tessaly {

namespace {

constexpr std::size_t longestName = 40;  // characters that are compared or shown
constexpr std::size_t mostEdits = 3;

// Letters inserted, left out, replaced or swapped with their neighbour on the way from one to the
// other.
std::size_t editsBetween(const std::string& from, const std::string& to) {
    const std::size_t width = to.size() + 1;
    std::vector<std::size_t> edits((from.size() + 1) * width);  // of the first i and j letters
    for (std::size_t i = 0; i <= from.size(); ++i) {
        for (std::size_t j = 0; j <= to.size(); ++j) {
            std::size_t& here = edits[i * width + j];
            if (i == 0 || j == 0) {
                here = i + j;
                continue;
            }
            const std::size_t above = edits[(i - 1) * width + j];
            const std::size_t before = edits[i * width + j - 1];
            const std::size_t diagonal = edits[(i - 1) * width + j - 1];
            const bool same = from[i - 1] == to[j - 1];
            here = std::min({above + 1, before + 1, diagonal + (same ? 0 : 1)});
            if (i > 1 && j > 1 && from[i - 1] == to[j - 2] && from[i - 2] == to[j - 1]) {
                here = std::min(here, edits[(i - 2) * width + j - 2] + 1);
            }
        }
    }
    return edits.back();
}

}  // namespace

std::string_view nearestName(std::string_view name, std::span<const std::string_view> candidates) {
    if (name.size() > longestName) {
        return {};
    }
    const std::string wanted = foldedName(name);
    std::string_view nearest;
    std::size_t fewest = mostEdits + 1;
    for (const std::string_view candidate : candidates) {
        const std::size_t edits = editsBetween(wanted, foldedName(candidate));
        if (edits < fewest && 3 * edits <= candidate.size()) {
            fewest = edits;
            nearest = candidate;
        }
    }
    return nearest;
}

std::string didYouMean(std::string_view name, std::span<const std::string_view> candidates) {
    const std::string_view nearest = nearestName(name, candidates);
    return nearest.empty() ? std::string() : fmt::format(", did you mean \"{}\"?", nearest);
}

std::string inQuotes(std::string_view text) {
    std::string result = "\"";
    for (const char c : text.substr(0, longestName)) {
        result.push_back(c >= ' ' && c <= '~' ? c : '?');
    }
    return result + (text.size() > longestName ? "...\"" : "\"");
}

}  // namespace tessaly
