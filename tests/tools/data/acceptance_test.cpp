// The built reference set keeps its figures; sets that were tampered with do not.
#include "data/acceptance.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>

#include "data/figure_table.h"
#include "data/library_reader.h"

namespace tessaly::data {
namespace {

using testing::Contains;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

std::size_t entryAt(int phi, int theta) {
    return static_cast<std::size_t>(packedIndex(phi, theta));
}

class BuiltSet : public testing::TestWithParam<int> {
protected:
    void SetUp() override {
        if (!std::filesystem::exists(std::filesystem::path(TESSALY_TEST_DATA) / "MANIFEST.txt")) {
            GTEST_SKIP() << "no data set in " << TESSALY_TEST_DATA;
        }
        set = readPackedSet(TESSALY_TEST_DATA, rateEntry(GetParam()));
    }
    std::vector<std::string> failures(const SetExpectations& expectations = {}) {
        return failedFigures({{"set", hrirFigures(set, expectations, progress)}});
    }
    double energyDb(int phi, int theta, int ear) const {
        double energy = 0.0;
        for (const double sample : set.response(entryAt(phi, theta), ear)) {
            energy += sample * sample;
        }
        return 10.0 * std::log10(energy);
    }
    std::size_t peak(int phi, int theta, int ear) const {
        const std::vector<double> response = set.response(entryAt(phi, theta), ear);
        return static_cast<std::size_t>(
            std::max_element(response.begin(), response.end(),
                             [](double a, double b) { return std::abs(a) < std::abs(b); }) -
            response.begin());
    }

    HrirSet set;
    Progress progress{stderr};
};

TEST_P(BuiltSet, EveryLargestTapIsPositiveAfterReading) {
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        for (int ear = 0; ear < earCount; ++ear) {
            const std::vector<double> response = set.response(entry, ear);
            const auto [low, high] = std::minmax_element(response.begin(), response.end());
            EXPECT_GT(*high, -*low)
                << packedOrder()[entry].phi << " " << packedOrder()[entry].theta;
        }
    }
    const double expected = GetParam() == 44100 ? 0.995 : GetParam() == 48000 ? 1.036 : 0.684;
    const std::vector<double> front = set.response(entryAt(0, 0), leftEar);
    EXPECT_NEAR(*std::max_element(front.begin(), front.end()), expected, 0.002);
}

TEST_P(BuiltSet, ASourceAtEitherSideIsEarlierAndLouderInThatEar) {
    for (const int phi : {-90, 90}) {
        const int near = phi > 0 ? leftEar : rightEar;
        const int far = phi > 0 ? rightEar : leftEar;
        EXPECT_GT(energyDb(phi, 0, near) - energyDb(phi, 0, far), 10.0);
        const double seconds =
            (static_cast<double>(peak(phi, 0, far)) - static_cast<double>(peak(phi, 0, near))) /
            GetParam();
        EXPECT_GT(seconds, 0.6e-3);
        EXPECT_LT(seconds, 0.75e-3);
    }
}

TEST_P(BuiltSet, ResponsesStartWithinTheFirstEarsLeadAndEndBeforeTheFade) {
    std::size_t earliest = set.taps;
    std::size_t latest = 0;
    for (const GridEntry& at : packedOrder()) {
        for (int ear = 0; ear < earCount; ++ear) {
            earliest = std::min(earliest, peak(at.phi, at.theta, ear));
            latest = std::max(latest, peak(at.phi, at.theta, ear));
        }
    }
    const struct {
        int rate;
        std::size_t earliest;
        std::size_t latest;
    } expected[] = {{44100, 11, 42}, {48000, 12, 45}, {24000, 6, 23}};
    for (const auto& item : expected) {
        if (item.rate == GetParam()) {
            EXPECT_EQ(earliest, item.earliest);
            EXPECT_EQ(latest, item.latest);
        }
    }
}

TEST_P(BuiltSet, BothSidesMirrorEachOtherExactly) {
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        const auto mirror = static_cast<std::size_t>(mirrorIndex(static_cast<int>(entry)));
        EXPECT_EQ(set.response(entry, leftEar), set.response(mirror, rightEar));
    }
}

INSTANTIATE_TEST_SUITE_P(Rates, BuiltSet, testing::Values(24000, 44100, 48000));

using BuiltSet44100 = BuiltSet;

TEST_P(BuiltSet44100, EnergiesOfKnownDirections) {
    const struct {
        int phi;
        int theta;
        double left;
        double right;
    } cases[] = {{0, 0, 2.41, 2.41},     {90, 0, 6.17, -9.20},  {45, 0, 4.31, -8.12},
                 {180, 0, -3.37, -3.37}, {0, 90, -2.03, -2.03}, {0, -90, -2.62, -2.62},
                 {0, 45, 1.48, 1.48},    {0, -45, -0.73, -0.73}};
    for (const auto& item : cases) {
        EXPECT_NEAR(energyDb(item.phi, item.theta, leftEar), item.left, 0.1) << item.phi;
        EXPECT_NEAR(energyDb(item.phi, item.theta, rightEar), item.right, 0.1) << item.phi;
    }
}

TEST_P(BuiltSet44100, RightSourceOfTheWorkedExample) {
    EXPECT_EQ(entryAt(-90, 0), 649u);
    EXPECT_EQ(peak(-90, 0, rightEar), 11u);
    EXPECT_EQ(peak(-90, 0, leftEar), 41u);
    EXPECT_NEAR(energyDb(-90, 0, rightEar) - energyDb(-90, 0, leftEar), 15.4, 0.1);
}

INSTANTIATE_TEST_SUITE_P(Rate, BuiltSet44100, testing::Values(44100));

// Tampering: the smallest set is enough, each case costs an analysis.
using TamperedSet = BuiltSet;

TEST_P(TamperedSet, UnchangedItPasses) { EXPECT_THAT(failures(), IsEmpty()); }

TEST_P(TamperedSet, SwappedEarsFail) {
    for (std::size_t i = 0; i < set.pairs.size(); i += 2) {
        std::swap(set.pairs[i], set.pairs[i + 1]);
    }
    EXPECT_THAT(failures(), Contains(HasSubstr("ITD at phi 90")));
    SetExpectations foreign;
    foreign.reference = false;
    const std::vector<std::string> lines = failures(foreign);
    EXPECT_THAT(lines, Contains(HasSubstr("level left - right at phi 90")));
    EXPECT_THAT(lines, Contains(HasSubstr("ITD at phi 90")));
}

TEST_P(TamperedSet, AnotherGainFails) {
    for (float& sample : set.pairs) {
        sample *= 1.05f;
    }
    const std::vector<std::string> lines = failures();
    EXPECT_THAT(lines, Contains(HasSubstr("frontal: sum of squares")));
    EXPECT_EQ(lines.size(), 1u);
}

TEST_P(TamperedSet, TurnedPolarityFails) {
    for (float& sample : set.pairs) {
        sample = -sample;
    }
    EXPECT_THAT(failures(), Contains(HasSubstr("negative largest tap")));
}

TEST_P(TamperedSet, ZeroedResponsesFail) {
    const auto first =
        set.pairs.begin() + static_cast<std::ptrdiff_t>(entryAt(30, 20) * set.taps * earCount);
    std::fill(first, first + static_cast<std::ptrdiff_t>(set.taps * earCount), 0.0f);
    EXPECT_THAT(failures(), Contains(HasSubstr("silent responses")));
}

TEST_P(TamperedSet, SamplesThatAreNoNumbersFail) {
    set.pairs[4711] = std::numeric_limits<float>::quiet_NaN();
    EXPECT_THAT(failures(), Contains(HasSubstr("no numbers")));
    set.pairs[4711] = std::numeric_limits<float>::infinity();
    EXPECT_THAT(failures(), Contains(HasSubstr("no numbers")));
}

TEST_P(TamperedSet, ExchangedDirectionsFail) {
    const auto frames = static_cast<std::ptrdiff_t>(set.taps * earCount);
    const auto ahead = set.pairs.begin() + static_cast<std::ptrdiff_t>(entryAt(60, 0)) * frames;
    const auto behind = set.pairs.begin() + static_cast<std::ptrdiff_t>(entryAt(150, 0)) * frames;
    std::swap_ranges(ahead, ahead + frames, behind);
    const std::vector<std::string> lines = failures();
    EXPECT_THAT(lines, Contains(HasSubstr("mirror error")));
    EXPECT_THAT(lines, Contains(HasSubstr("ITD less the sphere's")));
    EXPECT_THAT(lines, Contains(HasSubstr("neighbours in azimuth")));
}

INSTANTIATE_TEST_SUITE_P(Rate, TamperedSet, testing::Values(24000));

TEST(FigureTable, MarksValuesOutsideTheirRange) {
    const std::vector<FigureColumn> columns = {
        {"a", {{"row", {1.0, 5.0}, {{0.0, 2.0}, {0.0, 2.0}}, 1}}},
        {"b", {{"row", {1.0, 2.0}, {{0.0, 2.0}, {0.0, 2.0}}, 1}, {"shown", {7.0}, {{}}, 0}}}};
    const std::string table = figureTable(columns);
    EXPECT_THAT(table, HasSubstr("1.0 / 5.0!"));
    EXPECT_THAT(table, HasSubstr("1.0 / 2.0 "));
    EXPECT_THAT(table, HasSubstr("0..2 / 0..2"));
    EXPECT_THAT(table, HasSubstr("shown"));
    const std::vector<std::string> lines = failedFigures(columns);
    ASSERT_EQ(lines.size(), 1u);
    EXPECT_THAT(lines[0], HasSubstr("a: row"));
}

TEST(FigureTable, ANumberThatIsNoneFails) {
    const Figure figure{"x", {std::nan("")}, {{}}, 1};
    EXPECT_FALSE(figure.passed());
}

TEST(Spread, MeanPercentileAndLargest) {
    std::vector<double> values;
    for (int i = 100; i >= 0; --i) {
        values.push_back(i);
    }
    const Spread spread = spreadOf(values);
    EXPECT_DOUBLE_EQ(spread.mean, 50.0);
    EXPECT_DOUBLE_EQ(spread.percentile95, 95.0);
    EXPECT_DOUBLE_EQ(spread.largest, 100.0);
}

}  // namespace
}  // namespace tessaly::data
