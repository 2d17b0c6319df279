// Early reflections: the room preset's records and the fixed pair.
#pragma once

#include <array>
#include <cstdint>

#include "engine/biquad.h"
#include "engine/engine_settings.h"
#include "engine/live_controls.h"
#include "engine/reverb_tail.h"
#include "resources/hrir_database.h"

namespace tessaly {

struct RoomPreset;

/// From this preset on gains follow the path length.
inline constexpr int firstMetricPreset = 13;
/// Steepest elevation of a reflection, degrees.
inline constexpr std::int16_t steepestTheta = 75;

/// An azimuth of up to one turn off, in degrees, as -179..180.
constexpr int turnedRound(int phi) noexcept {
    return phi <= -180 ? phi + 360 : (phi > 180 ? phi - 360 : phi);
}

/// One reflection of the room.
struct ReflectionRecord {
    std::int16_t relativePhi = 0;         ///< degrees from the source's azimuth
    std::int16_t relativeTheta = 0;       ///< degrees from the source's elevation
    std::int16_t phi = 0;                 ///< degrees
    std::int16_t theta = 0;               ///< degrees
    std::int16_t indexPhi = 0;            ///< 0..72
    std::int16_t indexTheta = 0;          ///< 0..36
    std::int16_t presetDelaySamples = 0;  ///< the preset's delay at this sample rate
    std::int16_t delaySamples = 0;        ///< first frame in the response; may have wrapped
    float distanceGain = 0.0f;            ///< by path length, at most 1
    float gain = 0.0f;                    ///< preset gain times 0.55
    std::int16_t filterClass = -1;        ///< -1 no filter, 0 or 1: which `reflectionFilter`
    float wallDistance = 0.0f;            ///< metres, first six records; negative: no such wall
    float reflectionDistance = 0.0f;      ///< metres of path
};

class Reflections {
public:
    static constexpr int capacity = 20;
    static constexpr int EARLY_REF_DELAY_INIT_1st = 664;  ///< samples, at every rate
    static constexpr int EARLY_REF_DELAY_INIT_2nd = 664;  ///< samples, at every rate

    /// What loading needs of the engine.
    struct LoadContext {
        const EffectiveSettings& switches;
        int sampleRate;         ///< Hz
        float sampleRateRatio;  ///< to 44100 Hz
        float samplesPerMetre;
        bool hpTFactive;  ///< shifts the fixed pair by 256 samples more
        std::int16_t earlyFlexRefPreset;
        HrirDatabase& database;
        HrirRequest request;     ///< the engine's direction fields
        LiveControls& controls;  ///< takes the preset's cut-offs and walls
        ReverbTail& tail;        ///< takes the preset's low-pass
        int& FIR_size;           ///< raised to what the room needs
    };

    /// The room preset's records. Load time.
    void loadFlexReflections(LoadContext context);
    /// The fixed pair at -90 and 85 degrees. Load time.
    void loadEarlyReflections(LoadContext context);

    std::array<ReflectionRecord, capacity> records{};
    std::int16_t flexReflectionCount = 0;  ///< records in use
    int earlyFlexFirSize = 0;              ///< frames the room needs
    float earlyPresetGain = 1.0f;          ///< overall gain of the room's reflections
    bool presetUsesFilters = false;
    std::array<Biquad, 2> reflectionFilter{};

    std::int32_t erOffset1 = 0;  ///< samples by which the delay must shrink to fit
    std::int32_t erOffset2 = 0;
    std::array<std::int16_t, 2> earlyRefPhi{};
    std::array<std::int16_t, 2> earlyRefTheta{};
    std::int16_t earlyRefDelay_1st = 0;
    std::int16_t earlyRefDelay_2nd = 0;
    std::int16_t earlyRefLength_1st = 0;
    std::int16_t earlyRefLength_2nd = 0;
    HrirSlot earlyRefFilter_1st = nullptr;  ///< null: silent
    HrirSlot earlyRefFilter_2nd = nullptr;

private:
    void takePreset(const LoadContext& context, const RoomPreset& preset);
    void makeRecords(const LoadContext& context, const RoomPreset& preset);
    /// Fetches the direction of a record into its cell, for engines without the full table.
    static void loadRecordHrir(const LoadContext& context, ReflectionRecord& record);
};

}  // namespace tessaly
