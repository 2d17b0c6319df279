// Loads the HRIR set and maps directions onto it.
#include "resources/hrir_database.h"

#include <fstream>
#include <utility>

#include "base/ess_error.h"
#include "base/log.h"
#include "base/numeric_conversion.h"
#include "resources/hrir_search.h"
#include "resources/pan_pair.h"
#include "resources/wav_reader.h"

namespace tessaly {

namespace {

constexpr std::int16_t hrirChannels = 2;
constexpr int southPole = 0;                   // elevation index
constexpr int northPole = gridThetaCount - 1;  // elevation index

bool fileExists(const std::string& path) { return std::ifstream(path).is_open(); }

/// Empty at a rate that has no file.
std::string packedFileName(int sampleRate) {
    switch (sampleRate) {
        case 44100:
            return "/TSLdata120.dat";
        case 48000:
            return "/TSLdata121.dat";
        case 24000:
            return "/TSLdata122.dat";
        default:
            return {};
    }
}

/// What the name of a direction's own file ends in, before the extension.
const char* ownFileSuffix(int sampleRate) {
    switch (sampleRate) {
        case 24000:
            return "_001";
        case 48000:
            return "_48000";
        default:
            return "";
    }
}

/// Three digits for the numbers that occur in file names.
std::string takePaddedText(std::ostringstream& text, int number) {
    text << (number < 10 ? "00" : (number < 100 ? "0" : "")) << number;
    std::string padded = text.str();
    text.str({});
    return padded;
}

void copyCell(int fromPhi, int toPhi, int indexTheta) {
    const HrirSlot* from = filterTableCell(fromPhi, indexTheta);
    HrirSlot* to = filterTableCell(toPhi, indexTheta);
    if (to != nullptr) {
        *to = from != nullptr ? *from : nullptr;
    }
}

}  // namespace

HrirDatabase::HrirDatabase(HrirDatabaseSettings settings) : settings_(std::move(settings)) {}

bool HrirDatabase::load(int instanceNumber, HrirRequest request) {
    if (instanceNumber != 0 && (databaseBypassMode != 0) == settings_.bypass3DAudio) {
        logOutput("Database already loaded!");
        return true;
    }
    usePackedDatabase = true;
    fileCount = 0;
    databaseFileName = packedFileName(settings_.sampleRate);
    if (databaseFileName.empty()) {
        essError = essErrorSampleRate;
        return false;
    }
    databaseFrames = settings_.hrirLength * hrirCount;
    if (HRTFStream != nullptr) {
        logOutput("Deleted HRTFSTream!");
    }
    // Other engines may still have to write responses that they listed with the former HRIRs.
    replaceHrirStream(settings_.hrirLength, instanceNumber != 0);

    const std::string path = settings_.bundleBasePath + databaseFileName;
    if (!fileExists(path)) {
        logOutput("Tessaly_e ERROR: database-file ", path, " not available!!! Exit...");
        logOutput("Tessaly_e ERROR: file not found ", path);
        essError = essErrorDatabaseMissing;
        return false;
    }
    WavSource source;
    source.bundleBasePath = settings_.bundleBasePath;
    source.sampleRate = settings_.sampleRate;
    // An unreadable set stays silent; its code in `essError` is for the handler.
    readWav(source, databaseFileName, HRTFStream, databaseFrames, hrirChannels);
    ++hrirTablesVersion;

    mappingReflections = false;
    if (settings_.qvTrackDirection) {
        LoadDataBase(request);
        if (essError == essErrorHrirMissing) {
            return false;
        }
    } else {
        request.phi = request.phiIn;
        request.theta = request.thetaIn;
        loadFilterFile(staticFilter, request);
    }
    databaseBypassMode = settings_.bypass3DAudio ? 1 : 0;
    return true;
}

void HrirDatabase::LoadDataBase(HrirRequest request) {
    if (usePackedDatabase) {
        mapPacked(request);
    } else if (settings_.useElevation) {
        mapElevations(request);
    } else {
        mapLevel(request);
    }
}

void HrirDatabase::mapPacked(HrirRequest request) {
    const int phiSteps = settings_.phiSteps;
    const int thetaSteps = settings_.thetaSteps;
    request.phi = 0;
    request.theta = indexToTheta(southPole);
    loadCell(gridPhiFront, southPole, request);
    if (phiSteps < 1) {
        return;
    }
    // From the front to the right, round the back and along the left side: the file's order.
    const int lastIndex = phiSteps / 2 + 1;
    int turn = phiSteps / 2;
    int i = 0;
    do {
        i = phiSteps - turn % phiSteps;
        ++turn;
        request.phi = indexToPhi(i);
        for (int t = 1; t < thetaSteps; ++t) {
            request.theta = indexToTheta(t);
            if (!loadCell(i, t, request)) {
                logOutput("not working!!! phi(", request.phi, ") Index ", i, " theta(",
                          request.theta, ") Index ", t);
            }
        }
        if (i == gridPhiFront) {
            request.phi = 0;
            request.theta = indexToTheta(northPole);
            loadCell(gridPhiFront, northPole, request);
            for (int row = 0; row <= phiSteps; ++row) {
                copyCell(gridPhiFront, row, southPole);
                copyCell(gridPhiFront, row, northPole);
            }
        }
    } while (i != lastIndex);
    for (int t = 0; t <= thetaSteps; ++t) {
        copyCell(phiSteps, 0, t);
    }
}

void HrirDatabase::mapLevel(HrirRequest request) {
    logOutput("LoadDataBase without Elevation!");
    request.theta = 0;
    const int startPhi = (180 - settings_.limitPhi) / gridStepDegrees;
    for (int i = startPhi; i <= startPhi + settings_.phiSteps; ++i) {
        request.indexPhi = static_cast<std::int16_t>(i);
        request.phi = indexToPhi(i);
        request.indexTheta = settings_.thetaCentreIndex;
        if (!loadCell(i, gridThetaLevel, request)) {
            copyCell(i - 1, i, gridThetaLevel);
            logOutput("File existiert nicht, daher auf letzten gemappte mit indexPhi = ", i - 1);
        }
    }
}

void HrirDatabase::mapElevations(HrirRequest request) {
    logOutput("LoadDataBase with Elevation!.....");
    const int startPhi = (180 - settings_.limitPhi) / gridStepDegrees;
    const int startTheta = (90 - settings_.limitTheta) / gridStepDegrees;
    const int lastPhi = startPhi + settings_.phiSteps;
    const int lastTheta = startTheta + settings_.thetaSteps;
    logOutput("startIndexPhi = ", startPhi);
    logOutput("startIndexTheta = ", startTheta);

    if (!settings_.thetaLimited) {
        logOutput("load top and down!");
        for (const int pole : {northPole, southPole}) {
            request.phi = 0;
            request.theta = indexToTheta(pole);
            loadCell(gridPhiFront, pole, request);
            for (int row = startPhi; row <= lastPhi; ++row) {
                copyCell(gridPhiFront, row, pole);
            }
        }
    }
    // The poles are a row of their own only where the range reaches them.
    const int rim = settings_.thetaLimited ? 1 : 0;
    for (int t = lastTheta - 1 + rim; t >= startTheta + 1 - rim; --t) {
        for (int i = startPhi; i <= lastPhi; ++i) {
            request.theta = indexToTheta(t);
            request.phi = indexToPhi(i);
            HrirSlot* cell = filterTableCell(i, t);
            if (cell == nullptr || loadFilterFile(*cell, request)) {
                continue;
            }
            const HrirSearch search{i, t, lastPhi, lastTheta, request.phi, request.theta};
            if (!searchMappedHrir(*cell, search)) {
                return;
            }
        }
    }
}

bool HrirDatabase::loadCell(int indexPhi, int indexTheta, HrirRequest request) {
    HrirSlot* cell = filterTableCell(indexPhi, indexTheta);
    return cell != nullptr && loadFilterFile(*cell, request);
}

bool HrirDatabase::loadFilterFile(HrirSlot& slot, HrirRequest request) {
    if (!settings_.qvTrackDirection && !mappingReflections) {
        request.phi = request.phiIn;
        request.phiNew = request.phi;
        request.theta = request.thetaIn;
        logOutput("Load Static-FilterFile with phi = ", request.phi,
                  " and theta = ", request.theta);
    } else if (slot != nullptr && !mappingReflections && !settings_.bypass3DAudio &&
               databaseBypassMode == 0) {
        return true;
    }
    if (!settings_.bypass3DAudio && !usePackedDatabase) {
        return loadOwnFile(slot, request);
    }
    HrirSlot entry = nextPackedEntry();
    if (entry == nullptr) {
        return false;
    }
    if (settings_.bypass3DAudio) {
        writePanPair(*entry, settings_.hrirLength, request.phi, settings_.panGain);
        ++hrirTablesVersion;
    }
    slot = entry;
    ++fileCount;
    return true;
}

HrirSlot HrirDatabase::nextPackedEntry() const {
    if (fileCount < 0 || fileCount >= hrirCount || hrirTable[fileCount] == nullptr) {
        logOutput("file with fileCount = ", fileCount, " doesn't exist!!");
        return nullptr;
    }
    return &hrirTable[fileCount];
}

bool HrirDatabase::loadOwnFile(HrirSlot& slot, HrirRequest request) {
    if (settings_.qvTrackDirection) {
        // File names count azimuths to the right.
        request.phi = wrapToInt16(-request.phi);
    }
    fileNameHead = settings_.qvUse256HRIR ? "/ITA-Kunstkopf_HRIR_Mess01_D180_5x5_256_A"
                                          : "/ITA-Kunstkopf_HRIR_Mess01_D180_5x5_128_A";
    fileAzimuth = (request.phi / gridStepDegrees + 72) * gridStepDegrees % 360;
    fileElevation = (request.theta / gridStepDegrees + 18) * gridStepDegrees;
    fileNameTail = takePaddedText(azimuthText_, fileAzimuth) + "_B" +
                   takePaddedText(elevationText_, fileElevation) +
                   ownFileSuffix(settings_.sampleRate);
    filterFileName = fileNameHead + fileNameTail;
    if (!settings_.qvTrackDirection) {
        request.phi = 0;
        request.theta = 0;
    }
    filterFound = fileExists(settings_.bundleBasePath + filterFileName + ".wav");
    if (!filterFound) {
        return false;
    }
    HrirSlot entry = appendHrir(settings_.hrirLength);
    if (entry == nullptr) {
        // The grid has 73 azimuth columns and would need 2557 entries. The last ones are answered
        // as missing files are, from what is mapped.
        return false;
    }
    WavSource source;
    source.bundleBasePath = settings_.bundleBasePath;
    source.usePackedDatabase = false;
    source.sampleRate = settings_.sampleRate;
    readWav(source, filterFileName, *entry, settings_.hrirLength, hrirChannels);
    ++hrirTablesVersion;
    slot = entry;
    return true;
}

}  // namespace tessaly
