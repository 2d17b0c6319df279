// A process of the library and one of the reference, side by side, each as if freshly started.
#include "comparison/comparison_fixture.h"

#include <algorithm>
#include <cstdio>
#include <sstream>

namespace tessaly::test {

void ComparisonFixture::TearDown() {
    std::ostringstream largest;
    largest << deviation.largest();
    RecordProperty("largestDeviation", largest.str());
    std::printf("[ DEVIATION] %.2e of full scale in %zu samples, peak %.3f\n", deviation.largest(),
                deviation.samples(), deviation.peak());
    EXPECT_LE(deviation.largest(), tolerance);
    EXPECT_GT(deviation.peak(), leastPeak) << "silence was compared with silence";
}

const TempDirectory& ComparisonFixture::directoryOf(int sampleRate, bool use256) {
    const auto [at, fresh] = directories_.try_emplace({sampleRate, use256});
    if (fresh) {
        writePackedHrirSet(at->second.path(), sampleRate, use256 ? 256 : 0);
    }
    return at->second;
}

std::unique_ptr<ComparedSource> ComparisonFixture::source(const reference::EngineOptions& options,
                                                          const SourceValues& values) {
    const int q = options.qualityValue;
    const bool use256 = q > 0 ? usesLongHrirs(q) : options.qvUse256HRIR;
    const std::string& directory = directoryOf(options.sampleRate, use256).path();
    process.hrirSource = [this, directory](int sampleRate, int frames) {
        const auto [at, fresh] = files_.try_emplace({sampleRate, frames});
        if (fresh) {
            at->second = reference::packedFilesIn(directory)(sampleRate, frames);
        }
        return at->second;
    };
    auto made = std::make_unique<ComparedSource>(process, directory, options, values);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_EQ(process.essError, 1);
    EXPECT_TRUE(made->plain().built());
    EXPECT_EQ(made->rig().state().sizes.FIR_size, made->plain().firSize());
    EXPECT_EQ(made->rig().state().sizes.fdlCount, made->plain().partitions());
    return made;
}

void ComparisonFixture::restart() {
    resetProcess();
    process = reference::Process{};
}

int ComparisonFixture::blocksOf(double seconds, int sampleRate, int blockLength, int least) {
    return std::max(least, static_cast<int>(seconds * sampleRate / blockLength));
}

}  // namespace tessaly::test
