// The pieces of a response, filtered side by side and kept, against one after the other.
#include "engine/response_pieces.h"

#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <random>
#include <vector>

#include "base/precision.h"
#include "convolution/simd/kernels.h"

namespace tessaly::test {
namespace {

constexpr int sampleRate = 48000;
constexpr int longest = 70;  // frames of an HRIR that is kept
constexpr int responseSize = 600;

/// Both ears.
struct Response {
    std::vector<float> left = std::vector<float>(responseSize, 0.0f);
    std::vector<float> right = std::vector<float>(responseSize, 0.0f);

    EarBuffers ears() { return {left.data(), right.data(), responseSize}; }
};

/// One piece after the other, each from its HRIR.
void writePlainly(const EarBuffers& ears, const PieceList& pieces, std::array<Biquad, 2>& filters) {
    for (const ResponsePiece& piece : pieces) {
        const EarPairs pairs{piece.hrir + 1, piece.hrir, piece.frames};
        if (piece.kind == ResponsePiece::Kind::Filtered) {
            Biquad& filter = filters[piece.filterClass];
            filter.follow(Biquad::normalise(piece.cutOff, sampleRate));
            addFilteredPairs(ears, piece.position, pairs, piece.gain, filter, {15, 0.06666667f});
            continue;
        }
        const FrameRange range = framesInside(piece.position, piece.frames, ears.size);
        for (int i = range.begin; i < range.end; ++i) {
            float& left = ears.left[piece.position + i];
            float& right = ears.right[piece.position + i];
            switch (piece.kind) {
                case ResponsePiece::Kind::Direct:
                    left = pairs.leftAt(i) * piece.gain * piece.secondGain;
                    right = pairs.rightAt(i) * piece.gain * piece.secondGain;
                    break;
                case ResponsePiece::Kind::Fixed:
                    left = single(wide(left) +
                                  wide(pairs.leftAt(i)) * piece.fixedGain * wide(piece.gain));
                    right = single(wide(right) +
                                   wide(pairs.rightAt(i)) * piece.fixedGain * wide(piece.gain));
                    break;
                default:
                    left += pairs.leftAt(i) * piece.gain;
                    right += pairs.rightAt(i) * piece.gain;
                    break;
            }
        }
    }
}

class PieceWriterOfEveryTable : public testing::TestWithParam<std::size_t> {
protected:
    PieceWriterOfEveryTable() {
        for (std::vector<float>& hrir : hrirs) {
            hrir.resize(2 * (longest + 20));
            for (float& sample : hrir) {
                sample = uniform(-1.0f, 1.0f);
            }
        }
        writer.prepare(longest);
    }
    void TearDown() override { forceKernels(nullptr); }

    float uniform(float low, float high) {
        return std::uniform_real_distribution<float>(low, high)(random);
    }
    int whole(int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); }

    /// @param gainOf  gives a filtered piece its gain
    template <typename Gain>
    ResponsePiece piece(int number, Gain gainOf) {
        ResponsePiece made;
        made.hrir = hrirs[static_cast<std::size_t>(whole(0, 3))].data();
        made.frames = whole(0, 5) == 0 ? whole(0, longest + 20) : longest;
        made.position = whole(0, 4) == 0 ? whole(-80, responseSize + 20) : 20 * number;
        made.gain = uniform(-1.0f, 1.0f);
        const int kind = number == 0 ? 0 : whole(1, 6);
        if (kind == 0) {
            made.kind = ResponsePiece::Kind::Direct;
            made.secondGain = uniform(-1.0f, 1.0f);
        } else if (kind == 1) {
            made.kind = ResponsePiece::Kind::Fixed;
            made.fixedGain = 0.11;
        } else if (kind == 2) {
            made.kind = ResponsePiece::Kind::Plain;
        } else {
            made.kind = ResponsePiece::Kind::Filtered;
            made.filterClass = static_cast<std::uint8_t>(kind & 1);
            made.cutOff = kind < 5 ? 4000.0f : cutOff;
            made.gain = gainOf();
        }
        return made;
    }
    /// Random lists of which a few pieces change from one to the next, written both ways.
    template <typename Gain, typename Compare>
    void writeLists(Gain gainOf, Compare compare) {
        for (int n = 0; n < 300; ++n) {
            if (n % 20 == 0) {
                cutOff = uniform(300.0f, 30000.0f);
            }
            const int count =
                n % 10 == 0 ? whole(0, PieceList::capacity) : static_cast<int>(current.size());
            while (static_cast<int>(current.size()) > count) {
                current.pop_back();
            }
            while (static_cast<int>(current.size()) < count) {
                current.push_back(piece(static_cast<int>(current.size()), gainOf));
            }
            for (int changes = whole(0, 3); changes > 0 && count > 0; --changes) {
                const int number = whole(0, count - 1);
                current[static_cast<std::size_t>(number)] = piece(number, gainOf);
            }
            PieceList pieces;
            for (const ResponsePiece& each : current) {
                pieces.add(each);
            }
            Response expected;
            Response response;
            filters[n % 2].z1 = 3.0;
            writePlainly(expected.ears(), pieces, plainFilters);
            writer.write(response.ears(), pieces, sampleRate, filters);
            for (std::size_t i = 0; i < responseSize; ++i) {
                ASSERT_NO_FATAL_FAILURE(compare(response.left[i], expected.left[i]));
                ASSERT_NO_FATAL_FAILURE(compare(response.right[i], expected.right[i]));
            }
            for (const ResponsePiece& each : current) {
                if (each.kind == ResponsePiece::Kind::Filtered) {
                    ASSERT_EQ(filters[each.filterClass].z1, 0.0) << "at rest afterwards";
                    ASSERT_EQ(filters[each.filterClass].z2, 0.0);
                }
            }
        }
    }

    std::mt19937 random{21};
    std::array<std::vector<float>, 4> hrirs;
    std::array<Biquad, 2> filters{Biquad(Biquad::lowPass, 0.0, 0.1),
                                  Biquad(Biquad::lowPass, 0.0, 0.1)};
    std::array<Biquad, 2> plainFilters = filters;
    std::vector<ResponsePiece> current;
    float cutOff = 1000.0f;
    PieceWriter writer = (forceKernels(availableKernels().tables[GetParam()]), PieceWriter());
};

TEST_P(PieceWriterOfEveryTable, GainsThatDoNotRoundLeaveEveryBitAsItIs) {
    writeLists([this] { return std::ldexp(whole(0, 1) == 0 ? 1.0f : -1.0f, whole(-6, 3)); },
               [](float got, float expected) { ASSERT_EQ(got, expected); });
}

TEST_P(PieceWriterOfEveryTable, OtherGainsRoundBehindTheFilterInsteadOfBeforeIt) {
    // Of a piece at most 4 high, three roundings of 2^-24 each way.
    writeLists([this] { return uniform(-1.0f, 1.0f); },
               [](float got, float expected) { ASSERT_NEAR(got, expected, 1e-6); });
}

TEST_P(PieceWriterOfEveryTable, GainsThatAreNoNumbersSpoilOnlyTheirPiece) {
    constexpr float infinity = std::numeric_limits<float>::infinity();
    for (const float gain : {infinity, -infinity, std::numeric_limits<float>::quiet_NaN()}) {
        for (const float next : {0.5f, 0.0f, 1e-42f}) {
            current.assign(1, ResponsePiece());
            current[0].kind = ResponsePiece::Kind::Filtered;
            current[0].hrir = hrirs[0].data();
            current[0].frames = longest;
            current[0].cutOff = 3000.0f;
            current[0].gain = gain;
            PieceList pieces;
            pieces.add(current[0]);
            Response spoilt;
            writer.write(spoilt.ears(), pieces, sampleRate, filters);
            for (std::size_t i = 0; i < longest; ++i) {
                ASSERT_FALSE(std::isfinite(spoilt.left[i]));
                ASSERT_FALSE(std::isfinite(spoilt.right[i]));
            }
            EXPECT_EQ(spoilt.left[longest], 0.0f);

            pieces.clear();
            current[0].gain = next;
            pieces.add(current[0]);
            Response expected;
            Response response;
            writePlainly(expected.ears(), pieces, plainFilters);
            writer.write(response.ears(), pieces, sampleRate, filters);
            for (std::size_t i = 0; i < longest; ++i) {
                ASSERT_NEAR(response.left[i], expected.left[i], 1e-6) << "nothing stays of it";
                ASSERT_NEAR(response.right[i], expected.right[i], 1e-6);
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Tables,
                         PieceWriterOfEveryTable,
                         testing::Range<std::size_t>(0, availableKernels().count),
                         [](const testing::TestParamInfo<std::size_t>& tested) {
                             return availableKernels().tables[tested.param]->name;
                         });

}  // namespace
}  // namespace tessaly::test
