// The process-wide HRIR tables and the owners of their memory.
#include "resources/hrir_tables.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "base/aligned_array.h"
#include "base/process_lifetime.h"

namespace tessaly {

constinit float* HRTFStream = nullptr;
constinit float* hrirTable[hrirCount] = {};
constinit HrirSlot filterTable[gridCellCount] = {};
constinit int nextFreeHrir = 0;
constinit std::uint8_t databaseBypassMode = 0;
constinit std::uint32_t hrirTablesVersion = 0;
constinit std::uint32_t hrirStreamNumber = 0;

namespace {

// Held until the process ends: engines of other handlers compose from these at any time, long
// after the engine that loaded them has gone.
constinit ProcessLifetime<AlignedArray<float>> streamOwner;
constinit ProcessLifetime<AlignedArray<float>> formerOwner;
constinit ProcessLifetime<std::vector<AlignedArray<float>>> entryOwners;

}  // namespace

HrirSlot* filterTableCell(int indexPhi, int indexTheta) noexcept {
    if (indexPhi < 0 || indexPhi >= gridPhiCount || indexTheta < 0 ||
        indexTheta >= gridThetaCount) {
        return nullptr;
    }
    return &filterTable[indexPhi * gridThetaCount + indexTheta];
}

const float* hrirAt(int indexPhi, int indexTheta) noexcept {
    const HrirSlot* cell = filterTableCell(indexPhi, indexTheta);
    return cell != nullptr ? hrirOf(*cell) : nullptr;
}

void replaceHrirStream(int hrirLength, bool keepFormer) {
    const auto stride = static_cast<std::size_t>(std::max(hrirLength, 0)) * 2;
    // The zero frames behind the last HRIR are for engines whose HRIRs are longer than these.
    AlignedArray<float> stream(stride * hrirCount + std::size_t{hrirMaxLength} * 2);
    for (std::size_t k = 0; k < hrirCount; ++k) {
        hrirTable[k] = stream.data() + k * stride;
    }
    HRTFStream = stream.data();
    ++hrirTablesVersion;
    ++hrirStreamNumber;
    *formerOwner = keepFormer ? std::move(*streamOwner) : AlignedArray<float>();
    *streamOwner = std::move(stream);
}

bool hrirStreamLives(std::uint32_t number) noexcept {
    return number == hrirStreamNumber || (number + 1 == hrirStreamNumber && !formerOwner->empty());
}

HrirSlot appendHrir(int hrirLength) {
    if (nextFreeHrir < 0 || nextFreeHrir >= hrirCount) {
        return nullptr;
    }
    const auto frames = static_cast<std::size_t>(std::max(hrirLength, hrirMaxLength));
    HrirSlot entry = &hrirTable[nextFreeHrir];
    *entry = entryOwners->emplace_back(frames * 2).data();
    ++nextFreeHrir;
    ++hrirTablesVersion;
    return entry;
}

void resetHrirTables() {
    std::fill(std::begin(filterTable), std::end(filterTable), nullptr);
    std::fill(std::begin(hrirTable), std::end(hrirTable), nullptr);
    HRTFStream = nullptr;
    nextFreeHrir = 0;
    databaseBypassMode = 0;
    ++hrirTablesVersion;
    hrirStreamNumber = 0;
    *streamOwner = {};
    *formerOwner = {};
    entryOwners->clear();
}

}  // namespace tessaly
