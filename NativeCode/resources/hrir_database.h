// Loads the HRIR set and maps directions onto it.
#pragma once

#include <cstdint>
#include <sstream>
#include <string>

#include "resources/hrir_tables.h"

namespace tessaly {

/// What the database needs of the engine that loads it. Fixed after the engine's settings step.
struct HrirDatabaseSettings {
    std::string bundleBasePath;         ///< data directory, no trailing slash
    int sampleRate = 0;                 ///< 24000, 44100 or 48000 Hz
    std::int16_t hrirLength = 0;        ///< frames per HRIR
    bool qvTrackDirection = true;       ///< off: one fixed HRIR, `staticFilter`
    bool qvUse256HRIR = false;          ///< names the 256-tap files in per-file mode
    bool useElevation = true;           ///< per-file mode: load all elevations
    bool bypass3DAudio = false;         ///< pan pairs instead of HRIRs
    bool thetaLimited = false;          ///< `limitTheta` is not 90
    std::int16_t limitPhi = 180;        ///< degrees either side
    std::int16_t limitTheta = 90;       ///< degrees either side
    std::int16_t phiSteps = 72;         ///< 2 * `limitPhi` / 5
    std::int16_t thetaSteps = 36;       ///< 2 * `limitTheta` / 5, or 0 without elevation
    std::int16_t thetaCentreIndex = 0;  ///< 18 without elevation
    float panGain = 1.65f;              ///< gain of the pan pair
};

/// The engine's direction fields that a load reads and writes. They double as the request:
/// the wanted direction stands in `phi` and `theta`.
struct HrirRequest {
    std::int16_t& phi;         ///< degrees, engine sign; left at the last direction asked for
    std::int16_t& theta;       ///< degrees
    std::int16_t& phiNew;      ///< written when a static filter is loaded
    std::int16_t& indexPhi;    ///< written by per-file loading without elevation
    std::int16_t& indexTheta;  ///< written by per-file loading without elevation
    std::int16_t phiIn;        ///< the host's azimuth at this moment
    std::int16_t thetaIn;      ///< the host's elevation at this moment
};

/// One engine's access to the shared set: how far its mapping has come, and its file names.
class HrirDatabase {
public:
    explicit HrirDatabase(HrirDatabaseSettings settings);

    /// Loads the packed set of this sample rate and maps it. Load time: reads a file, allocates.
    /// Runs if `instanceNumber` is 0 or the bypass differs from the tables'; else shares them.
    /// A file that is there but cannot be read sets `essError` and leaves the set silent; the load
    /// goes on.
    /// @return false if construction has to stop: `essError` is -103 (no file), -104 (no HRIR) or
    ///         -102 (a rate that no file name goes with)
    bool load(int instanceNumber, HrirRequest request);

    /// Fills `filterTable`. Load time. On failure `essError` is -104. In packed mode the cells are
    /// filled in file order, so only the full grid gets the right HRIRs; narrow limits leave the
    /// other cells null.
    void LoadDataBase(HrirRequest request);

    /// Makes `slot` hold the HRIR of the wanted direction. Load time.
    /// A cell that is filled already stays as it is, unless reflections load or the 3D bypass is or
    /// was on. In packed mode the next HRIR of the file is taken, whatever the direction.
    /// @param slot  a `filterTable` cell or another cell of the same type
    /// @return true if `slot` now holds an entry; false if there is no file, no further HRIR or no
    ///         room for one, with `slot` unchanged
    bool loadFilterFile(HrirSlot& slot, HrirRequest request);

    /// True: HRIRs come from the packed set in file order; false: one file a direction.
    bool usePackedDatabase = true;
    /// On while reflections load: filled cells are not protected then.
    bool mappingReflections = false;
    /// Next HRIR of the packed set to be mapped.
    int fileCount = 0;
    /// `hrirLength` * hrirCount, set by `load`.
    int databaseFrames = 0;
    /// The last per-file load found its file.
    bool filterFound = true;
    /// The one HRIR of an engine that does not track directions; null: silence.
    HrirSlot staticFilter = nullptr;

    std::string databaseFileName;  ///< "/TSLdata12" + rate digit + ".dat"
    std::string filterFileName;    ///< per-file mode, without extension
    std::string fileNameHead;
    std::string fileNameTail;
    int fileAzimuth = 0;    ///< azimuth in a per-file name, 0..355, positive to the right
    int fileElevation = 0;  ///< elevation in a per-file name, 0..180

private:
    void mapPacked(HrirRequest request);
    void mapLevel(HrirRequest request);
    void mapElevations(HrirRequest request);
    bool loadCell(int indexPhi, int indexTheta, HrirRequest request);
    HrirSlot nextPackedEntry() const;
    bool loadOwnFile(HrirSlot& slot, HrirRequest request);

    HrirDatabaseSettings settings_;
    std::ostringstream azimuthText_;
    std::ostringstream elevationText_;
};

}  // namespace tessaly
