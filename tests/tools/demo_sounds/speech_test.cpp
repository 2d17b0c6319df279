// Speech through the synthesiser program, where there is one.
#include "demo_sounds/speech.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <stdexcept>
#include <string>

#include "demo_sounds/demo_sounds.h"

namespace tessaly {
namespace {

TEST(Speech, MissingProgramIsReported) {
    const char* present = std::getenv("PATH");
    const std::string saved = present != nullptr ? present : "";
    ASSERT_EQ(setenv("PATH", "/no/such/folder", 1), 0);
    EXPECT_FALSE(speechAvailable());
    EXPECT_THROW(makeSpeech("hello", 48000.0), std::runtime_error);
    setenv("PATH", saved.c_str(), 1);
}

TEST(Speech, SpeaksAnyTextAtTheRateWanted) {
    if (!speechAvailable()) {
        GTEST_SKIP() << "espeak-ng is not installed";
    }
    const Sound plain = makeSpeech("one two three", 44100.0);
    EXPECT_EQ(plain.channels, 1);
    EXPECT_EQ(plain.sampleRate, 44100.0);
    EXPECT_GT(plain.frames(), 22050u);
    EXPECT_GT(rmsOf(plain.samples), 0.05);
    for (const float sample : plain.samples) {
        ASSERT_LE(std::abs(sample), 1.0f);
    }
    // Quotes, a leading dash and command substitution are text like any other.
    EXPECT_GT(makeSpeech("-v \"$(touch /no/such)\" 'quoted'; one", 24000.0).frames(), 12000u);
}

}  // namespace
}  // namespace tessaly
