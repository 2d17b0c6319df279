// Values that all engines of the process share.
#include "engine/shared_state.h"

#include <memory>
#include <vector>

#include "base/process_lifetime.h"
#include "convolution/conv_class.h"

namespace tessaly {

constinit int engineCount = 0;
constinit std::uint32_t blockCounter = 0;
constinit bool filterChangeAll = true;
constinit bool forceUpdateAll = true;
constinit bool hpTFactive = false;
constinit std::int16_t qvHpTFcompSelect = 0;
constinit float* hpTFfilter = nullptr;

namespace {

/// Every filter ever loaded. A replaced one stays: convolvers of other engines compare and read
/// the old pointer until their own next block.
constinit ProcessLifetime<std::vector<std::unique_ptr<float[]>>> headphoneFilters;

}  // namespace

void allocateHpTFfilter(int length) {
    headphoneFilters->push_back(std::make_unique<float[]>(static_cast<std::size_t>(length)));
    hpTFtimeLength = length;
    hpTFfilter = headphoneFilters->back().get();
}

void resetSharedEngineState() {
    engineCount = 0;
    blockCounter = 0;
    filterChangeAll = true;
    forceUpdateAll = true;
    hpTFactive = false;
    qvHpTFcompSelect = 0;
    hpTFfilter = nullptr;
    hpTFtimeLength = 0;
    headphoneFilters->clear();
}

}  // namespace tessaly
