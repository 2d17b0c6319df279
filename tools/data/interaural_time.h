// Interaural time differences: the spherical head's, and the one found in a pair of responses.
#pragma once

#include <optional>
#include <vector>

#include "data/minimum_phase.h"
#include "data/sphere.h"

namespace tessaly::data {

inline constexpr double soundSpeed = 343.0;   ///< m/s, of the data's own formulas
inline constexpr double headRadius = 0.0875;  ///< m
inline constexpr double headSeconds = headRadius / soundSpeed;

/// Time difference of a rigid sphere (Woodworth) in seconds; positive: left ear first.
double woodworth(Direction direction) noexcept;

/// Lateral angle in radians, 0..pi/2, at which the sphere's time difference is `seconds` >= 0.
double woodworthInverse(double seconds) noexcept;

/// Delays in seconds relative to the head's centre.
struct EarDelays {
    double left = 0.0;
    double right = 0.0;
};

/// Splits a time difference so that the centre of the head stays fixed in time.
EarDelays earDelays(double itdSeconds) noexcept;

/// Estimates the time difference of response pairs of one length and rate, from the phase that is
/// left after the minimum phase is taken out, 500 to 3000 Hz. Holds work buffers.
class ItdEstimator {
public:
    ItdEstimator(double sampleRate, std::size_t taps);

    /// @param left, right     `taps` samples each, not all zero
    /// @param centreSeconds   expected value
    /// @param halfWidth       search range either side in seconds
    /// @param extraSeconds    delay of the right ear less that of the left beside the samples
    /// @return seconds, positive: left first; nothing if the ears are not correlated in the range
    std::optional<double> estimate(const double* left,
                                   const double* right,
                                   double centreSeconds,
                                   double halfWidth,
                                   double extraSeconds = 0.0);

private:
    void excessPhase(const double* response, std::vector<Complex>& excess);
    double correlation(double lagSamples) const;

    double sampleRate_;
    std::size_t taps_;
    RealTransform transform_;
    MinimumPhase minimumPhase_;
    std::size_t firstBin_;
    std::size_t lastBin_;
    std::vector<double> time_;
    std::vector<Complex> spectrum_;
    std::vector<Complex> logSpectrum_;
    std::vector<double> logMagnitude_;
    std::vector<Complex> left_;
    std::vector<Complex> right_;
    std::vector<Complex> cross_;
};

/// Search range either side of the sphere's value for a measured or built pair.
inline constexpr double itdSearchSeconds = 0.25e-3;

}  // namespace tessaly::data
