// The functions that game scripts call.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "plugin/plugin_fixture.h"

namespace tessaly::test {
namespace {

using ControlFunctionsTest = PluginTest;

TEST_F(ControlFunctionsTest, TheFirstPathOfEachFamilyCountsForEver) {
    const TempDirectory good;
    const TempDirectory bad;
    writeFile(good.file("/TSLdata120.dat"), std::vector<char>{'x'});
    struct Order {
        ExportFamily first;
        ExportFamily sameFamily;
        ExportFamily other;
    };
    for (const Order& order :
         {Order{ExportFamily::Plain, ExportFamily::Ios, ExportFamily::Reverb},
          Order{ExportFamily::Ios, ExportFamily::Plain, ExportFamily::ReverbIos},
          Order{ExportFamily::Reverb, ExportFamily::ReverbIos, ExportFamily::Plain},
          Order{ExportFamily::ReverbIos, ExportFamily::Reverb, ExportFamily::Ios}}) {
        withLibrary([&](const PluginLibrary& library) {
            EXPECT_FALSE(library.setStreamingAssetsPath(bad.path(), order.first));
            EXPECT_FALSE(library.setStreamingAssetsPath(good.path(), order.first));
            EXPECT_FALSE(library.setStreamingAssetsPath(good.path(), order.sameFamily));
            EXPECT_TRUE(library.setStreamingAssetsPath(good.path(), order.other));
            EXPECT_TRUE(library.setStreamingAssetsPath(bad.path(), order.other));
        });
    }
}

TEST_F(ControlFunctionsTest, TheOtherFamilyUnlocksLoading) {
    const TempDirectory good;
    writePackedHrirSet(good.path(), 44100);
    withLibrary([&](const PluginLibrary& library) {
        EXPECT_FALSE(library.setStreamingAssetsPath(""));
        Source source(library, 44100, 256);
        EXPECT_TRUE(allZero(source.blocks(4)));
        EXPECT_FALSE(library.setStreamingAssetsPath(good.path()));
        EXPECT_TRUE(allZero(source.blocks(4)));
        EXPECT_TRUE(library.setStreamingAssetsPath(good.path(), ExportFamily::Reverb));
        EXPECT_FALSE(allZero(source.blocks(4)));
        EXPECT_EQ(library.getErrorState(), 1);
    });
}

TEST_F(ControlFunctionsTest, BlockSizesComeBack) {
    withLibrary([](const PluginLibrary& library) {
        for (const ExportFamily family : {ExportFamily::Plain, ExportFamily::Ios,
                                          ExportFamily::Reverb, ExportFamily::ReverbIos}) {
            EXPECT_EQ(library.setBuffersize(512, family), 512);
            EXPECT_EQ(library.setBuffersize(-1, family), -1);
        }
    });
}

TEST_F(ControlFunctionsTest, TheHostsBlockSizeBeatsTheScripts) {
    withData({44100}, [](const PluginLibrary& library) {
        library.setBuffersize(512);
        Source source(library, 44100, 1024);
        const std::string log = standardErrorOf([&] { source.blocks(2); });
        EXPECT_EQ(occurrences(log, "Tessaly_h: Loading instance = "), 1u) << log;
        EXPECT_EQ(occurrences(log, " buffersize = 1024 preset = 0"), 1u) << log;
    });
}

TEST_F(ControlFunctionsTest, TheScriptsBlockSizeServesASilentHost) {
    withData({44100}, [](const PluginLibrary& library) {
        Source source(library, 44100, 512);
        source.effect().state().dspbuffersize = 0;
        const std::string log = standardErrorOf([&] {
            EXPECT_TRUE(allZero(source.blocks(2))) << "no size is known";
            library.setBuffersize(512, ExportFamily::Reverb);
            EXPECT_TRUE(allZero(source.blocks(2))) << "that one is for reverbs";
            library.setBuffersize(512);
            EXPECT_FALSE(allZero(source.blocks(2)));
        });
        EXPECT_EQ(occurrences(log, " buffersize = 512 preset = 0"), 1u) << log;
    });
}

TEST_F(ControlFunctionsTest, ABlockSizeThatIsNoPowerOfTwoFails) {
    withData({44100}, [](const PluginLibrary& library) {
        Source source(library, 44100, 500);
        source.effect().state().dspbuffersize = 0;
        library.setBuffersize(500, ExportFamily::Ios);
        const std::string log = standardErrorOf([&] { EXPECT_TRUE(allZero(source.blocks(2))); });
        EXPECT_EQ(library.getErrorState(), -101);
        EXPECT_EQ(occurrences(log, "Tessaly_h: ERROR code -101"), 1u) << log;
        EXPECT_EQ(occurrences(log, "Tessaly_h: Load Engine with error: -101"), 1u) << log;
    });
}

TEST_F(ControlFunctionsTest, AllNamesTellTheErrorState) {
    withData({48000}, [](const PluginLibrary& library) {
        const std::vector<ExportFamily> families = {ExportFamily::Plain, ExportFamily::Ios,
                                                    ExportFamily::Reverb, ExportFamily::ReverbIos};
        for (const ExportFamily family : families) {
            EXPECT_EQ(library.getErrorState(family), 1);
        }
        Source source(library, 22050, 256);
        source.blocks(1);
        for (const ExportFamily family : families) {
            EXPECT_EQ(library.getErrorState(family), -102);
        }
    });
}

TEST_F(ControlFunctionsTest, The3DBypassReloadsEverySourceByAnyName) {
    withData({44100}, [](const PluginLibrary& library) {
        Source first(library, 44100, 256);
        Source second(library, 44100, 256);
        first.blocks(1);
        second.blocks(1);
        bool bypass = false;
        for (const ExportFamily family : {ExportFamily::Plain, ExportFamily::Ios,
                                          ExportFamily::Reverb, ExportFamily::ReverbIos}) {
            bypass = !bypass;
            EXPECT_EQ(library.set3DBypass(bypass, family), bypass ? 1 : 0);
            const std::string log = standardErrorOf([&] {
                EXPECT_FALSE(allZero(first.blocks(2)));
                EXPECT_FALSE(allZero(second.blocks(2)));
            });
            EXPECT_EQ(occurrences(log, "Tessaly_h: Loading instance = "), 2u) << log;
        }
        EXPECT_EQ(library.getErrorState(), 1);
    });
}

TEST_F(ControlFunctionsTest, OthersAnswerOne) {
    withLibrary([](const PluginLibrary& library) {
        EXPECT_EQ(library.testMethode(7), 1);
        EXPECT_EQ(library.setRoomDistances({1.0f, 2.0f, 3.0f, 4.0f, 5.0f, -1.0f}), 1);
        EXPECT_EQ(
            library.setRoomDistances({1.0f, 2.0f, 3.0f, 4.0f, 5.0f, -1.0f}, ExportFamily::Ios), 1);
    });
}

}  // namespace
}  // namespace tessaly::test
