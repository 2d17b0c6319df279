// One source rendered twice: by an engine of the library and by one of the reference.
#include "comparison/compared_source.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "base/numeric_conversion.h"
#include "base/precision.h"

namespace tessaly::test {

namespace {

constexpr float inputLevel = 0.25f;  // keeps a near source's output within full scale

std::uint8_t flag(bool on) { return on ? std::uint8_t{1} : std::uint8_t{0}; }

EngineSettings settingsOf(const reference::EngineOptions& options) {
    EngineSettings settings;
    settings.qvInterpolateSpectra = flag(options.qvInterpolateSpectra);
    settings.qvInterpolateFilters = flag(options.qvInterpolateFilters);
    settings.qvEarlyReflections = flag(options.qvEarlyReflections);
    settings.qvFlexReflections = flag(options.qvFlexReflections);
    settings.qvReverb = wrapToInt16(std::min(options.qvReverb, 1));
    settings.qvSmoothSteps = flag(options.qvSmoothSteps);
    settings.fading = flag(options.fading);
    settings.qvTrackDirection = flag(options.qvTrackDirection);
    settings.qvUse256HRIR = flag(options.qvUse256HRIR);
    settings.limitPhi = wrapToInt16(options.limitPhi);
    settings.limitTheta = wrapToInt16(options.limitTheta);
    settings.qvUpdateInterval = wrapToInt16(options.qvUpdateInterval);
    settings.atmoSelect = wrapToInt16(options.atmoSelect);
    settings.alwaysUpdateFilter = flag(options.alwaysUpdateFilter);
    settings.earlyFlexRefPreset = wrapToInt16(options.earlyFlexRefPreset);
    settings.sampleRate = options.sampleRate;
    settings.defaultFirSize = options.defaultFirSize;
    settings.doppler = flag(options.doppler);
    settings.bypass3DAudio = flag(options.bypass3DAudio);
    if (options.qvReverb > 1) {
        const int frames = static_cast<int>(options.tail.pairs.size() / 2);
        settings.defaultFirSize =
            (frames + options.blockLength - 1) / options.blockLength * options.blockLength;
    }
    return settings;
}

}  // namespace

ComparedSource::ComparedSource(reference::Process& process,
                               const std::string& directory,
                               const reference::EngineOptions& options,
                               const SourceValues& startValues)
    : values(startValues),
      options_(options),
      rig_(directory, options.sampleRate, options.blockLength) {
    rig_.settings = settingsOf(options);
    rig_.qualityValue = wrapToInt16(options.qualityValue);
    // Construction reads the inputs, but no engine is there yet to take the rest.
    rig_.azimuth = inputs_.azimuth = values.azimuth;
    rig_.elevation = inputs_.elevation = values.elevation;
    rig_.distance = inputs_.distance = values.distance;
    rig_.build();
    if (options.qvReverb > 1) {
        injectTail();
    }
    if (options.atmoSelect > 0) {
        injectAmbience();
    }
    reference_ = std::make_unique<reference::Engine>(process, inputs_, mix_, options_);
    setRecords({});
    pass();
}

void ComparedSource::injectTail() {
    EngineState& state = rig_.state();
    state.switches.qvReverb = wrapToInt16(options_.qvReverb);
    ReverbTail& tail = state.tail;
    tail.reverbLength = static_cast<int>(options_.tail.pairs.size() / 2);
    tail.reverbIR = AlignedArray<float>(options_.tail.pairs.size());
    std::copy(options_.tail.pairs.begin(), options_.tail.pairs.end(), tail.reverbIR.begin());
    tail.reverbPresetGain = options_.tail.presetGain;
    tail.hasReverbLowPass = options_.earlyFlexRefPreset > 0 && options_.presetRow.hasReverbLowPass;
    tail.reverbLowPass =
        Biquad(Biquad::lowPass, 0.0, Biquad::normalise(20000.0f, options_.sampleRate));
}

void ComparedSource::injectAmbience() {
    // The loop's file is looked for under a doubled directory, so it never is where a test may
    // write; the failed read has left its code behind.
    essError = essErrorNone;
    AlignedArray<float>& bed = rig_.state().ambience.atmoBuffer;
    for (std::size_t i = 0; i < std::min(bed.size(), options_.ambience.size()); ++i) {
        bed[i] = static_cast<float>(options_.ambience[i]);
    }
}

void ComparedSource::setRecords(const std::vector<RecordValues>& records) {
    Reflections& reflections = rig_.state().reflections;
    reflections.flexReflectionCount = wrapToInt16(static_cast<int>(records.size()));
    if (options_.earlyFlexRefPreset > 0) {
        reflections.earlyPresetGain = options_.presetRow.earlyPresetGain;
    }
    reference_->records.clear();
    for (std::size_t k = 0; k < records.size(); ++k) {
        const RecordValues& wanted = records[k];
        ReflectionRecord record;
        record.relativePhi = wrapToInt16(wanted.relativePhi);
        record.relativeTheta = wrapToInt16(wanted.relativeTheta);
        record.presetDelaySamples = wrapToInt16(wanted.delay);
        record.delaySamples = record.presetDelaySamples;
        record.distanceGain = 0.8f;
        record.gain = wanted.gain;
        record.filterClass = wrapToInt16(wanted.filterClass);
        record.wallDistance = wanted.wallDistance;
        reflections.records[k] = record;

        reference::ReflectionRecord plain;
        plain.relativePhi = record.relativePhi;
        plain.relativeTheta = record.relativeTheta;
        plain.presetDelaySamples = record.presetDelaySamples;
        plain.delaySamples = record.delaySamples;
        plain.distanceGain = record.distanceGain;
        plain.gain = record.gain;
        plain.filterClass = record.filterClass;
        plain.wallDistance = record.wallDistance;
        reference_->records.push_back(plain);
    }
}

void ComparedSource::pass() {
    rig_.azimuth = inputs_.azimuth = values.azimuth;
    rig_.elevation = inputs_.elevation = values.elevation;
    rig_.distance = inputs_.distance = values.distance;
    rig_.gainDb = inputs_.gainDb = values.gainDb;
    rig_.mix.directGain = values.directGain;
    rig_.mix.earlyGain = values.earlyGain;
    rig_.mix.reverbGain = values.reverbGain;
    rig_.mix.unityDistance = flag(values.unityDistance);
    rig_.mix.unityAttenuation = values.unityAttenuation;
    rig_.mix.reverbCutoff = values.reverbLP;
    rig_.mix.roomSize = values.roomSize;
    mix_.direct = wide(values.directGain);
    mix_.early = wide(values.earlyGain);
    mix_.reverb = wide(values.reverbGain);
    mix_.unityDistance = values.unityDistance;
    mix_.unityAttenuation = wide(values.unityAttenuation);
    mix_.reverbCutoff = wide(values.reverbLP);
    mix_.roomSize = wide(values.roomSize);

    LiveControls& controls = rig_.engine->controls();
    controls.reflectionLP_Fc = values.reflectionLP;
    controls.reflectionLP2_Fc = values.reflectionLP2;
    controls.reverbLP_Fc = values.reverbLP;
    controls.roomSizeFactor = values.roomSize;
    controls.bassBoost = values.bassBoost;
    reference::LiveControls& plain = reference_->controls;
    plain.reflectionLP_Fc = values.reflectionLP;
    plain.reflectionLP2_Fc = values.reflectionLP2;
    plain.reverbLP_Fc = values.reverbLP;
    plain.roomSizeFactor = values.roomSize;
    plain.bassBoost = values.bassBoost;
    if (values.occlusion > 0.0f) {
        rig_.engine->setInputLowPass(values.occlusion);
        reference_->setInputLowPass(values.occlusion);
    }
}

::testing::AssertionResult ComparedSource::play(Deviation& deviation) {
    std::uniform_real_distribution<float> sample(-inputLevel, inputLevel);
    std::vector<float> signal(static_cast<std::size_t>(options_.blockLength));
    std::generate(signal.begin(), signal.end(), [&] { return sample(noise_); });
    return play(deviation, signal);
}

::testing::AssertionResult ComparedSource::play(Deviation& deviation,
                                                const std::vector<float>& signal) {
    for (std::size_t i = 0; i < static_cast<std::size_t>(options_.blockLength); ++i) {
        rig_.input[2 * i] = i < signal.size() ? signal[i] : 0.0f;
        rig_.input[2 * i + 1] = 0.7f;  // the right slots are not heard
    }
    pass();
    rig_.run();
    reference_->process(std::span<const float>(rig_.input), expected_);
    const std::string difference = deviation.compare(rig_.output, expected_);
    ++block_;
    if (difference.empty()) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure()
           << "block " << block_ - 1 << " of " << options_.blockLength << " frames at "
           << options_.sampleRate << " Hz: " << difference;
}

reference::Tail tailOf(int frames, float presetGain, unsigned seed) {
    reference::Tail tail;
    tail.presetGain = presetGain;
    std::mt19937 random(seed);
    std::uniform_real_distribution<float> sample(-0.5f, 0.5f);
    for (int i = 0; i < frames; ++i) {
        const float level = std::exp2(-6.0f * static_cast<float>(i) / static_cast<float>(frames));
        tail.pairs.push_back(level * sample(random));
        tail.pairs.push_back(level * sample(random));
    }
    return tail;
}

std::vector<RecordValues> roomRecords(int count, int lastDelay, unsigned seed) {
    std::mt19937 random(seed);
    const auto between = [&](int low, int high) {
        return std::uniform_int_distribution<int>(low, high)(random);
    };
    std::vector<RecordValues> records;
    for (int k = 0; k < count; ++k) {
        RecordValues record;
        record.relativePhi = between(-180, 180);
        record.relativeTheta = between(-90, 90);
        record.delay = between(-20, lastDelay);
        record.gain = 0.02f * static_cast<float>(between(1, 8));
        record.filterClass = between(-1, 1);
        record.wallDistance = between(0, 3) == 0 ? -1.0f : 2.0f;
        records.push_back(record);
    }
    return records;
}

}  // namespace tessaly::test
