// How far the library's blocks lie from the reference's, over one test.
#include "comparison/deviation.h"

#include <algorithm>
#include <cmath>
#include <sstream>

namespace tessaly::test {

std::string Deviation::compare(std::span<const float> library, std::span<const double> reference) {
    if (library.size() != reference.size()) {
        return "blocks of different length";
    }
    std::string first;
    for (std::size_t i = 0; i < library.size(); ++i) {
        const double value = static_cast<double>(library[i]);
        const double difference = std::abs(value - reference[i]);
        peak_ = std::max(peak_, std::abs(reference[i]));
        largest_ = std::max(largest_, difference);
        if (!(difference <= tolerance) && first.empty()) {
            std::ostringstream text;
            text << (i % 2 == 0 ? "left" : "right") << " sample " << i / 2 << " is " << value
                 << ", reference " << reference[i];
            first = text.str();
        }
    }
    samples_ += library.size();
    return first;
}

}  // namespace tessaly::test
