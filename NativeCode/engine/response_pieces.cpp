// Direct sound and reflections into the two ears.
#include "engine/response_pieces.h"

#include <algorithm>

#include "base/precision.h"

namespace tessaly {

namespace {

constexpr int hrirLeftIndex = 1;   // the left ear takes the second value of a stored pair
constexpr int hrirRightIndex = 0;  // the right ear the first

constexpr EndFade reflectionFade{15, 0.06666667f};

EarPairs pairsOf(const ResponsePiece& piece) noexcept {
    return {piece.hrir + hrirLeftIndex, piece.hrir + hrirRightIndex, piece.frames};
}

/// Written, not added. Both gains are applied one after the other.
void writeDirect(const EarBuffers& ears, const ResponsePiece& piece) noexcept {
    const EarPairs pairs = pairsOf(piece);
    const FrameRange range = framesInside(piece.position, pairs.frames, ears.size);
    for (int i = range.begin; i < range.end; ++i) {
        ears.left[piece.position + i] = pairs.leftAt(i) * piece.gain * piece.secondGain;
        ears.right[piece.position + i] = pairs.rightAt(i) * piece.gain * piece.secondGain;
    }
}

/// Products and sum in double, rounded once at the store.
void addFixed(const EarBuffers& ears, const ResponsePiece& piece) noexcept {
    const EarPairs pairs = pairsOf(piece);
    const FrameRange range = framesInside(piece.position, pairs.frames, ears.size);
    for (int i = range.begin; i < range.end; ++i) {
        float& left = ears.left[piece.position + i];
        float& right = ears.right[piece.position + i];
        left = single(wide(left) + wide(pairs.leftAt(i)) * piece.fixedGain * wide(piece.gain));
        right = single(wide(right) + wide(pairs.rightAt(i)) * piece.fixedGain * wide(piece.gain));
    }
}

}  // namespace

int PieceList::extent() const noexcept {
    int extent = 0;
    for (const ResponsePiece& piece : *this) {
        extent = std::max(extent, piece.position + piece.frames);
    }
    return extent;
}

bool PieceList::operator==(const PieceList& other) const noexcept {
    return count_ == other.count_ && std::equal(begin(), end(), other.begin());
}

FrameRange PieceList::differencesTo(const PieceList& other) const noexcept {
    FrameRange range{0, 0};
    const auto include = [&range](const ResponsePiece& piece) noexcept {
        const int end = piece.position + piece.frames;
        if (range.begin >= range.end) {
            range = {piece.position, end};
        } else {
            range = {std::min(range.begin, piece.position), std::max(range.end, end)};
        }
    };
    for (int k = 0; k < std::max(count_, other.count_); ++k) {
        const auto at = static_cast<std::size_t>(k);
        if (k < count_ && k < other.count_ && pieces_[at] == other.pieces_[at]) {
            continue;
        }
        if (k < count_) {
            include(pieces_[at]);
        }
        if (k < other.count_) {
            include(other.pieces_[at]);
        }
    }
    return range;
}

void PieceWriter::prepare(int hrirLength) {
    framesKept_ = std::max(hrirLength, 0);
    samples_ = AlignedArray<float>(std::size_t{2} * PieceList::capacity *
                                   static_cast<std::size_t>(framesKept_));
    forget();
}

void PieceWriter::forget() noexcept {
    for (Kept& kept : kept_) {
        kept.valid = false;
    }
}

void PieceWriter::write(const EarBuffers& ears,
                        const PieceList& pieces,
                        int sampleRate,
                        std::array<Biquad, 2>& filters) noexcept {
    std::size_t slot = 0;
    for (const ResponsePiece& piece : pieces) {
        switch (piece.kind) {
            case ResponsePiece::Kind::Direct:
                writeDirect(ears, piece);
                break;
            case ResponsePiece::Kind::Fixed:
                addFixed(ears, piece);
                break;
            case ResponsePiece::Kind::Plain:
                addPairs(ears, piece.position, pairsOf(piece), piece.gain);
                break;
            case ResponsePiece::Kind::Filtered:
                addFiltered(ears, piece, slot, sampleRate, filters[piece.filterClass == 0 ? 0 : 1]);
                break;
        }
        ++slot;
    }
}

/// The place of a piece does not touch what the filter makes of it, so a reflection whose delay
/// alone follows the source is not filtered again.
void PieceWriter::addFiltered(const EarBuffers& ears,
                              const ResponsePiece& piece,
                              std::size_t slot,
                              int sampleRate,
                              Biquad& filter) noexcept {
    filter.follow(Biquad::normalise(piece.cutOff, sampleRate));
    if (piece.frames > framesKept_) {
        addFilteredPairs(ears, piece.position, pairsOf(piece), piece.gain, filter, reflectionFade);
        return;
    }
    const auto stride = static_cast<std::size_t>(framesKept_);
    float* const left = samples_.data() + 2 * slot * stride;
    float* const right = left + stride;
    Kept& kept = kept_[slot];
    ResponsePiece wanted = piece;
    wanted.position = 0;
    if (!kept.valid || !(kept.piece == wanted)) {
        std::fill_n(left, piece.frames, 0.0f);
        std::fill_n(right, piece.frames, 0.0f);
        addFilteredPairs({left, right, piece.frames}, 0, pairsOf(piece), piece.gain, filter,
                         reflectionFade);
        kept.piece = wanted;
        kept.valid = true;
    }
    const FrameRange range = framesInside(piece.position, piece.frames, ears.size);
    for (int i = range.begin; i < range.end; ++i) {
        ears.left[piece.position + i] += left[i];
        ears.right[piece.position + i] += right[i];
    }
}

}  // namespace tessaly
