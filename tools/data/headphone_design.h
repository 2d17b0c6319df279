// Makes the 256-tap filters of headphones.
#pragma once

#include <functional>
#include <vector>

#include "data/response_field.h"

namespace tessaly::data {

inline constexpr std::size_t headphoneTaps = 256;

/// With compensation on the engine divides its output by 3; filters have that much in the middle.
inline constexpr double headphoneMiddleDb = 9.54;

/// A wanted level over frequency at one rate.
struct HeadphoneCurve {
    int sampleRate = 0;
    std::vector<double> decibels;  ///< bins of a transform of 16384

    double at(double hertz) const noexcept;
};

/// Mean of a level in dB from 300 to 3000 Hz on a logarithmic axis.
double middleLevel(const std::function<double(double hertz)>& level);

/// A level brought into the filters' range: 0 dB in the middle, -12 to +10 dB, held above 16 kHz,
/// then raised by what the engine takes off.
HeadphoneCurve headphoneCurve(const std::function<double(double hertz)>& level, int sampleRate);

/// Level of the inverse of the frontal direction, gently regularised, 0 dB at 1 kHz.
/// @param field  that the HRIR set is made from
std::function<double(double hertz)> frontalInverse(const ResponseField& field, int sampleRate);

/// Minimum-phase filter, cut with a half-cosine fade.
/// @param taps  of the result
/// @param fade  taps at its end that are faded
std::vector<float> headphoneFilter(const HeadphoneCurve& curve, std::size_t taps, std::size_t fade);
inline constexpr std::size_t headphoneFade = 64;

/// The file for short responses: the engine moves its end to the front, so 128 zeros come before
/// 128 taps.
std::vector<float> smallHeadphoneFilter(const HeadphoneCurve& curve);

/// Level of a response at any frequency, by its own transform.
std::function<double(double hertz)> responseLevel(const std::vector<double>& response,
                                                  int sampleRate);

}  // namespace tessaly::data
