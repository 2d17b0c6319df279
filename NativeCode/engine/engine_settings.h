// The records an engine is built from and reads every block, and the switches in effect.
#pragma once

#include <cstdint>
#include <string>

namespace tessaly {

/// What an engine is asked to be. Filled and owned by the handler, copied in construction; the
/// pointer is kept too, for the headphone selection. Defaults are the values a handler gives.
struct EngineSettings {
    std::uint8_t qvInterpolateSpectra = 0;  ///< spectral interpolation in the convolver
    std::uint8_t qvInterpolateFilters = 0;  ///< time-aligned blend of two responses
    std::uint8_t qvEarlyReflections = 0;    ///< the fixed pair of reflections
    std::uint8_t qvFlexReflections = 1;     ///< the room preset's reflections
    std::int16_t qvReverb = 0;              ///< tail preset, 0 none, 1 synthetic, up to 60
    std::uint8_t qvSmoothSteps = 0;         ///< limits steps of angle and distance
    std::uint8_t fading = 1;                ///< two convolvers and a crossfade
    std::uint8_t qvTrackDirection = 1;      ///< 0: one fixed HRIR
    std::uint8_t qvUse256HRIR = 0;          ///< HRIRs of 256 frames
    std::int16_t limitPhi = 180;            ///< azimuth range, degrees either side, 0..180
    std::int16_t limitTheta = 90;           ///< elevation range, degrees either side, 0..90
    std::int16_t qvUpdateInterval = 1;      ///< blocks between direction updates, 1 or more
    std::int16_t qvHpTFcompSelect = 0;      ///< headphone filter, 0 none
    std::int16_t atmoSelect = 0;            ///< ambience loop 1..3, 0 none
    std::uint8_t debugDump = 0;             ///< allocate the dump buffer and print from it
    std::string debugDumpName;              ///< base name of the dump, for the log only
    std::uint8_t alwaysUpdateFilter = 1;    ///< rebuild the response on every tick
    std::int16_t settingsReserved = 1;      ///< carried, never read
    std::int16_t earlyFlexRefPreset = 0;    ///< reflection preset, 0 none, up to 60
    int sampleRate = 0;                     ///< Hz: 24000, 44100 or 48000
    int defaultFirSize = 4096;              ///< response length before the room decides, frames
    std::int16_t settingsReserved2 = 0;     ///< carried, never read
    std::uint8_t auralisation = 0;          ///< walls follow the source
    std::uint8_t doppler = 0;               ///< delay line in the input
    float dopplerScale = 1.0f;              ///< copied, not used by the delay line
    std::uint8_t bypass3DAudio = 0;         ///< pan pairs instead of HRIRs
    float settingsFloatA = 0.0f;            ///< carried, never read
    float settingsFloatB = 0.0f;            ///< carried, never read
};

/// Per-block mix values, written by the handler, read by its engine. An engine built with
/// `alwaysUpdateFilter` off compares all ten with the last block's to see a change; the three
/// slots without a writer exist for that comparison.
struct MixParameters {
    float directGain = 1.0f;  ///< linear gain of the direct path
    float earlyGain = 1.0f;   ///< linear gain of the reflections
    float reverbGain = 1.0f;  ///< linear gain of the tail
    float mixCutoffSlot = 20000.0f;
    float reverbCutoff = 20000.0f;  ///< Hz; kept by handlers with `alwaysUpdateFilter` off
    float mixSlot = 0.0f;
    float unityAttenuation = 1.0f;   ///< the host's attenuation of this block
    std::uint8_t unityDistance = 0;  ///< 1: the host's attenuation replaces the distance law
    float mixRoomSlot = 40.0f;
    float roomSize = 1.0f;  ///< kept by handlers with `alwaysUpdateFilter` off

    bool operator==(const MixParameters&) const = default;
};

/// The switches the engine tests: the settings, or the quality ladder's choice.
struct EffectiveSettings {
    bool qvInterpolateSpectra = false;
    bool qvInterpolateFilters = false;
    bool interpolateAngles = false;  ///< either interpolation: directions move in 1-degree steps
    bool qvEarlyReflections = false;
    bool qvFlexReflections = false;
    std::int16_t qvReverb = 0;
    bool qvSmoothSteps = false;
    bool fading = false;
    bool qvTrackDirection = false;
    bool qvUse256HRIR = false;
    std::int16_t qvUpdateInterval = 0;  ///< never below 1 where it divides
    std::int16_t atmoSelect = 0;
    bool useElevation = false;
    std::int16_t limitPhi = 0;    ///< degrees, a multiple of 5
    std::int16_t limitTheta = 0;  ///< degrees, a multiple of 5
    bool phiLimited = false;
    bool thetaLimited = false;
    bool doppler = false;
    float dopplerScale = 0.0f;
    std::uint8_t alwaysUpdateFilter = 0;  ///< acts at the value 1 exactly
    std::uint8_t mixParametersChanged = 0;
    bool bypass3DAudio = false;
    bool auralisation = false;
    bool qvDiagnosticsA = false;
    bool qvDiagnosticsB = false;
    bool qvDiagnosticsC = false;
    std::int16_t hrirLength = 0;  ///< frames: 70, 128 or 139 by rate, or 256
};

/// Compares two records field by field; a NaN in a float field counts as a change. Block time.
bool mixParametersDiffer(const MixParameters& a, const MixParameters& b) noexcept;

/// The settings step of construction: settings or quality ladder to effective switches.
/// Load time: logs. Writes the process-wide headphone selection.
/// @param settings        the engine's copy, limits already checked
/// @param qualityValue    0 takes the settings, above 0 applies the ladder, negative neither
/// @param effective       in: as constructed; out: the switches in effect
/// @param angleStep       set to 1 degree when directions are interpolated
/// @param instanceNumber  the ambience plays in engine 0 only
/// @param blocklenght     frames; no headphone compensation below 1024
/// @param atmoBlocks      the value of `ATMO_BLOCKS` for the log
void setQualitySettings(const EngineSettings& settings,
                        std::int16_t qualityValue,
                        EffectiveSettings& effective,
                        std::int16_t& angleStep,
                        std::int16_t instanceNumber,
                        int blocklenght,
                        int atmoBlocks);

}  // namespace tessaly
