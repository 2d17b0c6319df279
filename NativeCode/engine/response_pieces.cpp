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
void writeDirect(const SignalKernels& kernels,
                 const EarBuffers& ears,
                 const ResponsePiece& piece) noexcept {
    const FrameRange range = framesInside(piece.position, piece.frames, ears.size);
    if (range.begin < range.end) {
        const int start = piece.position + range.begin;
        kernels.writePairs(static_cast<std::size_t>(range.end - range.begin),
                           piece.hrir + std::ptrdiff_t{2} * range.begin, piece.gain,
                           piece.secondGain, ears.right + start, ears.left + start);
    }
}

/// @param pairs  in the order of an HRIR
void addGained(const SignalKernels& kernels,
               const EarBuffers& ears,
               const ResponsePiece& piece,
               const float* pairs) noexcept {
    const FrameRange range = framesInside(piece.position, piece.frames, ears.size);
    if (range.begin < range.end) {
        const int start = piece.position + range.begin;
        kernels.addPairs(static_cast<std::size_t>(range.end - range.begin),
                         pairs + std::ptrdiff_t{2} * range.begin, piece.gain, ears.right + start,
                         ears.left + start);
    }
}

/// Both ears' last frames.
void fadeEnd(float* pairs, int frames) noexcept {
    for (int i = std::max(frames - reflectionFade.frames, 0); i < frames; ++i) {
        const float weight = reflectionFade.weightAt(i, frames);
        pairs[std::ptrdiff_t{2} * i] *= weight;
        pairs[std::ptrdiff_t{2} * i + 1] *= weight;
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

void PieceList::listFrames(FirStretches& frames) const noexcept {
    frames.clear();
    for (const ResponsePiece& piece : *this) {
        frames.include(piece.position, piece.position + piece.frames);
    }
}

bool PieceList::operator==(const PieceList& other) const noexcept {
    return count_ == other.count_ && std::equal(begin(), end(), other.begin());
}

FirStretches PieceList::differencesTo(const PieceList& other) const noexcept {
    FirStretches differences;
    const auto include = [&differences](const ResponsePiece& piece) noexcept {
        differences.include(piece.position, piece.position + piece.frames);
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
    return differences;
}

void PieceWriter::prepare(int hrirLength) {
    framesKept_ = std::max(hrirLength, 0);
    samples_ = AlignedArray<float>(std::size_t{2} * PieceList::capacity *
                                   static_cast<std::size_t>(framesKept_));
    forget();
}

void PieceWriter::forget() noexcept { kept_.fill({}); }

void PieceWriter::write(const EarBuffers& ears,
                        const PieceList& pieces,
                        int sampleRate,
                        std::array<Biquad, 2>& filters) noexcept {
    refresh(pieces, sampleRate, filters);
    writeFrames(ears, 0, pieces, sampleRate, filters);
}

void PieceWriter::writeFrames(const EarBuffers& ears,
                              int first,
                              const PieceList& pieces,
                              int sampleRate,
                              std::array<Biquad, 2>& filters) noexcept {
    std::size_t slot = 0;
    for (const ResponsePiece& whole : pieces) {
        const FrameRange inside = framesInside(whole.position - first, whole.frames, ears.size);
        if (inside.begin >= inside.end) {
            ++slot;
            continue;
        }
        ResponsePiece piece = whole;
        piece.position -= first;
        switch (piece.kind) {
            case ResponsePiece::Kind::Direct:
                writeDirect(*kernels_, ears, piece);
                break;
            case ResponsePiece::Kind::Fixed:
                addFixed(ears, piece);
                break;
            case ResponsePiece::Kind::Plain:
                addGained(*kernels_, ears, piece, piece.hrir);
                break;
            case ResponsePiece::Kind::Filtered:
                if (isKept(piece)) {
                    addGained(*kernels_, ears, piece, keptPairs(slot));
                } else {
                    Biquad& filter = filterOf(piece, filters);
                    filter.follow(Biquad::normalise(piece.cutOff, sampleRate));
                    addFilteredPairs(ears, piece.position, pairsOf(piece), piece.gain, filter,
                                     reflectionFade);
                }
                break;
        }
        ++slot;
    }
}

Biquad& PieceWriter::filterOf(const ResponsePiece& piece, std::array<Biquad, 2>& filters) noexcept {
    return filters[piece.filterClass == 0 ? 0 : 1];
}

/// Filters the pieces that are not kept as they are wanted, side by side as far as they are equally
/// long. Neither the place of a piece nor its gain touches what is kept of it, so a reflection
/// whose delay and level alone follow the source is not filtered again.
void PieceWriter::refresh(const PieceList& pieces,
                          int sampleRate,
                          std::array<Biquad, 2>& filters) noexcept {
    std::array<PairFilter, PieceList::capacity> due{};
    std::size_t count = 0;
    int frames = 0;
    const auto run = [&]() noexcept {
        kernels_->filterPairs(static_cast<std::size_t>(frames), count, due.data());
        for (std::size_t k = 0; k < count; ++k) {
            fadeEnd(due[k].output, frames);
        }
        count = 0;
    };
    std::size_t slot = 0;
    for (const ResponsePiece& piece : pieces) {
        if (piece.kind == ResponsePiece::Kind::Filtered && isKept(piece)) {
            Biquad& filter = filterOf(piece, filters);
            filter.follow(Biquad::normalise(piece.cutOff, sampleRate));
            filter.clear();
            const Kept wanted{piece.hrir, piece.frames, piece.cutOff, piece.filterClass};
            if (!(kept_[slot] == wanted)) {
                kept_[slot] = wanted;
                if (piece.frames != frames) {
                    run();
                    frames = piece.frames;
                }
                due[count] = {piece.hrir,
                              keptPairs(slot),
                              {filter.b0, filter.b1, filter.b2, filter.a1, filter.a2}};
                ++count;
            }
        }
        ++slot;
    }
    run();
}

}  // namespace tessaly
