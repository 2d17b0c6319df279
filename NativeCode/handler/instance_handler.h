// Stands between one effect instance's callbacks and its engine.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>

#include "base/aligned_array.h"
#include "base/audio_thread.h"
#include "base/linear_level.h"
#include "convolution/simd/kernels.h"
#include "engine/engine_settings.h"
#include "engine/spatial_engine.h"

namespace tessaly {

/// Watches the settings that an engine cannot change, builds and swaps engines when one of them
/// differs, and feeds the engine block by block. The host's side writes the fields below at any
/// time, without a guard; they take effect at the next block.
class InstanceHandler {
public:
    /// Load time. Puts a fresh debug log behind the standard output stream. Never loads an engine:
    /// no room is selected yet.
    InstanceHandler(int hostSampleRate, int hostBuffersize);
    ~InstanceHandler();
    InstanceHandler(const InstanceHandler&) = delete;
    InstanceHandler& operator=(const InstanceHandler&) = delete;

    /// Loads an engine, on this thread, if all is known that it takes and the first one is due or
    /// a setting differs from what the present one was built with. Called at the start of every
    /// block: block time as long as nothing differs, else load time.
    /// @param hostSampleRate  Hz, 0 not known
    /// @param hostBuffersize  frames of a block, 0 not known
    /// @return true if a load was performed, whether or not it succeeded
    bool checkForChanges(int hostSampleRate, int hostBuffersize);

    /// Renders, passes on or mutes one block. Block time; a muted block writes to the log.
    /// @param in           length * inchannels floats, interleaved; null counts as silence
    /// @param out          length * outchannels floats, interleaved; null: nothing is written
    /// @param length       frames. Fewer than `blocklenght` render the block with what
    ///                     `inputBlock` still holds behind them; more give silence and one error
    ///                     line for each engine
    /// @param inchannels   1 mono; any other count is read as two channels side by side
    /// @param outchannels  2; any other count gets an error line, and a flat copy that ends with
    ///                     the engine's block
    /// @return `processResult`, always 1
    std::uint8_t processBlock(const float* in,
                              float* out,
                              std::uint32_t length,
                              int inchannels,
                              int outchannels) noexcept TESSALY_NONBLOCKING;

    /// The engine in use, null before the first load. Block time.
    SpatialEngine* activeEngine() const noexcept TESSALY_NONBLOCKING {
        const auto slot = static_cast<std::size_t>(activeInstance);
        return slot < instance.size() ? instance[slot].get() : nullptr;
    }

    /// The last call of `processBlock` rendered an input of nothing but zeros. Block time.
    bool inputWasSilent() const noexcept TESSALY_NONBLOCKING { return inputSilent_; }

    // ---- Engine slots and load state ----

    /// One engine in use and, during a load, the one that follows it.
    std::array<std::unique_ptr<SpatialEngine>, 2> instance;
    std::int16_t handlerNumber = 0;   ///< for log text
    std::int16_t activeInstance = 0;  ///< slot in use
    std::int16_t nextInstance = 0;    ///< slot that a load fills
    std::int16_t otherInstance = 1;   ///< slot that a load empties
    std::uint8_t processResult = 1;
    bool bypassExternal = false;     ///< the "Bypass" switch
    bool unityDistanceMute = false;  ///< the host's attenuation is 0 and "UnityDistance" is on
    bool internalMute = true;        ///< until the first load ends, and during every load
    bool isLoaded = false;
    std::int16_t checkCounter = 0;  ///< 0 until the first load
    std::int16_t settingsChanged = 0;

    // ---- Read by the engine through the addresses of the cells that follow them ----

    std::int16_t azimuthIn = 0;    ///< degrees, positive to the right
    std::int16_t elevationIn = 0;  ///< degrees
    float distanceIn = 1.0f;       ///< metres
    float gainDb = 0.0f;           ///< overall level
    std::int16_t* azimuthCell = &azimuthIn;
    std::int16_t* elevationCell = &elevationIn;
    float* distanceCell = &distanceIn;
    float* gainCell = &gainDb;
    float* inputBlock = nullptr;   ///< 2 * `blocklenght` floats, mono on the even slots
    float* outputBlock = nullptr;  ///< 2 * `blocklenght` floats, left first

    // ---- Settings: requested, and as the engine was built ("...In", the first two) ----

    int sampleRate = 0;   ///< Hz
    int blocklenght = 0;  ///< frames
    std::int32_t roomPreset = -1;
    std::int16_t roomPresetIn = -1;
    bool fading = true;
    bool fadingIn = false;
    bool auralisation = false;
    bool auralisationIn = false;
    bool doppler = false;
    bool dopplerIn = false;
    bool reverbActive = true;
    bool reverbActiveIn = false;
    std::uint8_t bypass3DAudioIn = 0;

    // ---- Written by the callbacks, read in every block ----

    float azimuth = 0.0f;    ///< degrees, (-180, 180]
    float elevation = 0.0f;  ///< degrees
    float reverbGainDb = 0.0f;
    float earlyGainDb = 0.0f;
    float masterGainDb = 0.0f;
    float directGainDb = 0.0f;
    float occlusion = 0.0f;        ///< 0..1, smoothed
    float occlusionTarget = 0.0f;  ///< 0..1, requested
    float distance = 9.0f;         ///< metres
    float roomSize = 1.0f;         ///< 0..1
    float distanceScale = 1.0f;
    float angleExponent = 1.0f;
    float reflectionLP = 20000.0f;  ///< Hz; a load replaces it by the room's
    float reverbLP = 20000.0f;      ///< Hz; a load replaces it by the room's
    bool unityDistance = false;     ///< take the host's attenuation in place of our distance law
    float unityAttenuation = 0.0f;
    float unityReverbMix = 1.0f;
    float earlyFadeThreshold = 0.15f;  ///< host attenuation below which reflections fade
    bool bassBoost = true;
    float inputChannel = 0.0f;             ///< -1 left .. 1 right
    float occlusionTime = 0.55f;           ///< seconds for a full swing
    float occlusionAttenuationDb = 24.0f;  ///< level drop at full occlusion
    /// Wall distances of the engine after its load, metres.
    std::array<float, 6> roomWallCopy = {1.0f, 1.0f, 1.0f, 1.0f, 1.0f, 1.0f};

    // ---- What a load hands to the engine ----

    std::int16_t qualityIn = 0;
    std::int16_t hpTFSelectIn = 0;
    std::int16_t limitThetaIn = 90;
    float settingsFloatA = 0.0f;
    float settingsFloatB = 0.0f;
    bool alwaysUpdateFilter = true;  ///< false in a reverb: its response follows changes only
    EngineSettings engineSettings;
    MixParameters mixParameters;

private:
    void loadEngine(int hostSampleRate, int hostBuffersize);
    void latchSettings(int hostSampleRate, int hostBuffersize);
    void fillEngineSettings();
    void selectRoom();
    void allocateBlocks();
    bool settingsDiffer(int hostSampleRate, int hostBuffersize) const noexcept TESSALY_NONBLOCKING;

    void updatePosition() noexcept TESSALY_NONBLOCKING;
    void updateMixValues() noexcept TESSALY_NONBLOCKING;
    void smoothOcclusion() noexcept TESSALY_NONBLOCKING;
    void applyUnityDistance() noexcept TESSALY_NONBLOCKING;
    void updateLiveControls(SpatialEngine& engine) noexcept TESSALY_NONBLOCKING;
    void renderBlock(const float* in,
                     float* out,
                     std::uint32_t length,
                     int inchannels,
                     int outchannels) noexcept TESSALY_NONBLOCKING;
    void fillInputBlock(const float* in,
                        std::uint32_t length,
                        int inchannels,
                        int outchannels) noexcept TESSALY_NONBLOCKING;
    void copyInput(const float* in,
                   std::uint32_t length,
                   int inchannels,
                   int outchannels) noexcept TESSALY_NONBLOCKING;
    void muteBlock(float* out, std::uint32_t length, int outchannels) noexcept;

    /// `azimuthIn` of an azimuth that is bent, kept for as long as both values stay.
    struct BentAzimuth {
        std::uint32_t azimuthBits = 0;
        std::uint32_t exponentBits = 0;
        std::int16_t azimuth = 0;  ///< 0 degrees stay 0 by any exponent
    };

    const SignalKernels* kernels_ = selectKernels().signal;
    BentAzimuth bentAzimuth_;
    LinearLevel directLevel_;
    LinearLevel earlyLevel_;
    LinearLevel reverbLevel_;
    bool inputSilent_ = false;
    /// `inputBlock` holds nothing but zeros.
    bool inputBlockSilent_ = false;
    AlignedArray<float> inputStorage;
    AlignedArray<float> outputStorage;
    /// Frames that the two blocks hold: `blocklenght`, or 0 where that cannot be an engine's.
    std::uint32_t blockCapacity = 0;
    /// The error line of an overlong block is out for this engine.
    bool overlongReported = false;
};

}  // namespace tessaly
