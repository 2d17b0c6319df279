// Parametric equaliser settings: their level over frequency, and their text form.
#pragma once

#include <string>
#include <vector>

namespace tessaly::data {

enum class EqType { peaking, lowShelf, highShelf };

/// One second-order section of the audio-EQ cookbook.
struct EqFilter {
    EqType type = EqType::peaking;
    double hertz = 0.0;
    double gainDb = 0.0;
    double q = 0.0;
};

/// Level of all filters together in dB. They are designed for 48000 Hz, whatever rate their result
/// is then sampled at.
/// @param hertz  0 to 24000
double eqLevel(const std::vector<EqFilter>& filters, double hertz) noexcept;

/// Reads lines like "Filter 1: ON PK Fc 105 Hz Gain 1.0 dB Q 0.70", with PK, LSC or HSC. Filters
/// that are OFF, preamp lines, comments (#) and empty lines are passed over.
/// @param name  for messages
/// @throws DataError naming the line, and if there is no filter
std::vector<EqFilter> parseEqText(const std::string& text, const std::string& name);

}  // namespace tessaly::data
