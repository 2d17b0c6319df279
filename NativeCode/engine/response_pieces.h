// What the early part of a response is made of: direct sound and reflections, as a list.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>

#include "base/aligned_array.h"
#include "base/audio_thread.h"
#include "convolution/fir_notes.h"
#include "convolution/simd/kernels.h"
#include "engine/ear_mix.h"
#include "engine/reflections.h"

namespace tessaly {

/// One HRIR at its place with its gains. Equal pieces make equal samples as long as the HRIR tables
/// keep theirs; a gain that is no number equals nothing.
struct ResponsePiece {
    enum class Kind : std::uint8_t {
        Direct,    ///< gain and secondGain one after the other; written, not added
        Fixed,     ///< fixedGain and gain in double, rounded once
        Plain,     ///< gain
        Filtered,  ///< gain, low-passed, faded at its end
    };

    Kind kind = Kind::Plain;
    std::uint8_t filterClass = 0;  ///< of a filtered piece, 0 or 1
    const float* hrir = nullptr;   ///< frames of (right, left) floats
    int position = 0;              ///< first frame in the response; may lie outside of it
    int frames = 0;
    float gain = 0.0f;
    float secondGain = 1.0f;
    double fixedGain = 0.0;
    float cutOff = 0.0f;  ///< Hz, of a filtered piece

    bool operator==(const ResponsePiece&) const = default;
};

/// The direct sound first, then the reflections in the order in which they are added.
class PieceList {
public:
    static constexpr int capacity = 1 + 2 + Reflections::capacity;

    PieceList() = default;
    PieceList(const PieceList&) = default;
    ~PieceList() = default;
    /// Copies the pieces that are there and not the whole array.
    PieceList& operator=(const PieceList& other) noexcept {
        if (this != &other) {
            std::copy(other.begin(), other.end(), pieces_.begin());
            count_ = other.count_;
        }
        return *this;
    }

    void clear() noexcept { count_ = 0; }
    /// Pieces beyond the capacity, which no engine has, are dropped.
    void add(const ResponsePiece& piece) noexcept {
        if (count_ < capacity) {
            pieces_[static_cast<std::size_t>(count_++)] = piece;
        }
    }
    const ResponsePiece* begin() const noexcept { return pieces_.data(); }
    const ResponsePiece* end() const noexcept { return pieces_.data() + count_; }
    int size() const noexcept { return count_; }
    /// First frame behind all pieces, 0 without any.
    int extent() const noexcept;
    bool operator==(const PieceList& other) const noexcept;
    /// Frames that any piece touches, in place of what the list held; some may lie outside of the
    /// response.
    void listFrames(FirStretches& frames) const noexcept;
    /// Frames that any piece touches that the other list has not in the same place.
    FirStretches differencesTo(const PieceList& other) const noexcept;

private:
    std::array<ResponsePiece, capacity> pieces_{};
    int count_ = 0;
};

/// Writes pieces into a response; what a filter made of an HRIR is kept until one of both changes.
class PieceWriter {
public:
    /// Memory for filtered pieces of up to `hrirLength` frames. Load time: allocates.
    void prepare(int hrirLength);
    /// The samples of the HRIRs may have changed. Block time.
    void forget() noexcept;

    /// Block time.
    /// @param ears         cleared over the extent of the list
    /// @param sampleRate   Hz
    void write(const EarBuffers& ears,
               const PieceList& pieces,
               int sampleRate,
               std::array<Biquad, 2>& filters) noexcept TESSALY_NONBLOCKING;
    /// Filters what is not kept as it is wanted. Block time.
    void refresh(const PieceList& pieces,
                 int sampleRate,
                 std::array<Biquad, 2>& filters) noexcept TESSALY_NONBLOCKING;
    /// Of refreshed pieces what falls into some frames of the response. Block time.
    /// @param ears   those frames, cleared
    /// @param first  the first of them
    void writeFrames(const EarBuffers& ears,
                     int first,
                     const PieceList& pieces,
                     int sampleRate,
                     std::array<Biquad, 2>& filters) noexcept TESSALY_NONBLOCKING;

private:
    /// What decides the samples that are kept; no HRIR: none are.
    struct Kept {
        const float* hrir = nullptr;
        int frames = 0;
        float cutOff = 0.0f;
        std::uint8_t filterClass = 0;

        bool operator==(const Kept&) const = default;
    };

    bool isKept(const ResponsePiece& piece) const noexcept { return piece.frames <= framesKept_; }
    float* keptPairs(std::size_t slot) noexcept {
        return samples_.data() + 2 * slot * static_cast<std::size_t>(framesKept_);
    }
    static Biquad& filterOf(const ResponsePiece& piece, std::array<Biquad, 2>& filters) noexcept;

    const SignalKernels* kernels_ = selectKernels().signal;
    std::array<Kept, PieceList::capacity> kept_{};
    AlignedArray<float> samples_;  ///< per slot the filtered pairs, faded, without a gain
    int framesKept_ = 0;
};

}  // namespace tessaly
