// The table of decay times and hand-set levels; the rest follows from the engine's rooms.
#include "data/tail_design.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>

#include "data/data_error.h"
#include "data/sphere.h"

namespace tessaly::data {

namespace {

constexpr double byRule = std::numeric_limits<double>::quiet_NaN();

struct Row {
    int preset;
    const char* name;
    RoomClass roomClass;
    double midSeconds;
    double directToReverb;  // dB set by hand, or by volume and decay
};

// clang-format off
// preset, name, class, mid decay time s, direct to reverberant dB
constexpr std::array<Row, tailPresetCount> rows = {{
    {15, "SmallRoomStone",           RoomClass::stone,     0.45, byRule},
    {16, "FamousConcerthall",        RoomClass::hall,      1.6,  byRule},
    {17, "SmallWoodRoom",            RoomClass::wood,      0.6,  byRule},
    {18, "Bath1",                    RoomClass::tile,      0.55, byRule},
    {19, "Cinema",                   RoomClass::treated,   0.55, byRule},
    {20, "CarD",                     RoomClass::car,       0.07, byRule},
    {21, "EmptyRoom",                RoomClass::hard,      0.75, byRule},
    {22, "Warehouse",                RoomClass::stone,     4.0,  byRule},
    {23, "Small Livingroom",         RoomClass::furnished, 0.4,  byRule},
    {24, "LargeRoom",                RoomClass::hard,      1.2,  byRule},
    {25, "CathedralB",               RoomClass::stone,     4.2,  byRule},
    {26, "Chapel",                   RoomClass::stone,     3.2,  byRule},
    {27, "Corridor",                 RoomClass::hard,      1.0,  byRule},
    {28, "MediumRoomOffice",         RoomClass::furnished, 0.4,  byRule},
    {29, "Outdoor2",                 RoomClass::outdoor,   0.9,  14.0},
    {30, "ConcerthallFinnland_S1r3", RoomClass::hall,      1.7,  byRule},
    {31, "AccousticGuitar",          RoomClass::wood,      1.5,  9.0},
    {32, "AmbiencePlate",            RoomClass::plate,     0.55, 5.0},
    {33, "ShortEchos",               RoomClass::outdoor,   0.4,  9.0},
    {34, "ConcertArena",             RoomClass::hall,      2.3,  byRule},
    {35, "Dense Hall",               RoomClass::hall,      2.3,  byRule},
    {36, "DrumChamber",              RoomClass::hard,      1.5,  byRule},
    {37, "FamousStringHall",         RoomClass::hall,      2.3,  byRule},
    {38, "Gold Hall",                RoomClass::hall,      2.1,  byRule},
    {39, "HardDrumRoom",             RoomClass::hard,      1.6,  byRule},
    {40, "HeavyAmbience",            RoomClass::ambience,  0.85, 4.0},
    {41, "SpaceshipCabine",          RoomClass::metal,     0.25, byRule},
    {42, "LiveStudioRoom",           RoomClass::wood,      1.1,  byRule},
    {43, "MediumAmbience",           RoomClass::ambience,  0.65, 5.0},
    {44, "NiceVocalPlate",           RoomClass::plate,     2.2,  6.0},
    {45, "PercussionAmbience",       RoomClass::ambience,  0.55, 5.0},
    {46, "PercussionPlate",          RoomClass::plate,     1.2,  5.0},
    {47, "CathedralEngland",         RoomClass::stone,     2.1,  byRule},
    {48, "SmallAmbience",            RoomClass::ambience,  0.5,  6.0},
    {49, "StageHall",                RoomClass::hall,      1.8,  byRule},
    {50, "StringPlate",              RoomClass::plate,     2.3,  6.0},
    {51, "Bath2",                    RoomClass::tile,      0.7,  byRule},
    {52, "CarB",                     RoomClass::car,       0.06, byRule},
    {53, "SmallRoom",                RoomClass::hard,      0.4,  byRule},
    {54, "AulaAachen",               RoomClass::stone,     2.6,  byRule},
    {55, "LectureRoomAachen",        RoomClass::hard,      0.75, byRule},
    {56, "MeetingRoomAachen",        RoomClass::furnished, 0.25, byRule},
    {57, "OfficeAachen",             RoomClass::furnished, 0.45, byRule},
    {58, "StairwayAachen",           RoomClass::hard,      0.85, byRule},
    {59, "SendesaalLargeWDR",        RoomClass::hall,      1.8,  byRule},
    {60, "SendesaalSmallWDR",        RoomClass::hall,      1.0,  byRule},
}};
// clang-format on

constexpr int corridorPreset = 27;
constexpr int outdoorPreset = 29;
constexpr int echoesPreset = 33;

constexpr double startShare = 0.4;  // of the onset
constexpr double plateOnset = 4e-3;
constexpr double ambienceOnset = 12e-3;
constexpr double outdoorOnset = 100e-3;
constexpr double echoesOnset = 30e-3;
constexpr double presetDelayRate = 44100.0;  // Hz
constexpr std::size_t wallCount = 6;

// Critical distance of a source of directivity factor 2, and what makes the ratio right at 3 m:
// the engine's direct law falls by 5.97 dB from 1 m, not by 9.54.
constexpr double criticalDistance = 0.0566;
constexpr double lawOffset = -3.57;   // dB
constexpr double driestRatio = 12.0;  // dB; keeps large rooms audible
constexpr double wettestRatio = -6.0;

/// Energy that the reflections have left for the tail: exp(-11 onset / T).
constexpr double onsetDecay = 11.0;

constexpr double outdoorElevation = 20.0;  // degrees either side

double volumeOf(const RoomPreset& room) noexcept {
    const std::array<float, 6>& d = room.roomDistances;
    const bool closed = std::all_of(d.begin(), d.end(), [](float wall) { return wall > 0.0f; });
    const auto span = [&d](std::size_t i) {
        return static_cast<double>(d[i]) + static_cast<double>(d[i + 1]);
    };
    return closed ? span(0) * span(2) * span(4) : 0.0;
}

double onsetOf(const Row& row, const RoomPreset& room, double volume) noexcept {
    if (row.preset == outdoorPreset) {
        return outdoorOnset;
    }
    if (row.preset == echoesPreset) {
        return echoesOnset;
    }
    if (row.roomClass == RoomClass::plate) {
        return plateOnset;
    }
    if (row.roomClass == RoomClass::ambience) {
        return ambienceOnset;
    }
    double longest = 0.0;
    for (std::size_t i = 0; i < wallCount && i < room.presetDelay.size; ++i) {
        if (room.presetGain[i] > 0.0f && room.roomDistances[i] > 0.0f) {
            longest = std::max(longest, room.presetDelay[i] / presetDelayRate);
        }
    }
    return std::min(longest, 1e-3 * std::sqrt(volume));
}

TailDesign designOf(const Row& row) {
    TailDesign design;
    design.preset = row.preset;
    design.name = row.name;
    design.decay = DecayTime(row.roomClass, row.midSeconds);
    if (row.roomClass == RoomClass::plate) {
        design.shape = TailShape::plate;
    } else if (row.preset == outdoorPreset) {
        design.shape = TailShape::outdoor;
    } else if (row.preset == echoesPreset) {
        design.shape = TailShape::echoes;
    }
    design.corridor = row.preset == corridorPreset;
    lookUpRoomPreset(row.preset, design.room);
    design.volume = volumeOf(design.room);
    design.enclosed = design.volume > 0.0;
    design.onsetSeconds = onsetOf(row, design.room, design.volume);
    design.startSeconds = startShare * design.onsetSeconds;
    design.directToReverbSet = !std::isnan(row.directToReverb);
    design.directToReverb =
        design.directToReverbSet
            ? row.directToReverb
            : std::clamp(20.0 * std::log10(criticalDistance *
                                           std::sqrt(2.0 * design.volume / row.midSeconds)) +
                             lawOffset,
                         wettestRatio, driestRatio);
    const ReverbPreset* preset = findReverbPreset(row.preset);
    design.frames48000 = static_cast<std::size_t>(preset->length48000);
    design.presetGain = preset->reverbPresetGain;
    return design;
}

}  // namespace

double TailDesign::directToTail() const noexcept {
    const double left = directToReverbSet ? 0.0 : onsetDecay * onsetSeconds / decay.mid();
    return directToReverb + 10.0 * left / std::log(10.0);
}

const std::vector<TailDesign>& tailDesigns() {
    static const std::vector<TailDesign> designs = [] {
        std::vector<TailDesign> all;
        for (const Row& row : rows) {
            all.push_back(designOf(row));
        }
        return all;
    }();
    return designs;
}

const TailDesign& tailDesign(int preset) {
    if (preset < firstTailPreset || preset > reverbPresetCount) {
        throw DataError("preset {} has no tail, expected {} to {}", preset, firstTailPreset,
                        reverbPresetCount);
    }
    return tailDesigns()[static_cast<std::size_t>(preset - firstTailPreset)];
}

std::size_t storedTailFrames(const TailDesign& design, int sampleRate) noexcept {
    const auto rate = static_cast<std::size_t>(sampleRate);
    constexpr auto designRate = static_cast<std::size_t>(tailDesignRate);
    return (design.frames48000 * rate + designRate - 1) / designRate;
}

std::vector<double> directionWeights(const TailDesign& design) {
    std::vector<double> weights = areaWeights();
    for (std::size_t i = 0; i < weights.size(); ++i) {
        const GridEntry& at = packedOrder()[i];
        if (design.corridor) {
            const double along = std::cos(radians(static_cast<double>(at.phi)));
            weights[i] *= 0.25 + along * along;
        }
        if (!design.enclosed && std::abs(at.theta) > outdoorElevation) {
            weights[i] = 0.0;
        }
    }
    return weights;
}

}  // namespace tessaly::data
