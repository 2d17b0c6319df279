// One block of one handler: host values to engine values, then render, bypass or silence.
#include <algorithm>
#include <bit>
#include <cmath>

#include "base/ess_error.h"
#include "base/even_slots.h"
#include "base/log.h"
#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "handler/block_copy.h"
#include "handler/instance_handler.h"
#include "handler/process_state.h"

namespace tessaly {

namespace {

constexpr float highestInputChannel = 1e6f;  // 1 is the right channel alone

/// Exponents this near to 1 leave the angle as it is; compared in double.
constexpr double plainExponentFrom = 0.99;
constexpr double plainExponentTo = 1.01;
/// Degrees: the front quadrants end here, at the sides.
constexpr float quadrant = 90.0f;
/// Second-order reflections are filtered at half the cut-off.
constexpr float secondOrderCutoff = 0.5f;

/// Bends the two front quadrants, 0 and 90 degrees staying where they are; the rear is not bent.
/// @param azimuth  degrees
/// @return degrees, truncated toward zero
std::int16_t bendAzimuth(float azimuth, float exponent) noexcept TESSALY_NONBLOCKING {
    if (wide(exponent) >= plainExponentFrom && wide(exponent) <= plainExponentTo) {
        return truncateToInt16(azimuth);
    }
    if (azimuth > 0.0f && azimuth < quadrant) {
        return truncateToInt16(std::pow(azimuth, exponent) * quadrant /
                               std::pow(quadrant, exponent));
    }
    if (azimuth > -quadrant && azimuth < 0.0f) {
        return truncateToInt16(std::pow(std::fabs(azimuth), exponent) * -quadrant /
                               std::pow(quadrant, exponent));
    }
    return truncateToInt16(azimuth);
}

void bypassBlock(const float* in,
                 float* out,
                 std::uint32_t length,
                 int inchannels,
                 int outchannels) noexcept TESSALY_NONBLOCKING {
    if (inchannels != 1 || in == nullptr || out == nullptr) {
        copyOrZero(in, floatsIn(length, inchannels), out, floatsIn(length, outchannels));
        return;
    }
    // Channels beyond the second are left as the host gave them.
    const std::size_t stride = floatsIn(1, outchannels);
    const std::size_t written = std::min<std::size_t>(stride, 2);
    for (std::size_t i = 0; i < length; ++i) {
        std::fill_n(out + i * stride, written, in[i]);
    }
}

}  // namespace

std::uint8_t InstanceHandler::processBlock(
    const float* in, float* out, std::uint32_t length, int inchannels, int outchannels) noexcept {
    inputSilent_ = false;
    updatePosition();
    if (internalMute) {
        logTrace("WARNING: internalMute == true so no dataSet from GUI!!!");
    } else {
        updateMixValues();
    }

    if (outchannels != 2) {
        logError("ERROR:getNumInputChannels() != 0 !!!!");
    }
    if (unityDistanceMute || internalMute || !isLoaded || essError != essErrorNone) {
        muteBlock(out, length, outchannels);
    } else if (bypassExternal) {
        // The engine rests: its delay lines and history stop here.
        bypassBlock(in, out, length, inchannels, outchannels);
        logTrace("WARNING: bypassed this buffer due to bypassExternal ", bypassExternal);
    } else {
        renderBlock(in, out, length, inchannels, outchannels);
    }
    return processResult;
}

void InstanceHandler::updatePosition() noexcept {
    const auto azimuthBits = std::bit_cast<std::uint32_t>(azimuth);
    const auto exponentBits = std::bit_cast<std::uint32_t>(angleExponent);
    if (azimuthBits != bentAzimuth_.azimuthBits || exponentBits != bentAzimuth_.exponentBits) {
        bentAzimuth_ = {azimuthBits, exponentBits, bendAzimuth(azimuth, angleExponent)};
    }
    azimuthIn = bentAzimuth_.azimuth;
    distanceIn = distanceScale * distance;
    elevationIn = truncateToInt16(elevation);
}

void InstanceHandler::updateMixValues() noexcept {
    SpatialEngine* engine = activeEngine();
    smoothOcclusion();
    if (occlusion > 0.0f) {
        if (engine != nullptr) {
            engine->setInputLowPass(occlusion);
        }
        gainDb = masterGainDb - occlusionAttenuationDb * occlusion;
    } else {
        // The engine keeps the low-pass of the last level above 0.
        gainDb = masterGainDb;
    }

    mixParameters.directGain = directLevel_.of(directGainDb);
    mixParameters.earlyGain = earlyLevel_.of(earlyGainDb);
    mixParameters.reverbGain = reverbLevel_.of(reverbGainDb);
    applyUnityDistance();
    if (engine != nullptr) {
        updateLiveControls(*engine);
    }
    if (!alwaysUpdateFilter) {
        mixParameters.reverbCutoff = reverbLP;
        mixParameters.roomSize = roomSize;
    }
}

void InstanceHandler::smoothOcclusion() noexcept {
    if (occlusion == occlusionTarget) {
        return;
    }
    const float step =
        static_cast<float>(blocklenght) / static_cast<float>(sampleRate) / occlusionTime;
    const float remaining = occlusionTarget - occlusion;
    if (std::fabs(remaining) < step) {
        occlusion = occlusionTarget;
    } else if (remaining > 0.0f) {
        occlusion += step;
    } else if (remaining < 0.0f) {  // a NaN as target holds the present level
        occlusion -= step;
    }
}

void InstanceHandler::applyUnityDistance() noexcept {
    if (!unityDistance) {
        mixParameters.unityDistance = 0;
        return;
    }
    mixParameters.unityDistance = 1;
    mixParameters.unityAttenuation = unityAttenuation;
    mixParameters.directGain *= unityAttenuation;
    mixParameters.reverbGain *= unityReverbMix;
    if (unityAttenuation < earlyFadeThreshold) {
        mixParameters.earlyGain *= unityAttenuation / earlyFadeThreshold;
    }
}

void InstanceHandler::updateLiveControls(SpatialEngine& engine) noexcept {
    LiveControls& controls = engine.controls();
    controls.reflectionLP_Fc = reflectionLP;
    controls.reflectionLP2_Fc = reflectionLP * secondOrderCutoff;
    controls.bassBoost = bassBoost;
    controls.reverbLP_Fc = reverbLP;
    controls.roomSizeFactor = roomSize;
    if (auralisation && roomDistancesSet) {
        controls.roomDistances = roomDistances;
        logTrace("Set tessCore_RoomGeo front ", controls.roomDistances[2]);
    }
}

void InstanceHandler::renderBlock(
    const float* in, float* out, std::uint32_t length, int inchannels, int outchannels) noexcept {
    const std::size_t wanted = floatsIn(length, outchannels);
    if (blockCapacity == 0 || length > blockCapacity) {
        if (!overlongReported) {
            logError("Tessaly_h: ERROR block of ", length, " frames is longer than blocklenght ",
                     blocklenght);
            overlongReported = true;
        }
        copyOrZero(nullptr, 0, out, wanted);
        return;
    }

    fillInputBlock(in, length, inchannels, outchannels);
    SpatialEngine* engine = activeEngine();
    if (engine == nullptr) {
        constexpr int pluginId = 0;
        logOutput("ERROR(essCore_plugins): called essCore-Instance ", pluginId,
                  " not existing (yet) cause pluginIDinc is ", pluginId);
        return;
    }
    if (inputBlockSilent_) {
        engine->expectSilence();
    }
    if (out != nullptr && outchannels == 2 && length == blockCapacity) {
        // A whole block needs no copy: the engine has taken its input before it writes.
        float* target = out;
        engine->comProcessing(inputBlock, target, activeInstance);
        return;
    }
    engine->comProcessing(inputBlock, outputBlock, activeInstance);
    copyOrZero(outputBlock, outputStorage.size(), out, wanted);
}

void InstanceHandler::fillInputBlock(const float* in,
                                     std::uint32_t length,
                                     int inchannels,
                                     int outchannels) noexcept {
    const bool none = in == nullptr || inchannels <= 0;
    // A flat copy into more than two channels may take more of the input than its first two.
    inputSilent_ = none || (outchannels <= 2 &&
                            kernels_->isSilent(floatsIn(length, std::min(inchannels, 2)), in));
    if (inputSilent_ && inputBlockSilent_) {
        return;
    }
    copyInput(none ? nullptr : in, length, inchannels, outchannels);
    // What is on the odd slots, or behind a shorter block, need not be silent.
    inputBlockSilent_ = inputSilent_ && kernels_->isSilent(inputStorage.size(), inputBlock);
}

void InstanceHandler::copyInput(const float* in,
                                std::uint32_t length,
                                int inchannels,
                                int outchannels) noexcept {
    if (in == nullptr) {
        std::fill_n(inputBlock, 2 * static_cast<std::size_t>(length), 0.0f);
        return;
    }
    if (inchannels == 1) {
        spreadToEven(in, length, inputBlock);
        return;
    }
    // What is no number, or overflows, would stay in the engine's recursive filters for good, so it
    // takes the left channel too.
    if (inputChannel <= -1.0f || !(inputChannel <= highestInputChannel)) {
        const std::size_t held = std::min(floatsIn(length, inchannels), inputStorage.size());
        std::copy_n(in, std::min(floatsIn(length, outchannels), held), inputBlock);
        return;
    }
    const float w = (inputChannel + 1.0f) * 0.5f;
    blendToEven(in, length, 1.0f - w, w, inputBlock);
}

void InstanceHandler::muteBlock(float* out, std::uint32_t length, int outchannels) noexcept {
    // Written in every muted block, on the audio thread: this is how a mute shows in a debugger.
    // The missing blank is part of the text.
    logOutput("Tessaly_h: WARNING internalMute this buffer due to ErrorCode: ", essError,
              "outbuffer-size ", 2 * static_cast<std::int64_t>(blocklenght), " length  ", length,
              " outchannels ", outchannels, " sizeof(float)", sizeof(float));
    if (out == nullptr) {
        logOutput("couldn't mute buffer cause outbuffer == NULL");
        return;
    }
    copyOrZero(nullptr, 0, out, floatsIn(length, outchannels));
}

}  // namespace tessaly
