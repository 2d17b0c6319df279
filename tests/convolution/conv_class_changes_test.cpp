// What is spared where little changes, against the plain order that computes all of it.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>

#include "convolution/convolver_rig.h"
#include "convolution/kernel_fixture.h"

namespace tessaly::test {
namespace {

struct Shape {
    std::int32_t blockLength;
    std::int16_t partitions;
    std::int32_t farRatio = 0;  ///< 0: all partitions are of one length
};

bool sameSpectra(const std::vector<ComplexBin*>& a,
                 const std::vector<ComplexBin*>& b,
                 std::int32_t bins) {
    for (std::size_t i = 0; i < a.size(); ++i) {
        if (std::memcmp(a[i], b[i], static_cast<std::size_t>(bins) * sizeof(ComplexBin)) != 0) {
            return false;
        }
    }
    return true;
}

/// Two pairs of convolvers on the same input: one in the plain order with the whole response
/// written out, one that is told what changes and has the end of its response without its gain.
class ChangingResponse : public testing::TestWithParam<Shape> {
protected:
    ChangingResponse()
        : plain(GetParam().blockLength, GetParam().partitions),
          spared(GetParam().blockLength, GetParam().partitions) {
        resetConvolutionState();
        plain.makeBoth();
        spared.makeBoth();
        spared.heardOfOld = heard();
        if (GetParam().farRatio > 0) {
            spared.first->splitFarTail(GetParam().farRatio);
        }
        spared.first->continueResults();
        const int size = static_cast<int>(spared.filterLeft.size());
        spared.first->watch(&notes, size);
        notes.scaledEnd = {size, 1.0f};
        notes.written.include(0, size);
    }
    ~ChangingResponse() override { resetConvolutionState(); }
    ChangingResponse(const ChangingResponse&) = delete;
    ChangingResponse& operator=(const ChangingResponse&) = delete;

    int block() const { return spared.blockLength; }
    int heard() const { return std::min(block(), 64); }
    int size() const { return static_cast<int>(spared.filterLeft.size()); }

    /// Before anything is written. @param update  and `goesOn`: the next block is a crossfade block
    /// whose window follows the last one
    void begin(bool update, bool goesOn = true) {
        spared.first->beforeWriting(update && goesOn && spared.blockCounter != 0);
    }
    /// Writes noise, or silence, into [begin, end) of the response that is spared.
    void write(int begin, int end, float level) {
        for (int i = begin; i < end; ++i) {
            spared.filterLeft[static_cast<std::size_t>(i)] = level * noise();
            spared.filterRight[static_cast<std::size_t>(i)] = level * noise();
        }
        notes.written.include(begin, end);
    }
    void setEnd(int begin, float gain) {
        // What stood between the two places is read differently now.
        notes.written.include(std::min(begin, notes.scaledEnd.begin),
                              std::max(begin, notes.scaledEnd.begin));
        notes.scaledEnd = {begin, gain};
    }
    /// Writes the same response out for the plain pair.
    void writeOut() {
        for (int i = 0; i < size(); ++i) {
            const auto at = static_cast<std::size_t>(i);
            const float gain = i >= notes.scaledEnd.begin ? notes.scaledEnd.gain : 1.0f;
            plain.filterLeft[at] = spared.filterLeft[at] * gain;
            plain.filterRight[at] = spared.filterRight[at] * gain;
        }
    }
    void run(bool update) {
        if (update) {
            writeOut();
        }
        const std::vector<float> input = silent
                                             ? std::vector<float>(static_cast<std::size_t>(block()))
                                             : noise.samples(static_cast<std::size_t>(block()));
        plain.feed(input);
        spared.feed(input);
        const bool crossfade = update && plain.blockCounter != 0;
        plain.run(update);
        spared.run(update);
        compare(plain.firstLeft, spared.firstLeft, block());
        compare(plain.firstRight, spared.firstRight, block());
        if (crossfade) {
            compare(plain.secondLeft, spared.secondLeft, heard());
            compare(plain.secondRight, spared.secondRight, heard());
            continuedBlocks += spared.first->oldContinued() ? 1 : 0;
        }
        farBlocks += spared.first->farTailHeard() ? 1 : 0;
        const std::int32_t bins = spared.first->binCount;
        EXPECT_TRUE(sameSpectra(plain.first->FDLown, spared.first->FDLown, bins));
        EXPECT_TRUE(sameSpectra(plain.second->FDL, spared.second->FDL, bins));
        EXPECT_EQ(spared.first->FDL, spared.first->FDLown);
        EXPECT_EQ(plain.first->FDLpos, spared.first->FDLpos);
        EXPECT_TRUE(!update || notes.written.empty()) << "an update takes what was written";
    }
    /// The heard half of a result, or its start.
    void compare(const std::vector<float>& expected, const std::vector<float>& got, int count) {
        for (int i = 0; i < count; ++i) {
            const auto at = static_cast<std::size_t>(block() + i);
            largest = std::max(largest, std::abs(static_cast<double>(expected[at])));
            worst = std::max(
                worst, std::abs(static_cast<double>(expected[at]) - static_cast<double>(got[at])));
        }
    }

    ConvolverRig plain;
    ConvolverRig spared;
    FirNotes notes;
    Noise noise{11};
    bool silent = false;
    int continuedBlocks = 0;  ///< crossfade blocks whose old response was not convolved
    int farBlocks = 0;        ///< blocks whose far part came from larger partitions
    double largest = 0.0;
    double worst = 0.0;
};

TEST_P(ChangingResponse, FollowsThePlainOrderThroughEveryKindOfChange) {
    write(0, size(), 0.5f);
    for (int n = 0; n < 160; ++n) {
        SCOPED_TRACE(n);
        const int kind = static_cast<int>(noise.samples(1)[0] * 1000.0f + 1000.0f) % 10;
        const bool update = n == 0 || static_cast<int>(noise() * 10.0f) % 4 != 0;
        begin(update);
        const auto place = [&](int least, int most) {
            const int span = std::max(most - least, 0);
            return least + static_cast<int>((noise() + 1.0f) * 0.5f * static_cast<float>(span));
        };
        switch (kind) {
            case 0:  // a single sample
            case 1: {
                const int at = place(0, size() - 1);
                write(at, at + 1, 0.5f);
                break;
            }
            case 2: {
                const int begin = place(0, size());
                write(begin, place(begin, size()), 0.5f);
                break;
            }
            case 3: {  // silence in whole partitions
                const int begin = place(0, size() / block()) * block();
                write(begin, std::min(begin + 2 * block(), size()), 0.0f);
                break;
            }
            case 4:
                setEnd(place(0, GetParam().partitions) * block(), 0.25f + 0.25f * noise());
                break;
            case 5:
                setEnd(notes.scaledEnd.begin, noise());
                break;
            case 6:
                setEnd(size(), 1.0f);
                break;
            case 7:
                setEnd(notes.scaledEnd.begin, 0.0f);
                break;
            case 8:
                silent = !silent;
                break;
            default:  // nothing
                break;
        }
        run(update);
    }
    ASSERT_GT(largest, 0.0);
    EXPECT_LT(worst / largest, 1e-6);
}

TEST_P(ChangingResponse, AnUnchangedResponseGivesTheOldOnesSamplesBitForBit) {
    write(0, size(), 0.5f);
    run(true);
    for (int n = 0; n < 3 * GetParam().partitions; ++n) {
        run(true);
        for (int i = 0; i < heard(); ++i) {
            const auto at = static_cast<std::size_t>(block() + i);
            ASSERT_EQ(spared.firstLeft[at], spared.secondLeft[at]);
            ASSERT_EQ(spared.firstRight[at], spared.secondRight[at]);
        }
    }
}

TEST_P(ChangingResponse, SamplesThatNobodyNotedAreNotTaken) {
    write(0, size(), 0.5f);
    run(true);
    writeOut();
    const std::vector<ComplexBin> before(spared.first->filterPartsL[0],
                                         spared.first->filterPartsL[0] + spared.first->binCount);
    spared.filterLeft[0] += 1.0f;
    spared.run(true);
    EXPECT_EQ(std::memcmp(before.data(), spared.first->filterPartsL[0],
                          before.size() * sizeof(ComplexBin)),
              0);
    notes.written.include(0, 1);
    spared.run(true);
    EXPECT_NE(std::memcmp(before.data(), spared.first->filterPartsL[0],
                          before.size() * sizeof(ComplexBin)),
              0);
}

/// A long response whose start changes all the time and whose end changes rarely, in runs of plain
/// blocks and of crossfade blocks, through silences and a stop.
TEST_P(ChangingResponse, FarTailInLargerPartitionsGivesTheSame) {
    const int far = 2 * GetParam().farRatio * block();
    write(0, size(), 0.5f);
    setEnd(std::min(far, size()), 0.5f);
    bool updates = true;
    const int blocks = 12 * GetParam().partitions;
    for (int n = 0; n < blocks; ++n) {
        SCOPED_TRACE(n);
        const int kind = static_cast<int>(noise.samples(1)[0] * 1000.0f + 1000.0f) % 64;
        begin(updates && kind != 28, (kind != 31 || n % 3 != 0) && (kind != 32 || n % 5 != 0));
        if (kind < 24) {
            write(0, block(), 0.5f);
        } else if (kind < 28) {
            setEnd(notes.scaledEnd.begin, noise());
        } else if (kind == 28) {
            updates = !updates;
        } else if (kind == 29) {
            silent = !silent;
        } else if (kind == 30 && n % 3 == 0) {  // the far end
            write(size() - 3 * block(), size() - block(), 0.5f);
        } else if (kind == 31 && n % 3 == 0) {
            for (ConvolverRig* const rig : {&plain, &spared}) {
                rig->first->clearFDL();
                rig->second->clearFDL();
                std::ranges::fill(rig->window, 0.0f);
            }
        } else if (kind == 32 && n % 5 == 0) {  // a window that does not follow the one before
            for (ConvolverRig* const rig : {&plain, &spared}) {
                std::ranges::fill(rig->window, 0.25f);
            }
        }
        run(n == 0 || updates);
    }
    ASSERT_GT(largest, 0.0);
    EXPECT_LT(worst / largest, 1e-6);
    if (GetParam().farRatio > 0) {
        EXPECT_GT(farBlocks, blocks / 4) << "else this compares nothing";
    } else {
        EXPECT_EQ(farBlocks, 0);
    }
}

/// A source that moves: a few stretches of the start, at odd places, in each block anew.
TEST_P(ChangingResponse, OldResponsesOfARunOfMovesGoOnFromTheLastResult) {
    const int last = GetParam().farRatio > 0 ? 2 * GetParam().farRatio * block() : size() - block();
    const int partitions = GetParam().partitions;
    spared.first->watch(&notes, 0);  // keeps no copies, as in an engine
    write(last, size(), 0.2f);
    setEnd(last, 0.5f);
    int crossfades = 0;
    const auto move = [&](bool update) {
        begin(update);
        write(0, last, 0.0f);
        const int length = std::min(block() / 2, last);
        for (int begin = 0; begin + length <= last; begin += 2 * block() - 7) {
            write(begin, begin + length, 0.5f);
        }
        crossfades += update ? 1 : 0;
        run(update);
    };
    run(true);
    for (int n = 0; n < 3 * partitions + 4; ++n) {
        SCOPED_TRACE(n);
        move(true);
    }
    for (int round = 0; round < 3; ++round) {
        SCOPED_TRACE(round);
        for (int n = 0; n < partitions + 3; ++n) {
            move(true);
        }
        // It stops, and is heard with all that was not kept: plain, or in a crossfade with nothing
        // new, or while its end changes.
        begin(round > 0);
        if (round == 2) {
            setEnd(last, -0.25f);
        }
        run(round > 0);
        begin(false);
        run(false);
    }
    // What changes in each block falls into the end with a gain, and comes out of it.
    for (int n = 0; n < 2 * partitions + 6; ++n) {
        SCOPED_TRACE(n);
        move(true);
        begin(true);
        write(0, 5, 0.5f);
        setEnd(n % 3 == 2 ? 0 : last, 0.5f);
        run(true);
    }
    if (last + 2 * block() < size()) {
        for (int n = 0; n < 2 * partitions; ++n) {
            move(true);
        }
        begin(true);
        write(last + block(), size() - block(), 0.3f);  // the far end as well
        write(0, 3, 0.1f);
        run(true);
        move(true);
    }
    ASSERT_GT(largest, 0.0);
    EXPECT_LT(worst / largest, 1e-6);
    if (block() >= Continuation::samples) {
        EXPECT_GT(continuedBlocks, crossfades / 3) << "else this compares nothing";
    } else {
        EXPECT_EQ(continuedBlocks, 0);
    }
}

/// An engine that may not convolve moves its window on all the same.
TEST_P(ChangingResponse, ABlockThatNobodyMadeIsNoBlockToGoOnFrom) {
    write(0, size(), 0.5f);
    run(true);
    const auto move = [&] {
        begin(true);
        write(0, block(), 0.5f);
        run(true);
    };
    for (int round = 0; round < 3; ++round) {
        for (int n = 0; n < GetParam().partitions + 3; ++n) {
            move();
        }
        const std::vector<float> missed = noise.samples(static_cast<std::size_t>(block()));
        begin(false);
        write(0, block(), 0.5f);
        plain.feed(missed);
        spared.feed(missed);
    }
    move();
    ASSERT_GT(largest, 0.0);
    EXPECT_LT(worst / largest, 1e-6);
}

/// A promise that is broken costs the old response, and no more.
TEST_P(ChangingResponse, ABlockThatWasPromisedAndNotMadeIsForgotten) {
    write(0, size(), 0.5f);
    run(true);
    for (int n = 0; n < GetParam().partitions + 4; ++n) {
        begin(true);
        write(0, block(), 0.5f);
        run(true);
    }
    begin(true);
    plain.feed(noise.samples(static_cast<std::size_t>(block())));
    spared.window = plain.window;
    begin(true);
    write(0, block(), 0.5f);
    run(true);
    EXPECT_FALSE(spared.first->oldContinued());
    ASSERT_GT(largest, 0.0);
    EXPECT_LT(worst / largest, 1e-6) << "nothing had been written for it";
}

TEST_P(ChangingResponse, NoNumbersOfAResponseThatMeetOnlySilenceAreNotHeard) {
    silent = true;
    begin(true);
    write(0, size(), 0.5f);
    run(true);
    const auto at = static_cast<std::size_t>(size() - block());
    for (int n = 0; n < 3 * GetParam().partitions + 3; ++n) {
        SCOPED_TRACE(n);
        // Sound comes in behind, so that the last partition meets none of it for a while.
        silent = n < GetParam().partitions + 2;
        begin(true);
        write(0, size(), 0.5f);
        spared.filterLeft[at] = n % 2 == 0 ? NAN : INFINITY;
        run(true);
        bool numbers = true;
        for (int i = 0; i < heard(); ++i) {
            numbers =
                numbers && std::isfinite(spared.secondLeft[static_cast<std::size_t>(block() + i)]);
        }
        const bool sounds = n >= GetParam().partitions + 2 + GetParam().partitions - 1;
        EXPECT_TRUE(numbers || sounds);
    }
}

class ChangingFarTail : public ChangingResponse {};

TEST_P(ChangingFarTail, MakesUpForBlocksThatARingHasMissed) {
    write(0, size(), 0.5f);
    const int partitions = GetParam().partitions;
    for (int n = 0; n < 3 * partitions; ++n) {
        run(true);
    }
    EXPECT_TRUE(spared.first->farTailHeard());
    for (int n = 0; n < 2; ++n) {
        run(false);  // the crossfade blocks' ring misses these
    }
    for (int n = 0; n < partitions; ++n) {
        run(true);
        EXPECT_TRUE(spared.first->farTailHeard()) << n;
    }
    ASSERT_GT(largest, 0.0);
    EXPECT_LT(worst / largest, 1e-6);
}

TEST_P(ChangingFarTail, IsBuiltFromWhatACrossfadeBlockBrought) {
    const int partitions = GetParam().partitions;
    for (int round = 0; round < 4; ++round) {
        write(0, size(), 0.5f);  // all of it, the far part too
        run(true);
        for (int n = 0; n < 3 * partitions + round; ++n) {
            run(false);
        }
        EXPECT_TRUE(spared.first->farTailHeard()) << round;
    }
    ASSERT_GT(largest, 0.0);
    EXPECT_LT(worst / largest, 1e-6);
}

INSTANTIATE_TEST_SUITE_P(Shapes,
                         ChangingResponse,
                         testing::Values(Shape{32, 1},
                                         Shape{32, 2},
                                         Shape{16, 5},
                                         Shape{64, 1},
                                         Shape{64, 3},
                                         Shape{128, 8},
                                         Shape{32, 17},
                                         Shape{32, 48, 4},
                                         Shape{16, 90, 8},
                                         Shape{64, 33, 4}));

INSTANTIATE_TEST_SUITE_P(Shapes,
                         ChangingFarTail,
                         testing::Values(Shape{32, 48, 4}, Shape{16, 90, 8}, Shape{64, 33, 4}));

}  // namespace
}  // namespace tessaly::test
