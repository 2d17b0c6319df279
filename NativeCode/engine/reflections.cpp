// Loading of the room preset's records and of the fixed pair.
#include "engine/reflections.h"

#include <cstdlib>

#include "base/log.h"
#include "base/numeric_conversion.h"
#include "resources/hrir_tables.h"

namespace tessaly {

namespace {

constexpr std::int16_t fixedPhi1st = -90;   // degrees
constexpr std::int16_t fixedPhi2nd = 85;    // degrees
constexpr std::int16_t fixedTheta = 0;      // degrees
constexpr int headphoneFilterFrames = 256;  // the headphone filter lengthens a response by these
constexpr int highestPreset = 60;

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
    context.request.phi = context.request.phiNew;
    context.request.theta = context.request.thetaIn;
    if (context.earlyFlexRefPreset < 0 || context.earlyFlexRefPreset > highestPreset) {
        logError("ERROR: ER-Preset doesn't exist!");
    }

    // Rooms are dry: no preset has rows yet, so every room is one without reflections.
    flexReflectionCount = 0;

    const LiveControls& controls = context.controls;
    const std::array<float, 2> cutOffs = {controls.reflectionLP_Fc, controls.reflectionLP2_Fc};
    for (std::size_t k = 0; k < cutOffs.size(); ++k) {
        reflectionFilter[k] =
            Biquad(Biquad::lowPass, 0.0, Biquad::normalise(cutOffs[k], context.sampleRate));
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
