// Tests of the log channels, through captured streams.
#include "base/log.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "support/log_capture.h"

namespace tessaly {
namespace {

using test::LogCapture;
using test::LogLine;
using test::LogStream;
using ::testing::ElementsAre;

TEST(Log, OutputIsOneLineOnTheOutputStreamOnly) {
    LogCapture log;
    logOutput("reverbLength = ", 23147, " of ", std::string("x"));
    EXPECT_EQ(log.output(), "reverbLength = 23147 of x\n");
    EXPECT_EQ(log.error(), "");
}

TEST(Log, OutputFlushesOnceALine) {
    LogCapture log;
    logOutput("one ", 1);
    EXPECT_EQ(log.flushes(LogStream::output), 1);
    logOutput("two ", 2, " three");
    EXPECT_EQ(log.flushes(LogStream::output), 2);
}

TEST(Log, ErrorIsOneLineOnTheErrorStreamOnly) {
    LogCapture log;
    logError("Tessaly_h: ERROR code ", -104);
    EXPECT_EQ(log.output(), "");
    EXPECT_EQ(log.error(), "Tessaly_h: ERROR code -104\n");
}

TEST(Log, BothWritesOutputFirst) {
    LogCapture log;
    logBoth("Tessaly_e ERROR: ", 7);
    EXPECT_THAT(log.lines(), ElementsAre(LogLine{LogStream::output, "Tessaly_e ERROR: 7"},
                                         LogLine{LogStream::error, "Tessaly_e ERROR: 7"}));
}

TEST(Log, ShortIntegersArePrintedAsNumbers) {
    LogCapture log;
    logOutput(std::int16_t{-5}, ' ', std::uint32_t{4294967295u});
    EXPECT_EQ(log.output(), "-5 4294967295\n");
}

TEST(Log, TraceLinesAreDroppedUnlessTheBuildAsksForThem) {
    LogCapture log;
    logTrace("trace ", 1);
    EXPECT_EQ(log.output(), traceEnabled ? "trace 1\n" : "");
    EXPECT_EQ(log.error(), "");
}

TEST(LogCapture, GivesTheStreamsBackAndCountsLines) {
    std::streambuf* output = std::cout.rdbuf();
    std::streambuf* error = std::cerr.rdbuf();
    {
        LogCapture log;
        logOutput("same");
        logOutput("same again");
        logError("same");
        EXPECT_EQ(log.count(LogStream::output, "same"), 2u);
        EXPECT_EQ(log.count(LogStream::error, "same"), 1u);
        log.clear();
        EXPECT_TRUE(log.lines().empty());
    }
    EXPECT_EQ(std::cout.rdbuf(), output);
    EXPECT_EQ(std::cerr.rdbuf(), error);
}

TEST(LogCapture, ReattachTakesAStreamBackFromAnotherBuffer) {
    std::streambuf* output = std::cout.rdbuf();
    {
        LogCapture log;
        std::cout.rdbuf(nullptr);
        log.reattach();
        std::cout.clear();
        logOutput("caught");
        EXPECT_EQ(log.output(), "caught\n");
    }
    EXPECT_EQ(std::cout.rdbuf(), output);
}

}  // namespace
}  // namespace tessaly
