// One source's signal path: from a mono input and its direction to a binaural pair.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "base/audio_thread.h"
#include "engine/engine_settings.h"
#include "engine/live_controls.h"

namespace tessaly {

struct EngineState;

/// Everything is decided in construction; a change of settings means a new engine. A failed
/// construction leaves an incomplete engine and a negative `essError`; such an engine may be
/// asked for anything and renders nothing.
class SpatialEngine {
public:
    /// Load time: reads files, allocates. Returns in all cases; test `essError` afterwards.
    /// @param instanceName     kept, for a debugger
    /// @param bundleBasePath   directory of all data files, no trailing slash
    /// @param blocklenght      frames of a block, a power of two from 2
    /// @param phiIn            host azimuth in degrees, positive to the right; read every block
    ///                         through two pointers, which must outlive the engine
    /// @param thetaIn          elevation in degrees, the same way
    /// @param distanceIn       metres, the same way
    /// @param gainDb           overall level in dB, the same way
    /// @param qualityValue     quality ladder, 0 = take `settings` as it stands
    /// @param settings         copied; the pointer is kept for the live headphone selection
    /// @param mixParameters    lent for the engine's life, read every block
    /// @param handlerSlot      which of the handler's two slots this engine takes
    SpatialEngine(std::string instanceName,
                  std::string bundleBasePath,
                  int blocklenght,
                  std::int16_t** phiIn,
                  std::int16_t** thetaIn,
                  float** distanceIn,
                  float** gainDb,
                  std::int16_t qualityValue,
                  EngineSettings* settings,
                  MixParameters* mixParameters,
                  std::int16_t handlerSlot);
    ~SpatialEngine();
    SpatialEngine(const SpatialEngine&) = delete;
    SpatialEngine& operator=(const SpatialEngine&) = delete;

    /// Renders one block. Block time.
    /// @param input   2 * `blocklenght` interleaved floats; the even slots are the mono input
    /// @param output  2 * `blocklenght` interleaved floats, left first; must not be the input
    /// @param slot    the handler's active slot, taken and not read
    /// @return true always; with a null input nothing is written
    bool comProcessing(float*& input, float*& output, std::int16_t slot) TESSALY_NONBLOCKING;

    /// The next call of `comProcessing` has an input of nothing but zeros, both channels: the
    /// engine need not look. Block time.
    void expectSilence() noexcept TESSALY_NONBLOCKING;

    /// Occlusion, 0 to 1: designs the input low-pass from 20000 down to 200 Hz. Block time.
    /// @return the former level
    float setInputLowPass(float level) noexcept TESSALY_NONBLOCKING;

    /// Gain of the tail by distance, for the send to shared reverbs. Block time.
    float getReverbDistanceGain() const noexcept TESSALY_NONBLOCKING;

    /// Clears all signal buffers, the response and the convolvers' rings. @return 1
    int Stop();

    /// The values a handler writes live.
    LiveControls& controls() noexcept;
    const LiveControls& controls() const noexcept;

    /// All components, for tests and for the engine's own files.
    EngineState& state() noexcept { return *state_; }
    const EngineState& state() const noexcept { return *state_; }

private:
    std::unique_ptr<EngineState> state_;
};

}  // namespace tessaly
