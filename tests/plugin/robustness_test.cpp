// Values and buffers outside the host's contract.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <limits>
#include <string>
#include <vector>

#include "plugin/plugin_fixture.h"

namespace tessaly::test {
namespace {

using RobustnessTest = PluginTest;

constexpr std::uint32_t frames = 256;
constexpr float infinity = std::numeric_limits<float>::infinity();
const std::array<float, 5> oddValues = {std::numeric_limits<float>::quiet_NaN(), infinity,
                                        -infinity, std::numeric_limits<float>::max(),
                                        std::numeric_limits<float>::lowest()};

TEST_F(RobustnessTest, EveryParameterTakesEveryValue) {
    withData({24000, 44100, 48000}, [](const PluginLibrary& library) {
        for (const std::uint32_t rate : allRates) {
            for (const UnityAudioEffectDefinition* definition : library.effects()) {
                for (std::uint32_t index = 0; index < definition->numparameters; ++index) {
                    const auto& parameter = definition->paramdefs[index];
                    SCOPED_TRACE(::testing::Message() << rate << " " << parameter.name);
                    EffectInstance instance(*definition, rate, frames);
                    instance.setParameter("Room Selection", 4.0f);
                    std::vector<float> in(2 * frames, 0.5f);
                    std::vector<float> out(2 * frames);
                    for (const float value : oddValues) {
                        instance.setParameter(static_cast<int>(index), value);
                        EXPECT_EQ(instance.processBlock(in.data(), out.data(), frames), 0);
                        EXPECT_EQ(instance.processBlock(in.data(), out.data(), frames), 0);
                    }
                    EXPECT_EQ(library.getErrorState(), 1);
                }
            }
        }
    });
}

TEST_F(RobustnessTest, LevelsAnglesAndSwitchesRecover) {
    // Values that act on the response or the output only; what they spoil is gone when the
    // response has been built anew and the ring has turned.
    withData({24000, 44100, 48000}, [](const PluginLibrary& library) {
        for (const std::uint32_t rate : allRates) {
            Source source(library, rate, frames);
            source.effect().setParameter("Input Channel", -1.0f);
            for (const char* name :
                 {"Gain", "Direct", "Early", "Reverb", "Angle", "Input Channel", "Occlusion",
                  "Distance", "ReflectionLP", "ReverbLP", "RoomSize", "UnityDistance",
                  "Auralization", "Bass Boost", "Bypass", "Reverb disable", "Reverb Size",
                  "Reverb ID", "Reverb Send"}) {
                SCOPED_TRACE(::testing::Message() << rate << " " << name);
                const float good =
                    *source.effect().parameter(parameterIndex(source.effect().definition(), name));
                for (const float value : oddValues) {
                    source.effect().setParameter(name, value);
                    source.blocks(2);
                    source.effect().setParameter(name, good);
                    source.blocks(24);
                    const std::vector<float> out = source.blocks(2);
                    ASSERT_TRUE(allFinite(out)) << value;
                    ASSERT_GT(energy(out, 0), 0.0) << value;
                }
            }
        }
    });
}

TEST_F(RobustnessTest, MatricesRecover) {
    withData({24000, 44100, 48000}, [](const PluginLibrary& library) {
        for (const std::uint32_t rate : allRates) {
            Source source(library, rate, frames);
            source.place(30.0, 0.0, 1.0);
            source.blocks(2);
            const UnityAudioSpatializerData good = source.effect().spatializerData();
            for (std::size_t element = 0; element < 32; ++element) {
                for (const float value : oddValues) {
                    UnityAudioSpatializerData& data = source.effect().spatializerData();
                    (element < 16 ? data.listenermatrix : data.sourcematrix)[element % 16] = value;
                    EXPECT_TRUE(allFinite(source.blocks(1))) << "a direction is always a number";
                    data = good;
                }
            }
            source.blocks(2);
            EXPECT_GT(energy(source.blocks(2), 1), 0.0);
        }
    });
}

TEST_F(RobustnessTest, DistancesRecover) {
    withData({24000, 44100, 48000}, [](const PluginLibrary& library) {
        for (const std::uint32_t rate : allRates) {
            Source source(library, rate, frames);
            source.blocks(2);
            EffectInstance& effect = source.effect();
            const auto callback = effect.spatializerData().distanceattenuationcallback;
            std::vector<float> in(2 * frames, 0.25f);
            std::vector<float> out(2 * frames);
            for (const float value : oddValues) {
                for (const float attenuation : {1.0f, value}) {
                    callback(&effect.state(), value, attenuation, nullptr);
                    EXPECT_EQ(effect.definition().process(&effect.state(), in.data(), out.data(),
                                                          frames, 2, 2),
                              0);
                    source.blocks(24);
                    const std::vector<float> heard = source.blocks(2);
                    ASSERT_TRUE(allFinite(heard)) << value;
                    ASSERT_GT(energy(heard, 0), 0.0) << value;
                }
            }
        }
    });
}

TEST_F(RobustnessTest, ShorterBlocksArePlayed) {
    withData({44100}, [](const PluginLibrary& library) {
        Source source(library, 44100, frames);
        source.blocks(4);
        for (const std::uint32_t length : {0u, 1u, 100u, frames - 1}) {
            std::vector<float> in(2 * length, 0.5f);
            std::vector<float> out(2 * length, 9.0f);
            EXPECT_EQ(source.effect().processBlock(in.data(), out.data(), length), 0);
            EXPECT_TRUE(allFinite(out));
        }
    });
}

TEST_F(RobustnessTest, LongerBlocksAreSilentWithOneLineAnEngine) {
    withData({44100}, [](const PluginLibrary& library) {
        Source source(library, 44100, frames);
        source.blocks(4);
        std::vector<float> in(4 * frames, 0.5f);
        std::vector<float> out(4 * frames, 9.0f);
        const std::string log = standardErrorOf([&] {
            for (int i = 0; i < 3; ++i) {
                source.effect().processBlock(in.data(), out.data(), 2 * frames);
                EXPECT_TRUE(allZero(out));
            }
        });
        EXPECT_EQ(log, "Tessaly_h: ERROR block of 512 frames is longer than blocklenght 256\n");
        EXPECT_FALSE(allZero(source.blocks(2)));
    });
}

TEST_F(RobustnessTest, NullBuffersAreTaken) {
    withData({44100}, [](const PluginLibrary& library) {
        Source source(library, 44100, frames);
        EffectInstance reverb(library.effect("Tessaly Reverb"), 44100, frames);
        reverb.setParameter("Room Selection", 0.0f);
        reverb.setParameter("ReverbID", 5.0f);
        std::vector<float> in(6 * frames, 0.5f);
        std::vector<float> out(6 * frames);
        for (const float bypass : {0.0f, 1.0f}) {
            source.effect().setParameter("Bypass", bypass);
            for (const int inchannels : {0, 1, 2, 6}) {
                for (const int outchannels : {0, 1, 2, 6}) {
                    for (EffectInstance* effect : {&source.effect(), &reverb}) {
                        EXPECT_EQ(effect->processBlock(nullptr, out.data(), frames, inchannels,
                                                       outchannels),
                                  0);
                        EXPECT_EQ(effect->processBlock(in.data(), nullptr, frames, inchannels,
                                                       outchannels),
                                  0);
                        EXPECT_EQ(
                            effect->processBlock(nullptr, nullptr, frames, inchannels, outchannels),
                            0);
                    }
                }
            }
        }
    });
}

TEST_F(RobustnessTest, ChannelCountsNeverReadBeyondTheInput) {
    withData({44100}, [](const PluginLibrary& library) {
        Source source(library, 44100, frames);
        EffectInstance reverb(library.effect("Tessaly Reverb"), 44100, frames);
        reverb.setParameter("Room Selection", 0.0f);
        for (const float bypass : {0.0f, 1.0f}) {
            for (const float channel : {-1.0f, 0.0f}) {
                source.effect().setParameter("Bypass", bypass);
                source.effect().setParameter("Input Channel", channel);
                for (const int inchannels : {-1, 0, 1, 2, 6, 8}) {
                    for (const int outchannels : {-1, 0, 1, 2, 6, 8}) {
                        // Exactly as large as told, so that a sanitizer sees the next float.
                        std::vector<float> in(
                            frames * static_cast<std::size_t>(std::max(inchannels, 0)), 0.5f);
                        std::vector<float> out(frames *
                                               static_cast<std::size_t>(std::max(outchannels, 0)));
                        for (EffectInstance* effect : {&source.effect(), &reverb}) {
                            EXPECT_EQ(effect->processBlock(in.data(), out.data(), frames,
                                                           inchannels, outchannels),
                                      0);
                            EXPECT_TRUE(allFinite(out));
                        }
                    }
                }
            }
        }
    });
}

TEST_F(RobustnessTest, OddBlockSizesFailQuietly) {
    for (const std::uint32_t size : {1u, 3u, 100u, 32768u, 65537u, 0x80000000u, 0xFFFFFFFFu}) {
        withData({44100}, [size](const PluginLibrary& library) {
            Source source(library, 44100, frames);
            source.effect().state().dspbuffersize = size;
            source.effect().setParameter("Occlusion", 1.0f);
            standardErrorOf([&] { EXPECT_TRUE(allZero(source.blocks(3))); });
            EXPECT_EQ(library.getErrorState(), -101) << size;
        });
    }
}

TEST_F(RobustnessTest, ASizeBeyondSixteenBitsIsSilent) {
    withData({44100}, [](const PluginLibrary& library) {
        Source source(library, 44100, frames);
        source.effect().state().dspbuffersize = 65536 + frames;
        const std::string log = standardErrorOf([&] { EXPECT_TRUE(allZero(source.blocks(3))); });
        EXPECT_EQ(occurrences(log, "Tessaly_h: ERROR block of 256 frames"), 1u) << log;
    });
}

TEST_F(RobustnessTest, AHalfBuiltEngineTakesOcclusionAndEverySetting) {
    for (const std::uint32_t rate : {22050u, 44101u, 0xFFFFFFFFu}) {
        withData({44100}, [rate](const PluginLibrary& library) {
            Source source(library, rate, frames);
            source.effect().setParameter("Occlusion", 1.0f);
            standardErrorOf([&] {
                EXPECT_TRUE(allZero(source.blocks(3)));
                source.effect().setParameter("Room Selection", 4.0f);
                source.effect().setParameter("Auralization", 1.0f);
                library.setRoomDistances({1.0f, 2.0f, 3.0f, 4.0f, 5.0f, 6.0f});
                EXPECT_TRUE(allZero(source.blocks(3)));
                source.effect().setParameter("Bypass", 1.0f);
                EXPECT_TRUE(allZero(source.blocks(3)));
            });
            EXPECT_EQ(library.getErrorState(), -102);
        });
    }
}

TEST_F(RobustnessTest, CreateTakesAHostWithoutSpatializerData) {
    withLibrary([](const PluginLibrary& library) {
        const UnityAudioEffectDefinition& definition = library.effect("Tessaly Engine");
        UnityAudioEffectState state{};
        state.structsize = sizeof(state);
        state.samplerate = 44100;
        state.dspbuffersize = frames;
        state.hostapiversion = 0x10300;
        EXPECT_EQ(definition.create(&state), 0);
        EXPECT_NE(state.effectdata, nullptr);
        EXPECT_EQ(definition.release(&state), 0);
    });
}

TEST_F(RobustnessTest, RoomDistancesTakeEveryValue) {
    withData({44100}, [](const PluginLibrary& library) {
        Source source(library, 44100, frames);
        source.effect().setParameter("Room Selection", 4.0f);
        source.effect().setParameter("Auralization", 1.0f);
        for (const float value :
             {oddValues[0], oddValues[1], oddValues[2], oddValues[3], -1.0f, 0.0f}) {
            library.setRoomDistances({value, value, value, value, value, value});
            source.blocks(2);
        }
        library.setRoomDistances({2.0f, 2.0f, 2.0f, 2.0f, 2.0f, 2.0f});
        source.blocks(24);
        EXPECT_TRUE(allFinite(source.blocks(2)));
        EXPECT_EQ(library.getErrorState(), 1);
    });
}

}  // namespace
}  // namespace tessaly::test
