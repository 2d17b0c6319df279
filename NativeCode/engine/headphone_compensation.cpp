// Headphone compensation: which filter, and loading it.
#include "engine/headphone_compensation.h"

#include <algorithm>
#include <array>
#include <cstddef>

#include "base/log.h"
#include "engine/shared_state.h"
#include "resources/wav_reader.h"

namespace tessaly {

namespace {

constexpr int filterLength = 256;  // frames of every headphone file

struct HeadphoneFilter {
    const char* logLine;
    const char* fileName;
};

// Named variants of one model share a log line. Names are complete: no extension is added.
// clang-format off
constexpr std::array<HeadphoneFilter, 10> filters = {{
    /*  1 */ {"iPhone-Standart-Headphones selected...", "/IPALLI_16"},
    /*  2 */ {"iPhone-InEar-Headphones selected...", "/IINALLIH"},
    /*  3 */ {"Beyerdynamic DT770 Headphones selected...", "/770ALIF3_CUB_Mono.wav"},
    /*  4 */ {"Sennheiser HD25 Headphones selected...", "/25AINBS_16bit"},
    /*  5 */ {"Sennheiser HD600 Headphones selected...", "/FFIH03GL"},
    /*  6 */ {"Inverse of the frontal HRIR selected...", "/ITA-Kunstkopf_HRIR_Mess01_D180_5x5_256_A000_B090"},
    /*  7 */ {"Bose qc15", "/I15I12_32.wav"},
    /*  8 */ {"Bose qc20", "/20H114_32.wav"},
    /*  9 */ {"Bose qc20_ID", "/I20H111_32.wav"},
    /* 10 */ {"Bose qc20_ID", "/20H1103_32.wav"},
}};
// clang-format on

constexpr const char* smallFilter = "/IP23M3_512_FadeOut";

void readFilter(const char* fileName, const std::string& bundleBasePath) {
    WavSource source;
    source.bundleBasePath = bundleBasePath;
    readWav(source, fileName, hpTFfilter, filterLength, 1);
}

}  // namespace

const char* headphoneFileName(int selection) noexcept {
    const bool known = selection >= 1 && selection <= static_cast<int>(filters.size());
    return known ? filters[static_cast<std::size_t>(selection - 1)].fileName : nullptr;
}

void loadHpTF(int FIR_size, int blocklenght, const std::string& bundleBasePath) {
    const int fftLength = 2 * blocklenght;
    if (FIR_size < filterLength) {
        logOutput("Buffersize < HpTP_FIR-Filter-Length!!!");
        // Twice the file's length, so that the move below reads zeros behind it.
        allocateHpTFfilter(std::max(fftLength, 2 * filterLength));
        readFilter(smallFilter, bundleBasePath);
        const float* from = hpTFfilter + (filterLength - blocklenght);
        std::copy(from, from + filterLength, hpTFfilter);
        return;
    }

    logOutput("Load HpTF-Filter!");
    allocateHpTFfilter(std::max(fftLength, filterLength));
    logOutput("qvHpTFcompSelect = ", qvHpTFcompSelect);
    if (qvHpTFcompSelect < 1) {
        logOutput("qvHpTF activ, but no Filter selected!!!");
    } else if (qvHpTFcompSelect > static_cast<int>(filters.size())) {
        logOutput("qvHpTF activ, but no Filter selected!!! qvHpTFcompSelect too high!");
    } else {
        const HeadphoneFilter& filter = filters[static_cast<std::size_t>(qvHpTFcompSelect - 1)];
        logOutput(filter.logLine);
        readFilter(filter.fileName, bundleBasePath);
    }
}

void watchHeadphoneSelection(std::int16_t selection,
                             int FIR_size,
                             int blocklenght,
                             const std::string& bundleBasePath) {
    const bool differs = selection != qvHpTFcompSelect;
    qvHpTFcompSelect = selection;
    if (!differs && engineCount != 0) {
        return;
    }
    if (selection < 1) {
        hpTFactive = false;
        return;
    }
    hpTFactive = true;
    loadHpTF(FIR_size, blocklenght, bundleBasePath);
}

}  // namespace tessaly
