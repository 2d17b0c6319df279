// The debugger's stream buffer.
#include "host/debug_log.h"

#include <gtest/gtest.h>

#include <iostream>
#include <string>
#include <vector>

#include "base/log.h"
#include "host/debug_text_capture.h"

namespace tessaly::test {
namespace {

/// Opens the protected operations.
class OpenBuffer : public windowsbuf {
public:
    using windowsbuf::overflow;
    using windowsbuf::sync;

    std::size_t pending() const { return static_cast<std::size_t>(pptr() - pbase()); }
};

using Texts = std::vector<std::string>;

std::string letters(std::size_t count) {
    std::string text(count, ' ');
    for (std::size_t i = 0; i < count; ++i) {
        text[i] = static_cast<char>('a' + i % 26);
    }
    return text;
}

TEST(DebugLog, HandsOverTheCollectedTextAtAFlush) {
    const DebugTextCapture capture;
    OpenBuffer buffer;
    buffer.sputn("abc", 3);
    EXPECT_TRUE(capture.calls().empty());
    EXPECT_EQ(buffer.pubsync(), 0);
    EXPECT_EQ(capture.calls(), (Texts{"abc"}));
    EXPECT_EQ(buffer.pending(), 0u);
}

TEST(DebugLog, AnEmptyFlushIsNoCall) {
    const DebugTextCapture capture;
    OpenBuffer buffer;
    EXPECT_EQ(buffer.pubsync(), 0);
    EXPECT_TRUE(capture.calls().empty());
}

TEST(DebugLog, HoldsOneHundredAndTwentySevenCharacters) {
    const DebugTextCapture capture;
    OpenBuffer buffer;
    const std::string text = letters(127);
    EXPECT_EQ(buffer.sputn(text.data(), 127), 127);
    EXPECT_TRUE(capture.calls().empty());
    buffer.pubsync();
    EXPECT_EQ(capture.calls(), (Texts{text}));
}

TEST(DebugLog, LosesTheCharacterThatFindsItFull) {
    const DebugTextCapture capture;
    OpenBuffer buffer;
    const std::string text = letters(300);
    EXPECT_EQ(buffer.sputn(text.data(), 300), 300) << "the writer is not told";
    buffer.pubsync();
    EXPECT_EQ(capture.calls(),
              (Texts{text.substr(0, 127), text.substr(128, 127), text.substr(256)}));
}

TEST(DebugLog, StoresAnEndOfFileMarkerAndFlushes) {
    const DebugTextCapture capture;
    OpenBuffer buffer;
    buffer.sputn("ab", 2);
    EXPECT_EQ(buffer.overflow(OpenBuffer::traits_type::eof()), 0);
    EXPECT_EQ(capture.calls(), (Texts{"ab\xFF"}));
}

TEST(DebugLog, AnEndOfFileMarkerInAFullAreaIsNotPassedOn) {
    const DebugTextCapture capture;
    OpenBuffer buffer;
    const std::string text = letters(127);
    buffer.sputn(text.data(), 127);
    EXPECT_EQ(buffer.overflow(OpenBuffer::traits_type::eof()), 0);
    EXPECT_EQ(capture.calls(), (Texts{text})) << "stored behind the area, which does not grow";
    buffer.sputn("x", 1);
    buffer.pubsync();
    EXPECT_EQ(capture.calls().back(), "x");
}

TEST(DebugLog, AnOrdinaryCharacterIsReturnedAndDropped) {
    const DebugTextCapture capture;
    OpenBuffer buffer;
    buffer.sputn("ab", 2);
    EXPECT_EQ(buffer.overflow('c'), 'c');
    buffer.pubsync();
    EXPECT_EQ(capture.calls(), (Texts{"ab"}));
}

TEST(DebugLog, OneMessageIsOneCall) {
    const DebugTextCapture capture;
    installDebugLog();
    logOutput("Tessaly_h: ", 1, " of ", 2.5f);
    logOutput("second");
    EXPECT_EQ(capture.calls(), (Texts{"Tessaly_h: 1 of 2.5\n", "second\n"}));
}

TEST(DebugLog, TheOutputStreamWorksAgainAfterAFailure) {
    const DebugTextCapture capture;
    std::cout.setstate(std::ios::badbit);
    installDebugLog();
    EXPECT_TRUE(std::cout.good());
    logOutput("heard");
    EXPECT_EQ(capture.calls(), (Texts{"heard\n"}));
}

TEST(DebugLog, EachInstallationReplacesTheBuffer) {
    const DebugTextCapture capture;
    installDebugLog();
    std::streambuf* first = std::cout.rdbuf();
    EXPECT_NE(dynamic_cast<windowsbuf*>(first), nullptr);
    std::cout << "half a line";
    installDebugLog();
    EXPECT_NE(std::cout.rdbuf(), first);
    logOutput("whole");
    EXPECT_EQ(capture.calls(), (Texts{"whole\n"})) << "the old buffer keeps what it holds";
    first->pubsync();
    EXPECT_EQ(capture.calls().back(), "half a line") << "and is still there for a late writer";
}

TEST(DebugLog, WithoutADebuggerTheTextGoesToStandardError) {
    installDebugLog();
    ::testing::internal::CaptureStderr();
    logOutput("to the terminal");
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "to the terminal\n");
}

TEST(DebugLog, TraceLinesAreDropped) {
    if (traceEnabled) {
        GTEST_SKIP() << "this build sends trace lines to the log";
    }
    const DebugTextCapture capture;
    installDebugLog();
    logTrace("nobody reads this");
    EXPECT_TRUE(capture.calls().empty());
}

}  // namespace
}  // namespace tessaly::test
