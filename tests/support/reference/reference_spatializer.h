// The spatializer effect of the reference: host parameters, matrices, sends, around one handler.
#pragma once

#include <array>
#include <span>
#include <utility>
#include <vector>

#include "support/reference/reference_handler.h"

namespace tessaly::reference {

/// Where a source stands, in whole single precision as the handler gets it.
struct HostDirection {
    float azimuth = 0.0f;    ///< degrees in (-180, 180], positive toward +x
    float elevation = 0.0f;  ///< degrees, positive toward +y
};

/// The direction of a source by the host's column-major 4x4 matrices.
HostDirection directionOf(std::span<const float, 16> listener, std::span<const float, 16> source);

/// One "Tessaly Engine" effect with a stereo output. A pass-through (other than two output
/// channels, no spatializer data) is the caller's business.
class Spatializer {
public:
    explicit Spatializer(Process& process) : process_(process), handler(process) {}

private:
    Process& process_;

public:
    Handler handler;

    /// A host parameter by index, 0 to 19. @return false above that
    bool setParameter(int index, float value);

    /// The host's distance callback.
    void setDistance(float distance, float attenuation, float reverbZoneMix);

    /// One block. @param hostBlockSize  dspbuffersize; 0 keeps the size set by the scripts
    void process(std::span<const float, 16> listener,
                 std::span<const float, 16> source,
                 std::span<const float> input,
                 int frames,
                 int inputChannels,
                 int sampleRate,
                 int hostBlockSize,
                 std::vector<double>& output);

private:
    void send(std::span<const float> input, int frames, int inputChannels);

    static constexpr int mostSends = 50;
    int sendPosition_ = 0;
    int sendCount_ = 0;
    std::array<std::pair<int, int>, mostSends> sends_{};  ///< reverb ID, level in whole dB
};

}  // namespace tessaly::reference
