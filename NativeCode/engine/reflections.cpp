// Loading of the room preset's records and of the fixed pair.
#include "engine/reflections.h"

#include <algorithm>
#include <cstdlib>

#include "base/log.h"
#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "engine/room_presets.h"
#include "resources/hrir_tables.h"

namespace tessaly {

namespace {

constexpr std::int16_t fixedPhi1st = -90;   // degrees
constexpr std::int16_t fixedPhi2nd = 85;    // degrees
constexpr std::int16_t fixedTheta = 0;      // degrees
constexpr int headphoneFilterFrames = 256;  // the headphone filter lengthens a response by these
constexpr double recordGain = 0.55;         // on every preset gain

/// Samples by which a delay must shrink so that a whole HRIR ends with the response.
std::int32_t offsetOf(const Reflections::LoadContext& context, int delay) noexcept {
    const int reserve = context.hpTFactive ? headphoneFilterFrames : 0;
    return context.switches.hrirLength - context.FIR_size + delay + reserve;
}

/// The field is 16 bits wide, also where a long response does not fit it.
std::int16_t delayOf(int delay, std::int32_t offset) noexcept {
    return wrapToInt16(offset > 0 ? delay - offset : delay);
}

std::int16_t lengthOf(const Reflections::LoadContext& context,
                      std::int16_t delay,
                      const char* name) {
    const std::int16_t length = wrapToInt16(context.FIR_size - delay);
    if (length < context.switches.hrirLength) {
        logTrace("Buffersize to small for early Full-Length Early Relfection! ", name, " = ",
                 length);
        return length;
    }
    logTrace(name, " = ", context.switches.hrirLength);
    return context.switches.hrirLength;
}

/// One of the pair: its own file where the table does not reach, else the table's slot.
void loadFixed(const Reflections::LoadContext& context,
               std::int16_t phi,
               std::int16_t theta,
               HrirSlot& slot,
               const char* name) {
    const EffectiveSettings& switches = context.switches;
    const HrirRequest& request = context.request;
    if (std::abs(int{phi}) > switches.limitPhi || std::abs(int{theta}) > switches.limitTheta) {
        request.phi = phi;
        request.theta = theta;
        logTrace("EarlyReflection-HRIR-Degree phi ", phi, " and theta ", theta,
                 " exceeds current Degree-Limits ", switches.limitPhi, " and ", switches.limitTheta,
                 " ! Need to load them separately!");
        context.database.loadFilterFile(slot, request);
        return;
    }
    request.indexPhi = phiToIndex(phi);
    request.indexTheta = thetaToIndex(theta);
    const HrirSlot* const cell = filterTableCell(request.indexPhi, request.indexTheta);
    slot = cell != nullptr ? *cell : nullptr;
    const float* const hrir = hrirOf(slot);
    logTrace("*", name, " = ", static_cast<const void*>(hrir));
    if (hrir != nullptr) {
        logTrace("(*", name, ")[20] = ", hrir[20]);
    }
}

}  // namespace

void Reflections::loadFlexReflections(LoadContext context) {
    const HrirRequest& request = context.request;
    request.phi = request.phiNew;
    request.theta = request.thetaIn;

    RoomPreset preset;
    if (!lookUpRoomPreset(context.earlyFlexRefPreset, preset)) {
        logError("ERROR: ER-Preset doesn't exist!");
    }
    takePreset(context, preset);
    context.FIR_size = std::max(context.FIR_size, preset.earlyFlexFirSize);
    makeRecords(context, preset);
    if (context.switches.qvTrackDirection) {
        return;  // the first direction update finds the directions in the full table
    }
    for (std::size_t k = 0; k < static_cast<std::size_t>(flexReflectionCount); ++k) {
        loadRecordHrir(context, records[k]);
    }
    request.phi = request.phiNew;
    request.theta = request.thetaIn;
}

void Reflections::takePreset(const LoadContext& context, const RoomPreset& preset) {
    flexReflectionCount = preset.flexReflectionCount;
    earlyFlexFirSize = preset.earlyFlexFirSize;
    earlyPresetGain = preset.earlyPresetGain;
    presetUsesFilters = preset.presetUsesFilters;
    LiveControls& controls = context.controls;
    controls.roomDistances = preset.roomDistances;
    controls.reflectionLP_Fc = preset.reflectionLP_Fc;
    controls.reflectionLP2_Fc = preset.reflectionLP2_Fc;
    controls.reverbLP_Fc = preset.reverbLP_Fc;
    const auto lowPassAt = [&](float cutOff) {
        return Biquad(Biquad::lowPass, 0.0, Biquad::normalise(cutOff, context.sampleRate));
    };
    reflectionFilter = {lowPassAt(controls.reflectionLP_Fc), lowPassAt(controls.reflectionLP2_Fc)};
    context.tail.hasReverbLowPass = preset.hasReverbLowPass;
    if (preset.hasReverbLowPass) {
        context.tail.reverbLowPass = lowPassAt(controls.reverbLP_Fc);
    }
}

void Reflections::makeRecords(const LoadContext& context, const RoomPreset& preset) {
    for (std::size_t k = 0; k < static_cast<std::size_t>(flexReflectionCount); ++k) {
        ReflectionRecord& record = records[k];
        record = ReflectionRecord{};
        record.relativePhi = wrapToInt16(preset.presetPhi[k]);
        record.relativeTheta = wrapToInt16(preset.presetTheta[k]);
        record.phi = wrapToInt16(record.relativePhi + context.request.phi);
        record.theta = wrapToInt16(record.relativeTheta + context.request.theta);
        record.presetDelaySamples =
            truncateToInt16(static_cast<float>(preset.presetDelay[k]) * context.sampleRateRatio);
        record.delaySamples = record.presetDelaySamples;
        record.distanceGain = 1.0f;
        record.reflectionDistance = 1.0f;
        record.gain = single(wide(preset.presetGain[k]) * recordGain);
        record.filterClass =
            presetUsesFilters ? wrapToInt16(preset.presetFilterClass[k]) : std::int16_t{-1};
        if (context.earlyFlexRefPreset >= firstMetricPreset) {
            // One over the path length in metres.
            record.distanceGain =
                std::min(context.samplesPerMetre / static_cast<float>(record.delaySamples), 1.0f);
        }
    }
}

void Reflections::loadRecordHrir(const LoadContext& context, ReflectionRecord& record) {
    const HrirRequest& request = context.request;
    record.phi = wrapToInt16(turnedRound(record.phi));
    record.indexPhi = phiToIndex(record.phi);
    record.theta = std::clamp<std::int16_t>(record.theta, -steepestTheta, steepestTheta);
    record.indexTheta = thetaToIndex(record.theta);
    request.phi = record.phi;
    request.theta = record.theta;
    logTrace("EarlyFlexReflection-HRIR-Degree phi ", record.phi, " and theta ", record.theta,
             " loading separately with indexPhi = ", record.indexPhi,
             " and indexTheta = ", record.indexTheta);
    HrirSlot* const cell = filterTableCell(record.indexPhi, record.indexTheta);
    if (cell != nullptr && context.database.loadFilterFile(*cell, request)) {
        logTrace("loadet FilterFile succesfully!");
    }
}

void Reflections::loadEarlyReflections(LoadContext context) {
    erOffset1 = offsetOf(context, EARLY_REF_DELAY_INIT_1st);
    erOffset2 = offsetOf(context, EARLY_REF_DELAY_INIT_2nd);
    earlyRefDelay_1st = delayOf(EARLY_REF_DELAY_INIT_1st, erOffset1);
    earlyRefDelay_2nd = delayOf(EARLY_REF_DELAY_INIT_2nd, erOffset2);
    earlyRefLength_1st = lengthOf(context, earlyRefDelay_1st, "earlyRefLength_1st");
    earlyRefLength_2nd = lengthOf(context, earlyRefDelay_2nd, "earlyRefLength_2nd");
    earlyRefPhi = {fixedPhi1st, fixedPhi2nd};
    earlyRefTheta = {fixedTheta, fixedTheta};
    loadFixed(context, earlyRefPhi[0], earlyRefTheta[0], earlyRefFilter_1st, "earlyRefFilter_1st");
    loadFixed(context, earlyRefPhi[1], earlyRefTheta[1], earlyRefFilter_2nd, "earlyRefFilter_2nd");
}

}  // namespace tessaly
