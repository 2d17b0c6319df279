// Fresh processes, data and sources for tests of the built library.
#include "plugin/plugin_fixture.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

#include "minihost/pose.h"
#include "support/fresh_process.h"

namespace tessaly::test {

void PluginTest::withLibrary(const std::function<void(const PluginLibrary&)>& body) {
    inFreshProcess([&] {
        const PluginLibrary library(PluginLibrary::locate(""));
        body(library);
    });
}

void PluginTest::withData(const std::vector<std::uint32_t>& rates,
                          const std::function<void(const PluginLibrary&)>& body) {
    const TempDirectory data;
    for (const std::uint32_t rate : rates) {
        writePackedHrirSet(data.path(), static_cast<int>(rate));
        // Rooms load without an error; their tails lie behind the file's end and stay silent.
        writePackedTails(data.path(), static_cast<int>(rate), {});
    }
    // Its presence tells a data directory, whatever rate is played.
    if (std::find(rates.begin(), rates.end(), 44100u) == rates.end()) {
        writeFile(data.file("/TSLdata120.dat"), std::vector<char>{'x'});
    }
    withLibrary([&](const PluginLibrary& library) {
        ASSERT_TRUE(library.setStreamingAssetsPath(data.path()));
        body(library);
    });
}

std::string standardErrorOf(const std::function<void()>& body) {
    ::testing::internal::CaptureStderr();
    body();
    std::fflush(stderr);
    return ::testing::internal::GetCapturedStderr();
}

std::size_t occurrences(std::string_view text, std::string_view part) {
    std::size_t count = 0;
    for (std::size_t at = text.find(part); at != std::string_view::npos;
         at = text.find(part, at + part.size())) {
        ++count;
    }
    return count;
}

Source::Source(const PluginLibrary& library, std::uint32_t rate, std::uint32_t blockLength)
    : frames(blockLength),
      instance(library.effect("Tessaly Engine"), rate, blockLength),
      in(2 * static_cast<std::size_t>(blockLength)),
      out(in.size()) {
    instance.setParameter("Room Selection", 0.0f);
}

void Source::place(double azimuth, double elevation, double distance) {
    Pose source;
    source.position = fromSpherical(azimuth, elevation, distance);
    instance.place(Pose{}, source);
}

const std::vector<float>& Source::block() {
    for (std::size_t i = 0; i < frames; ++i) {
        seed = seed * 1664525u + 1013904223u;
        const float sample =
            static_cast<float>(static_cast<std::int32_t>(seed)) * 0.25f / 2147483648.0f;
        in[2 * i] = sample;
        in[2 * i + 1] = sample;
    }
    return block(in);
}

const std::vector<float>& Source::block(const std::vector<float>& input, int inchannels) {
    std::copy(input.begin(), input.end(), in.begin());
    EXPECT_EQ(instance.processBlock(in.data(), out.data(), frames, inchannels, 2), 0);
    return out;
}

std::vector<float> Source::blocks(int count) {
    std::vector<float> all;
    for (int i = 0; i < count; ++i) {
        const std::vector<float>& one = block();
        all.insert(all.end(), one.begin(), one.end());
    }
    return all;
}

double energy(const std::vector<float>& stereo, std::size_t channel) {
    double sum = 0.0;
    for (std::size_t i = channel; i < stereo.size(); i += 2) {
        sum += static_cast<double>(stereo[i]) * static_cast<double>(stereo[i]);
    }
    return sum;
}

bool allFinite(const std::vector<float>& samples) {
    return std::all_of(samples.begin(), samples.end(), [](float s) { return std::isfinite(s); });
}

bool allZero(const std::vector<float>& samples) {
    return std::all_of(samples.begin(), samples.end(), [](float s) { return s == 0.0f; });
}

}  // namespace tessaly::test
