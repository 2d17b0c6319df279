// The ambience bed: a stereo loop under the first engine's output.
#include "engine/ambience.h"

#include "base/log.h"
#include "resources/wav_reader.h"

namespace tessaly {

void Ambience::setBlockLength(int blocklenght) noexcept {
    blocklenght_ = blocklenght;
    ATMO_BLOCKS = ATMO_LENGTH / blocklenght;
}

void Ambience::load(int atmoSelect, const std::string& bundleBasePath) {
    switch (atmoSelect) {
        case 1:
            loadSourceWav("/AtmoHerrmansplatzShort", bundleBasePath);
            break;
        case 2:
            loadSourceWav("/Atmo_Wald_Long4dB", bundleBasePath);
            break;
        case 3:
            loadSourceWav("/SFX39", bundleBasePath);
            break;
        default:
            break;
    }
}

void Ambience::loadSourceWav(const std::string& name, const std::string& bundleBasePath) {
    logOutput("Load Source Wav!...");
    atmoBuffer = AlignedArray<float>(std::size_t{2} * ATMO_LENGTH);
    WavSource source;
    source.bundleBasePath = bundleBasePath;
    readWav(source, bundleBasePath + name, atmoBuffer.data(), ATMO_LENGTH, 2);
}

const float* Ambience::block(unsigned int blockNumber) const noexcept {
    if (atmoBuffer.empty() || ATMO_BLOCKS < 1) {
        return nullptr;
    }
    const auto position =
        static_cast<std::size_t>(blockNumber % static_cast<unsigned int>(ATMO_BLOCKS)) *
        static_cast<std::size_t>(blocklenght_);
    return atmoBuffer.data() + 2 * position;
}

}  // namespace tessaly
