// One source in a game, twice: an effect of the built library and the reference's spatializer.
#include "comparison/hosted_source.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <span>

namespace tessaly::test {

Game::Game(const std::string& directory) : library(TESSALY_PLUGIN) {
    pathTaken = library.setStreamingAssetsPath(directory);
    process.hrirSource = [this, directory](int sampleRate, int frames) {
        const auto [at, fresh] = files_.try_emplace({sampleRate, frames});
        if (fresh) {
            at->second = reference::packedFilesIn(directory)(sampleRate, frames);
        }
        return at->second;
    };
}

HostedSource::HostedSource(Game& game, int sampleRate, int blockLength)
    : effect_(game.library.effect("Tessaly Engine"),
              static_cast<std::uint32_t>(sampleRate),
              static_cast<std::uint32_t>(blockLength)),
      reference_(game.process) {}

void HostedSource::set(int index, float value) {
    EXPECT_EQ(effect_.setParameter(index, value), 0);
    EXPECT_TRUE(reference_.setParameter(index, value));
}

void HostedSource::setFormat(int sampleRate, int blockLength) {
    effect_.state().samplerate = static_cast<std::uint32_t>(sampleRate);
    effect_.state().dspbuffersize = static_cast<std::uint32_t>(blockLength);
}

::testing::AssertionResult HostedSource::play(Deviation& deviation, int inChannels, int frames) {
    UnityAudioEffectState& state = effect_.state();
    if (frames == 0) {
        frames = static_cast<int>(state.dspbuffersize);
    }
    effect_.place(listener, source);
    UnityAudioSpatializerData& data = effect_.spatializerData();
    data.reverbzonemix = 0.8f;
    float ignored = attenuation;
    data.distanceattenuationcallback(&state, effect_.distance(), attenuation, &ignored);
    reference_.setDistance(effect_.distance(), attenuation, data.reverbzonemix);

    std::uniform_real_distribution<float> sample(-1.0f, 1.0f);
    in_.resize(static_cast<std::size_t>(frames * inChannels));
    std::generate(in_.begin(), in_.end(), [&] { return noisePeak * sample(noise_); });
    out_.assign(static_cast<std::size_t>(2 * frames), 7.0f);
    const int result = effect_.definition().process(
        &state, in_.data(), out_.data(), static_cast<std::uint32_t>(frames), inChannels, 2);
    reference_.process(std::span<const float, 16>(data.listenermatrix),
                       std::span<const float, 16>(data.sourcematrix), in_, frames, inChannels,
                       static_cast<int>(state.samplerate), static_cast<int>(state.dspbuffersize),
                       expected_);
    const std::string difference = deviation.compare(out_, expected_);
    ++block_;
    if (result == 0 && difference.empty()) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure()
           << "result " << result << ", block " << block_ - 1 << " of " << frames << " frames at "
           << state.samplerate << " Hz: " << difference;
}

HostedReturn::HostedReturn(Game& game, int sampleRate, int blockLength, int id)
    : game_(game),
      id_(id),
      effect_(game.library.effect("Tessaly Reverb"),
              static_cast<std::uint32_t>(sampleRate),
              static_cast<std::uint32_t>(blockLength)),
      reference_(game.process),
      in_(static_cast<std::size_t>(2 * blockLength), 9.0f),  // the host's input is not heard
      out_(in_.size()) {
    constexpr std::size_t mixBufferSize = 8192;
    constexpr float silenceDb = -96.0f;
    reference_.fading = false;
    reference_.earlyGainDb = silenceDb;
    reference_.directGainDb = silenceDb;
    reference_.alwaysUpdateFilter = false;
    EXPECT_EQ(effect_.setParameter(return_parameter::reverbId, static_cast<float>(id)), 0);
    game_.process.mixBuffers[id].assign(mixBufferSize, 0.0);
}

HostedReturn::~HostedReturn() { game_.process.mixBuffers.erase(id_); }

void HostedReturn::set(int index, float value) {
    EXPECT_EQ(effect_.setParameter(index, value), 0);
    switch (index) {
        case return_parameter::gain:
            reference_.masterGainDb = value;
            break;
        case return_parameter::reverb:
            reference_.reverbGainDb = value;
            break;
        case return_parameter::roomSelection:
            reference_.roomPreset = static_cast<int>(value);
            break;
        case return_parameter::mute:
            reference_.reverbActive = value < 1.0f;
            break;
        case return_parameter::roomSize:
            reference_.roomSize = static_cast<float>((static_cast<double>(value) - 50.0) * 0.02);
            break;
        case return_parameter::bypass:
            reference_.bypassExternal = value >= 1.0f;
            break;
        default:
            ADD_FAILURE() << "parameter " << index << " is not the reference's";
    }
}

::testing::AssertionResult HostedReturn::play(Deviation& deviation) {
    const int frames = static_cast<int>(effect_.state().dspbuffersize);
    std::fill(out_.begin(), out_.end(), 7.0f);
    const int result = effect_.processBlock(in_.data(), out_.data(), effect_.state().dspbuffersize);
    reference_.checkForChanges(static_cast<int>(effect_.state().samplerate), frames);
    expected_.assign(out_.size(), 0.0);
    if (reference_.isLoaded()) {
        std::vector<double>& mix = game_.process.mixBuffers.at(id_);
        reference_.processBlock(std::span<const double>(mix).first(out_.size()), frames, 2,
                                expected_);
        std::fill_n(mix.begin(), out_.size(), 0.0);
    }
    const std::string difference = deviation.compare(out_, expected_);
    ++block_;
    if (result == 0 && difference.empty()) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure() << "return " << id_ << ", result " << result << ", block "
                                         << block_ - 1 << ": " << difference;
}

void walk(HostedSource& one, int block) {
    const double t = 0.13 * block;
    one.listener.position = {0.4 * std::sin(t), 0.3 * std::cos(0.7 * t), 0.2 * t};
    one.listener.yaw = 40.0 * std::sin(0.3 * t);
    one.listener.pitch = 20.0 * std::sin(0.8 * t);
    one.listener.roll = 25.0 * std::sin(0.5 * t);
    one.source.position = {3.0 * std::cos(t), 1.5 * std::sin(1.7 * t), 3.0 * std::sin(t) + 0.2 * t};
    one.source.yaw = 90.0 * t;  // not heard
}

}  // namespace tessaly::test
