// The control functions, called by name.
#include <gtest/gtest.h>

#include <array>
#include <string>
#include <vector>

#include "base/ess_error.h"
#include "handler/process_fixture.h"
#include "handler/process_state.h"
#include "host/audio_plugin_interface.h"
#include "support/fresh_process.h"
#include "support/test_data.h"

extern "C" {
int UnityGetAudioEffectDefinitions(tessaly::UnityAudioEffectDefinition*** definitions);
bool SetStreamingAssetsPath(const char* path);
bool SetStreamingAssetsPathIOS(const char* path);
bool SetStreamingAssetsPathReverb(const char* path);
bool SetStreamingAssetsPathReverbIOS(const char* path);
int SetBuffersize(int size);
int SetBuffersizeIOS(int size);
int SetBuffersizeReverb(int size);
int SetBuffersizeReverbIOS(int size);
int Set3DBypass(int bypass);
int Set3DBypassIOS(int bypass);
int Set3DBypassReverb(int bypass);
int Set3DBypassReverbIOS(int bypass);
int SetRoomDistances(float, float, float, float, float, float);
int SetRoomDistancesIOS(float, float, float, float, float, float);
int GetErrorState();
int GetErrorStateIOS();
int GetErrorStateReverb();
int GetErrorStateReverbIOS();
int TestMethode(int value);
}

namespace tessaly::test {
namespace {

class ExportsTest : public ProcessFixture {
protected:
    ExportsTest() { writeFile(good.file("/TSLdata120.dat"), std::vector<char>{'x'}); }

    TempDirectory good;
    TempDirectory bad;
};

TEST_F(ExportsTest, GivesTheDefinitions) {
    UnityAudioEffectDefinition** table = nullptr;
    EXPECT_EQ(UnityGetAudioEffectDefinitions(&table), 2);
    EXPECT_STREQ(table[0]->name, "Tessaly Engine");
}

TEST_F(ExportsTest, TakesADirectoryWithData) {
    inFreshProcess([this] {
        EXPECT_TRUE(SetStreamingAssetsPath(good.path().c_str()));
        EXPECT_TRUE(assetPathSet);
        EXPECT_EQ(bundleBasePath, good.path());
    });
}

TEST_F(ExportsTest, TheFirstPathOfAFamilyCountsForEver) {
    inFreshProcess([this] {
        EXPECT_FALSE(SetStreamingAssetsPath(bad.path().c_str()));
        EXPECT_FALSE(assetPathSet);
        EXPECT_EQ(bundleBasePath, "");
        EXPECT_FALSE(SetStreamingAssetsPath(good.path().c_str()));
        EXPECT_FALSE(SetStreamingAssetsPathIOS(good.path().c_str())) << "one family, two names";
        EXPECT_FALSE(assetPathSet);
        EXPECT_TRUE(SetStreamingAssetsPathReverb(good.path().c_str())) << "has its own attempt";
        EXPECT_TRUE(assetPathSet);
        EXPECT_EQ(bundleBasePath, good.path());
        EXPECT_FALSE(SetStreamingAssetsPath(good.path().c_str()));
        EXPECT_TRUE(assetPathSet) << "a failure undoes nothing";
        EXPECT_EQ(bundleBasePath, good.path());
    });
}

TEST_F(ExportsTest, ALaterPathIsNotTaken) {
    inFreshProcess([this] {
        const TempDirectory other;
        writeFile(other.file("/TSLdata120.dat"), std::vector<char>{'x'});
        EXPECT_TRUE(SetStreamingAssetsPathReverbIOS(good.path().c_str()));
        EXPECT_TRUE(SetStreamingAssetsPathReverb(other.path().c_str()));
        EXPECT_EQ(bundleBasePath, good.path());
        EXPECT_TRUE(SetStreamingAssetsPathIOS(other.path().c_str())) << "the other family";
        EXPECT_EQ(bundleBasePath, other.path()) << "the last good call wins";
        EXPECT_TRUE(SetStreamingAssetsPathReverb(nullptr));
        EXPECT_EQ(bundleBasePath, good.path());
    });
}

TEST_F(ExportsTest, TheFirstPathIsCopied) {
    inFreshProcess([this] {
        std::string path = good.path();
        EXPECT_TRUE(SetStreamingAssetsPath(path.c_str()));
        path.assign(path.size(), '?');
        EXPECT_TRUE(SetStreamingAssetsPath(path.c_str()));
    });
}

TEST_F(ExportsTest, AnEmptyPathIsAFirstCallToo) {
    for (const char* empty : {"", static_cast<const char*>(nullptr)}) {
        inFreshProcess([this, empty] {
            EXPECT_FALSE(SetStreamingAssetsPath(empty));
            EXPECT_FALSE(SetStreamingAssetsPath(good.path().c_str()));
        });
    }
}

TEST_F(ExportsTest, DataMayArriveLater) {
    inFreshProcess([this] {
        EXPECT_FALSE(SetStreamingAssetsPath(bad.path().c_str()));
        writeFile(bad.file("/TSLdata120.dat"), std::vector<char>{'x'});
        EXPECT_TRUE(SetStreamingAssetsPath("anything"));
        EXPECT_EQ(bundleBasePath, bad.path());
    });
}

TEST_F(ExportsTest, BlockSizesAreKeptApart) {
    EXPECT_EQ(SetBuffersize(512), 512);
    EXPECT_EQ(SetBuffersizeReverb(256), 256);
    EXPECT_EQ(buffersizeSpat, 512);
    EXPECT_EQ(buffersizeReverb, 256);
    EXPECT_EQ(SetBuffersizeIOS(-3), -3);
    EXPECT_EQ(SetBuffersizeReverbIOS(0), 0);
    EXPECT_EQ(buffersizeSpat, -3);
    EXPECT_EQ(buffersizeReverb, 0);
}

TEST_F(ExportsTest, AllNamesOfThe3DBypassSetOneByte) {
    for (int (*set)(int) : {Set3DBypass, Set3DBypassIOS, Set3DBypassReverb, Set3DBypassReverbIOS}) {
        EXPECT_EQ(set(1), 1);
        EXPECT_EQ(bypass3DAudio, 1);
        EXPECT_EQ(set(0), 0);
        EXPECT_EQ(bypass3DAudio, 0);
        EXPECT_EQ(set(0x7F00), 0) << "only the low byte is the caller's";
        EXPECT_EQ(bypass3DAudio, 0);
        EXPECT_EQ(set(0x12FF), 255);
        EXPECT_EQ(bypass3DAudio, 255);
    }
}

TEST_F(ExportsTest, RoomDistancesKeepTheirOrder) {
    EXPECT_FALSE(roomDistancesSet);
    EXPECT_EQ(SetRoomDistances(1.5f, 2.5f, 3.5f, 4.5f, 5.5f, -1.0f), 1);
    EXPECT_TRUE(roomDistancesSet);
    EXPECT_EQ(roomDistances, (std::array<float, 6>{1.5f, 2.5f, 3.5f, 4.5f, 5.5f, -1.0f}));
    EXPECT_EQ(SetRoomDistancesIOS(6.0f, 5.0f, 4.0f, 3.0f, 2.0f, 1.0f), 1);
    EXPECT_EQ(roomDistances, (std::array<float, 6>{6.0f, 5.0f, 4.0f, 3.0f, 2.0f, 1.0f}));
}

TEST_F(ExportsTest, AllNamesOfTheErrorStateTellIt) {
    for (int (*state)() :
         {GetErrorState, GetErrorStateIOS, GetErrorStateReverb, GetErrorStateReverbIOS}) {
        essError = essErrorNone;
        EXPECT_EQ(state(), 1);
        essError = essErrorDatabaseMissing;
        EXPECT_EQ(state(), -103);
    }
}

TEST_F(ExportsTest, TestMethodeAnswers) {
    EXPECT_EQ(TestMethode(7), 1);
    EXPECT_EQ(TestMethode(-7), 1);
}

}  // namespace
}  // namespace tessaly::test
