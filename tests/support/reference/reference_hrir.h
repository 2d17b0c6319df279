// HRIR tables of the reference: the order of the packed set, its file, and the direction grid.
#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace tessaly::reference {

inline constexpr int hrirCount = 2522;
inline constexpr int azimuthRows = 73;       ///< -180 to 180 degrees by 5
inline constexpr int elevationColumns = 37;  ///< -90 to 90 degrees by 5
inline constexpr int noHrir = -1;            ///< a cell that no direction was mapped to

/// Number of the HRIR of a grid direction in the packed order; degrees, multiples of 5, engine
/// sign. All azimuths of a pole are one, and so are -180 and 180.
int hrirNumber(int phi, int theta);

/// What a load of the packed set gave.
struct HrirFile {
    int error = 1;                ///< 1 good, else the code that the load leaves behind
    std::vector<double> samples;  ///< 2 values a frame, right ear first; what was not read is 0
};

/// Gives `frames` stereo frames of the packed set of a rate.
using HrirSource = std::function<HrirFile(int sampleRate, int frames)>;

/// Reads "/TSLdata120.dat", 121, 122 (44100, 48000, 24000 Hz) of a directory, with the reference's
/// own reader: channels at byte 22, rate at 24, bits at 34, "d" from 36 on, 32-bit samples of a
/// 48000 Hz file with their sign turned.
HrirSource packedFilesIn(const std::string& directory);

/// A set made by a function of HRIR number, frame and ear (0 right, 1 left), stored at one
/// length: `taps` frames an HRIR, 0 for as many as the engine asks for.
HrirSource setOf(const std::function<double(int k, int frame, int ear)>& sample, int taps = 0);

/// The tables shared by all engines of a process.
struct HrirTables {
    std::vector<double> stream;  ///< the whole set, empty before the first load
    int stride = 0;              ///< frames an HRIR in `stream`
    /// HRIR number or noHrir, at row * 37 + column.
    std::array<int, azimuthRows* elevationColumns> cells = [] {
        std::array<int, azimuthRows * elevationColumns> none{};
        none.fill(noHrir);
        return none;
    }();
    bool bypassMode = false;  ///< the 3D bypass with which the cells were filled

    /// The HRIR mapped to a pair of indices, by plain table arithmetic; noHrir outside the table.
    int at(int indexPhi, int indexTheta) const;
    /// One value of an HRIR. A reader that takes more frames than the set's stride runs on into
    /// the next HRIR, and behind the last one reads 0; an unmapped cell gives 0 everywhere.
    /// @param ear  0 right, 1 left
    double sample(int hrir, int frame, int ear) const;
};

}  // namespace tessaly::reference
