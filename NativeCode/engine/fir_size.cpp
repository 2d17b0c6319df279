// The length of the composed response and everything that follows from it.
#include "engine/fir_size.h"

#include <cmath>
#include <limits>

#include "base/log.h"
#include "engine/room_presets.h"

namespace tessaly {

namespace {

/// The one room whose row asks for no power of two: its response takes the next one.
constexpr int oddRoom = 7;
constexpr int oddRoomFirSize = 8192;

}  // namespace

int earlyFlexFirSizeOf(int preset) noexcept {
    RoomPreset room;
    lookUpRoomPreset(preset, room);
    return preset == oddRoom ? oddRoomFirSize : room.earlyFlexFirSize;
}

void deriveFirSizes(FirSizes& sizes,
                    int defaultFirSize,
                    std::int16_t qvReverb,
                    int reverbLength,
                    std::int16_t& earlyFlexRefPreset) {
    const int blocklenght = sizes.blocklenght;
    sizes.fftLength = 2 * blocklenght;
    sizes.FIR_size = defaultFirSize;

    if (qvReverb > 1) {
        int tempFDLcount = reverbLength / blocklenght;
        const float tempFDLrest =
            std::fmod(static_cast<float>(reverbLength), static_cast<float>(blocklenght));
        logOutput("tempFDLcount = ", tempFDLcount, " + tempFDLrest = ", tempFDLrest);
        if (tempFDLrest > 0.0f) {
            ++tempFDLcount;
            logOutput("tempFDLrest is higher than 0 => ", tempFDLrest, " so inc tempFDLcout to ",
                      tempFDLcount);
        }
        sizes.FIR_size = blocklenght * tempFDLcount;
        logOutput("FIR_size = ", sizes.FIR_size);
    }
    if (earlyFlexRefPreset > 0 && qvReverb < 1) {
        sizes.earlyFlexFirSize = earlyFlexFirSizeOf(earlyFlexRefPreset);
        if (sizes.earlyFlexFirSize == 0) {
            logOutput("ERROR: earlyFlexRefPreset to high with ", earlyFlexRefPreset);
            earlyFlexRefPreset = 0;
        }
        sizes.FIR_size = sizes.earlyFlexFirSize;
    }
    if (earlyFlexRefPreset <= 0 && qvReverb < 1) {
        sizes.FIR_size = blocklenght;
    }

    if (sizes.FIR_size > blocklenght) {
        // The partition count is a 16-bit field. Blocks of 2 or 4 frames under a long tail would
        // leave its range: the response then ends where the partitions do.
        constexpr int mostPartitions = std::numeric_limits<std::int16_t>::max();
        const int partitions = sizes.FIR_size / blocklenght;
        sizes.fdlCount =
            static_cast<std::int16_t>(partitions < mostPartitions ? partitions : mostPartitions);
    } else {
        sizes.FIR_size = blocklenght;
        sizes.fdlCount = 1;
    }
    sizes.firBufferSize = sizes.FIR_size + blocklenght;
}

}  // namespace tessaly
