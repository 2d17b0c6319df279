// One block of OpenAL Soft: loopback rendering to stereo floats, HRTF on, mono sources that loop
// noise and move as ours do. Names: Source/openal/dry/moving/<sources>/<block length>.
#define AL_ALEXT_PROTOTYPES
#include <AL/al.h>
#include <AL/alc.h>
#include <AL/alext.h>
#include <benchmark/benchmark.h>

#include <string>
#include <vector>

#include "convolution/bench_noise.h"
#include "plugin/game.h"

namespace tessaly::bench {
namespace {

class Scene {
public:
    explicit Scene(int sources) : names_(static_cast<std::size_t>(sources)) {
        device_ = alcLoopbackOpenDeviceSOFT(nullptr);
        const ALCint wanted[] = {ALC_FORMAT_CHANNELS_SOFT,
                                 ALC_STEREO_SOFT,
                                 ALC_FORMAT_TYPE_SOFT,
                                 ALC_FLOAT_SOFT,
                                 ALC_FREQUENCY,
                                 static_cast<ALCint>(sampleRate),
                                 ALC_HRTF_SOFT,
                                 ALC_TRUE,
                                 0};
        context_ = device_ != nullptr ? alcCreateContext(device_, wanted) : nullptr;
        if (context_ == nullptr || alcMakeContextCurrent(context_) == ALC_FALSE) {
            return;
        }
        fill();
    }
    ~Scene() {
        if (context_ != nullptr) {
            alSourceStopv(static_cast<ALsizei>(names_.size()), names_.data());
            alDeleteSources(static_cast<ALsizei>(names_.size()), names_.data());
            alDeleteBuffers(1, &buffer_);
            alcMakeContextCurrent(nullptr);
            alcDestroyContext(context_);
        }
        if (device_ != nullptr) {
            alcCloseDevice(device_);
        }
    }
    Scene(const Scene&) = delete;
    Scene& operator=(const Scene&) = delete;

    /// All sources play, at our rate and with HRTF.
    bool good() const {
        if (context_ == nullptr) {
            return false;
        }
        ALCint hrtf = ALC_FALSE;
        ALCint rate = 0;
        alcGetIntegerv(device_, ALC_HRTF_SOFT, 1, &hrtf);
        alcGetIntegerv(device_, ALC_FREQUENCY, 1, &rate);
        bool playing = true;
        for (const ALuint name : names_) {
            ALint state = 0;
            alGetSourcei(name, AL_SOURCE_STATE, &state);
            playing = playing && state == AL_PLAYING;
        }
        return hrtf == ALC_TRUE && rate == static_cast<ALCint>(sampleRate) && playing &&
               alGetError() == AL_NO_ERROR;
    }

    void block(int step, std::vector<float>& out) {
        // Changes between these two calls are taken together, as a game hands a frame over.
        alcSuspendContext(context_);
        int k = 0;
        for (const ALuint name : names_) {
            // Its z axis points backwards.
            const Vector3 at = walk(step, k, static_cast<int>(names_.size()));
            alSource3f(name, AL_POSITION, static_cast<float>(at.x), static_cast<float>(at.y),
                       static_cast<float>(-at.z));
            ++k;
        }
        alcProcessContext(context_);
        alcRenderSamplesSOFT(device_, out.data(), static_cast<ALCsizei>(out.size() / 2));
    }

private:
    void fill() {
        std::vector<float> noise(sampleRate);
        fillNoise(noise.data(), noise.size());
        for (float& sample : noise) {
            sample *= 0.25f;
        }
        alGenBuffers(1, &buffer_);
        alBufferData(buffer_, alGetEnumValue("AL_FORMAT_MONO_FLOAT32"), noise.data(),
                     static_cast<ALsizei>(noise.size() * sizeof(float)),
                     static_cast<ALsizei>(sampleRate));
        alGenSources(static_cast<ALsizei>(names_.size()), names_.data());
        int k = 0;
        for (const ALuint name : names_) {
            alSourcei(name, AL_BUFFER, static_cast<ALint>(buffer_));
            alSourcei(name, AL_LOOPING, AL_TRUE);
            alSourcei(name, AL_SAMPLE_OFFSET, 587 * k % static_cast<int>(sampleRate));
            ++k;
        }
        alSourcePlayv(static_cast<ALsizei>(names_.size()), names_.data());
    }

    ALCdevice* device_ = nullptr;
    ALCcontext* context_ = nullptr;
    ALuint buffer_ = 0;
    std::vector<ALuint> names_;
};

void render(benchmark::State& state, int sources, std::uint32_t blockLength) {
    Scene scene(sources);
    if (!scene.good()) {
        state.SkipWithError("no HRTF, or a source does not play");
        return;
    }
    std::vector<float> out(2 * static_cast<std::size_t>(blockLength));
    int step = 0;
    constexpr int warmUp = 20;
    while (step < warmUp) {
        scene.block(step++, out);
    }
    for (auto _ : state) {
        scene.block(step++, out);
        benchmark::ClobberMemory();
    }
    double power = 0.0;
    for (const float sample : out) {
        power += static_cast<double>(sample) * static_cast<double>(sample);
    }
    if (!scene.good() || !(power > 0.0)) {
        state.SkipWithError("it fell silent");
    }
}

const bool registered = [] {
    if (candidates().empty()) {
        return false;
    }
    for (const std::uint32_t blockLength : blockLengths) {
        for (const int sources : {1, 16, 64, 256}) {
            const std::string name = "Source/openal/dry/moving/" + std::to_string(sources) + "/" +
                                     std::to_string(blockLength);
            benchmark::RegisterBenchmark(name.c_str(), render, sources, blockLength);
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
