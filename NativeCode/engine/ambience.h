// The ambience bed: a stereo loop under the first engine's output.
#pragma once

#include <string>

#include "base/aligned_array.h"
#include "base/audio_thread.h"

namespace tessaly {

inline constexpr int ATMO_LENGTH = 1064960;  ///< frames of the loop

class Ambience {
public:
    /// The loop's length in blocks, for `block`.
    void setBlockLength(int blocklenght) noexcept;

    /// Loads the loop of a selection, 1 to 3; any other loads nothing. Load time.
    void load(int atmoSelect, const std::string& bundleBasePath);

    /// Reads one loop into `atmoBuffer`. Load time: reads a file, allocates. The directory is put
    /// in front of the name here and by the reader once more, so a loop is found only when
    /// `bundleBasePath` is empty.
    void loadSourceWav(const std::string& name, const std::string& bundleBasePath);

    /// The bed under a block: pairs of a block's length; null if no loop was loaded. Block time.
    const float* block(unsigned int blockNumber) const noexcept TESSALY_NONBLOCKING;

    AlignedArray<float> atmoBuffer;  ///< `ATMO_LENGTH` pairs
    int ATMO_BLOCKS = 0;

private:
    int blocklenght_ = 0;
};

}  // namespace tessaly
