// From waiting to running, reloads, failures and the end.
#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "minihost/no_allocation_scope.h"
#include "plugin/plugin_fixture.h"

/// Of the leak sanitizer, where it is in the program. @return 1 if something leaked
extern "C" int __lsan_do_recoverable_leak_check() __attribute__((weak));

namespace tessaly::test {
namespace {

using LifecycleTest = PluginTest;

constexpr std::uint32_t rate = 44100;
constexpr std::uint32_t frames = 256;
constexpr const char* loadLine = "Tessaly_h: Loading instance = ";

TEST_F(LifecycleTest, IsSilentWithoutPath) {
    withLibrary([](const PluginLibrary& library) {
        const std::string log = standardErrorOf([&] {
            Source source(library, rate, frames);
            EXPECT_TRUE(allZero(source.blocks(3)));
        });
        EXPECT_EQ(log, "") << "waiting is quiet";
        EXPECT_EQ(library.getErrorState(), 1);
    });
}

TEST_F(LifecycleTest, IsSilentUntilARoomIsSelected) {
    withData({rate}, [](const PluginLibrary& library) {
        EffectInstance instance(library.effect("Tessaly Engine"), rate, frames);
        std::vector<float> in(2 * frames, 0.5f);
        std::vector<float> out(2 * frames, 9.0f);
        const std::string log = standardErrorOf([&] {
            instance.processBlock(in.data(), out.data(), frames);
            EXPECT_TRUE(allZero(out));
        });
        EXPECT_EQ(log, "");
        instance.setParameter("Room Selection", 0.0f);
        instance.processBlock(in.data(), out.data(), frames);
        EXPECT_FALSE(allZero(out)) << "loads and renders in the same call";
    });
}

TEST_F(LifecycleTest, IsSilentUntilTheRateIsKnown) {
    withData({rate}, [](const PluginLibrary& library) {
        Source source(library, 0, frames);
        EXPECT_TRUE(allZero(source.blocks(2)));
        source.effect().state().samplerate = rate;
        EXPECT_FALSE(allZero(source.blocks(2)));
    });
}

TEST_F(LifecycleTest, ReloadsOnceForEachSetting) {
    struct Setting {
        const char* name;
        void (*change)(const PluginLibrary&, EffectInstance&);
    };
    const Setting settings[] = {
        {"room",
         [](const PluginLibrary&, EffectInstance& e) { e.setParameter("Room Selection", 4.0f); }},
        {"auralisation",
         [](const PluginLibrary&, EffectInstance& e) { e.setParameter("Auralization", 1.0f); }},
        {"reverb",
         [](const PluginLibrary&, EffectInstance& e) { e.setParameter("Reverb disable", 1.0f); }},
        {"3D bypass", [](const PluginLibrary& l, EffectInstance&) { l.set3DBypass(true); }},
        {"block size",
         [](const PluginLibrary&, EffectInstance& e) { e.state().dspbuffersize = 512; }},
        {"rate", [](const PluginLibrary&, EffectInstance& e) { e.state().samplerate = 48000; }},
    };
    withData({44100, 48000}, [&](const PluginLibrary& library) {
        for (const Setting& setting : settings) {
            SCOPED_TRACE(setting.name);
            Source source(library, rate, frames);
            const std::string first = standardErrorOf([&] { source.blocks(3); });
            EXPECT_EQ(occurrences(first, loadLine), 1u) << first;
            const std::string second = standardErrorOf([&] {
                setting.change(library, source.effect());
                EXPECT_TRUE(allFinite(source.blocks(3)));
            });
            EXPECT_EQ(occurrences(second, loadLine), 1u) << second;
            EXPECT_EQ(library.getErrorState(), 1);
        }
    });
}

TEST_F(LifecycleTest, LiveParametersKeepTheEngine) {
    withData({rate}, [](const PluginLibrary& library) {
        Source source(library, rate, frames);
        source.blocks(2);
        const std::string log = standardErrorOf([&] {
            for (const char* name :
                 {"Gain", "Direct", "Early", "Reverb", "Angle", "Distance", "UnityDistance",
                  "Occlusion", "Input Channel", "ReflectionLP", "ReverbLP", "RoomSize",
                  "Bass Boost", "Reverb Size", "Reverb ID", "Reverb Send", "Bypass"}) {
                source.effect().setParameter(name, 1.0f);
                source.block();
            }
        });
        EXPECT_EQ(log, "");
    });
}

TEST_F(LifecycleTest, AMissingSetSilencesTheWholeProcess) {
    withData({rate}, [](const PluginLibrary& library) {
        Source good(library, rate, frames);
        EXPECT_FALSE(allZero(good.blocks(2)));
        good.effect().setParameter("Bypass", 1.0f);
        EXPECT_FALSE(allZero(good.blocks(2)));

        auto bad = std::make_unique<Source>(library, 22050, frames);
        const std::string log = standardErrorOf([&] { EXPECT_TRUE(allZero(bad->blocks(1))); });
        EXPECT_EQ(library.getErrorState(), -102);
        EXPECT_EQ(occurrences(log, "Tessaly_h: ERROR code -102"), 1u) << log;
        EXPECT_EQ(occurrences(log, "internalMute this buffer due to ErrorCode: -102"), 1u) << log;

        const std::string muted = standardErrorOf(
            [&] { EXPECT_TRUE(allZero(good.blocks(3))) << "a mute beats the bypass"; });
        EXPECT_EQ(occurrences(muted, "due to ErrorCode: -102"), 3u) << "in every muted block";
        bad.reset();
        EXPECT_TRUE(allZero(good.blocks(1)));
        EXPECT_EQ(library.getErrorState(), -102) << "for good";
    });
}

TEST_F(LifecycleTest, TellsThatTheSetOfARateIsMissing) {
    withData({48000}, [](const PluginLibrary& library) {
        Source source(library, 24000, frames);
        const std::string log = standardErrorOf([&] { EXPECT_TRUE(allZero(source.blocks(2))); });
        EXPECT_EQ(library.getErrorState(), -103);
        EXPECT_GE(occurrences(log, "/TSLdata122.dat"), 1u) << log;
    });
}

TEST_F(LifecycleTest, AMuteWritesItsLine) {
    withData({rate}, [](const PluginLibrary& library) {
        Source source(library, rate, frames);
        source.blocks(1);
        source.effect().setParameter("UnityDistance", 1.0f);
        EffectInstance& effect = source.effect();
        const auto callback = effect.spatializerData().distanceattenuationcallback;
        std::vector<float> in(2 * frames, 0.5f);
        std::vector<float> out(2 * frames, 9.0f);
        const std::string log = standardErrorOf([&] {
            callback(&effect.state(), 1.0f, 0.0f, nullptr);
            effect.definition().process(&effect.state(), in.data(), out.data(), frames, 2, 2);
        });
        EXPECT_TRUE(allZero(out));
        // 127 characters fit; the one that finds the buffer full is lost.
        const std::string line =
            "Tessaly_h: WARNING internalMute this buffer due to ErrorCode: 1outbuffer-size 512 "
            "length  256 outchannels 2 sizeof(float)4\n";
        EXPECT_EQ(log, line.size() > 127 ? line.substr(0, 127) + line.substr(128) : line);
    });
}

TEST_F(LifecycleTest, TwoHundredLivesLeaveOnlyTheirLogBuffers) {
    withData({rate}, [](const PluginLibrary& library) {
        const auto live = [&](std::uint32_t blockLength) {
            Source source(library, rate, blockLength);
            source.effect().setParameter("Reverb Size", 2.0f);
            source.blocks(1);
            source.effect().setParameter("Room Selection", 4.0f);
            source.blocks(1);
        };
        ::testing::internal::CaptureStderr();
        // Tables of each transform length are made once for the process.
        for (int i = 0; i < 3; ++i) {
            live(frames << i);
        }
        constexpr int lives = 200;
        std::int64_t kept = 0;
        {
            const NoAllocationScope scope;
            for (int i = 0; i < lives; ++i) {
                live(frames << (i % 3));
            }
            kept = static_cast<std::int64_t>(scope.allocations()) -
                   static_cast<std::int64_t>(scope.releases());
        }
        ::testing::internal::GetCapturedStderr();
        EXPECT_LE(kept, lives + 2) << "one log buffer a handler stays on purpose";
        if (__lsan_do_recoverable_leak_check != nullptr) {
            EXPECT_EQ(__lsan_do_recoverable_leak_check(), 0) << "and is still reachable";
        }
        EXPECT_EQ(library.getErrorState(), 1);
    });
}

TEST_F(LifecycleTest, ThreeHundredRoomChangesKeepNothing) {
    withData({rate}, [](const PluginLibrary& library) {
        constexpr int rooms = 53;
        constexpr std::uint32_t longFrames = 1024;
        Source source(library, rate, longFrames);
        EffectInstance reverb(library.effect("Tessaly Reverb"), rate, longFrames);
        reverb.setParameter("ReverbID", 5.0f);
        std::vector<float> in(2 * longFrames);
        std::vector<float> out(2 * longFrames);
        std::int64_t kept = 0;
        std::uint64_t allocated = 0;
        const auto change = [&](int room, bool tail, bool walls) {
            EffectInstance& effect = source.effect();
            effect.setParameter("Room Selection", static_cast<float>(room));
            effect.setParameter("Reverb disable", tail ? 0.0f : 1.0f);
            effect.setParameter("Auralization", walls ? 1.0f : 0.0f);
            EXPECT_TRUE(allFinite(source.block()));
            kept += static_cast<std::int64_t>(effect.blockAllocations()) -
                    static_cast<std::int64_t>(effect.blockReleases());
            allocated += effect.blockAllocations();
        };
        const auto changeReturn = [&](int room, bool tail) {
            reverb.setParameter("Room Selection", static_cast<float>(room));
            reverb.setParameter("Mute", tail ? 0.0f : 1.0f);
            reverb.processBlock(in.data(), out.data(), longFrames);
            kept += static_cast<std::int64_t>(reverb.blockAllocations()) -
                    static_cast<std::int64_t>(reverb.blockReleases());
        };
        // Ends in the same rooms each time, so that what is alive then is the same too.
        const auto changeAll = [&](int changes) {
            for (int k = 1; k <= changes; ++k) {
                change(k * 17 % rooms, k % 5 != 0, k % 3 == 0);
                if (k % 10 == 0) {
                    changeReturn(k % rooms, k % 20 != 0);
                }
            }
            change(2, true, false);
            changeReturn(2, true);
        };
        const std::string log = standardErrorOf([&] {
            changeAll(2 * rooms);  // tables of each length are made once for the process
            kept = 0;
            changeAll(300);
        });
        EXPECT_EQ(occurrences(log, loadLine), 2u * rooms + 10 + 2 + 300 + 30 + 2);
        EXPECT_EQ(kept, 0);
        EXPECT_GT(allocated, 300u) << "the counter counts";
        if (__lsan_do_recoverable_leak_check != nullptr) {
            EXPECT_EQ(__lsan_do_recoverable_leak_check(), 0);
        }
        EXPECT_EQ(library.getErrorState(), 1);
    });
}

TEST_F(LifecycleTest, ReverbsComeAndGo) {
    withData({rate}, [](const PluginLibrary& library) {
        std::vector<float> in(2 * frames, 0.5f);
        std::vector<float> out(2 * frames);
        for (int i = 0; i < 20; ++i) {
            EffectInstance reverb(library.effect("Tessaly Reverb"), rate, frames);
            reverb.setParameter("Room Selection", static_cast<float>(i));
            reverb.setParameter("ReverbID", static_cast<float>(i % 3));
            reverb.processBlock(in.data(), out.data(), frames);
            EXPECT_TRUE(allFinite(out));
        }
        EXPECT_EQ(library.getErrorState(), 1);
    });
}

TEST_F(LifecycleTest, NormalBlocksDoNotAllocate) {
    withData({rate}, [](const PluginLibrary& library) {
        EffectInstance reverb(library.effect("Tessaly Reverb"), rate, frames);
        reverb.setParameter("Room Selection", 0.0f);
        reverb.setParameter("ReverbID", 5.0f);
        Source source(library, rate, frames);
        source.effect().setParameter("Reverb disable", 1.0f);
        source.effect().setParameter("Reverb Size", 50.0f);
        for (int i = 0; i < 50; ++i) {
            source.effect().setParameter("Reverb ID", 5.0f);
            source.effect().setParameter("Reverb Send", 0.0f);
        }
        std::vector<float> in(2 * frames);
        std::vector<float> out(2 * frames);
        source.block();
        reverb.processBlock(in.data(), out.data(), frames);
        for (int i = 0; i < 20; ++i) {
            source.place(i * 20.0 - 170.0, i * 4.0 - 40.0, 1.0 + 0.3 * i);
            source.effect().setParameter("Occlusion", static_cast<float>(i % 2));
            source.block();
            EXPECT_EQ(source.effect().blockAllocations(), 0u);
            EXPECT_EQ(source.effect().blockReleases(), 0u);
            reverb.processBlock(in.data(), out.data(), frames);
            EXPECT_EQ(reverb.blockAllocations(), 0u);
            EXPECT_EQ(reverb.blockReleases(), 0u);
        }
    });
}

}  // namespace
}  // namespace tessaly::test
