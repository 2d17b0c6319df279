// Two convolvers driven as an engine drives them, and a model of what they owe.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "convolution/conv_class.h"

namespace tessaly::test {

/// What an engine lends to its convolvers, and the order in which it runs them.
struct ConvolverRig {
    ConvolverRig(std::int32_t blockLengthIn, std::int16_t partitionsIn)
        : blockLength(blockLengthIn),
          partitions(partitionsIn),
          window(2 * static_cast<std::size_t>(blockLengthIn)),
          filterLeft(static_cast<std::size_t>(blockLengthIn * (partitionsIn + 1))),
          filterRight(filterLeft.size()),
          firstLeft(window.size()),
          firstRight(window.size()),
          secondLeft(window.size()),
          secondRight(window.size()) {}

    std::unique_ptr<convClass> make(std::uint8_t isSecond) {
        return std::make_unique<convClass>(
            isSecond != 0 ? "secondOLSfeeded-Instanz" : "firstOLSfeeded-Instanz", blockLength,
            input, isSecond != 0 ? secondLeftPointer : firstLeftPointer,
            isSecond != 0 ? secondRightPointer : firstRightPointer, filterLeftPointer,
            filterRightPointer, filterChangeAll, forceUpdateAll, qualityFlag, directFilterFeed,
            filterUpdatePending, interpAngleOffset, distance, isSecond, fading, secondOLSactive,
            hpTFactive, hpTFfilter, hpTFselect, blockGainLinear, holdInterpPair, blockCounter,
            blockLength * partitions, static_cast<std::int32_t>(filterLeft.size()), partitions);
    }
    void makeFirst() { first = make(0); }
    void makeBoth() {
        makeFirst();
        second = make(1);
        for (std::size_t i = 0; i < first->filterPartsL.size(); ++i) {
            second->filterPartsL[i] = first->filterPartsL[i];
            second->filterPartsR[i] = first->filterPartsR[i];
        }
        if (hpTFactive) {
            second->hpTFspectrumL = first->hpTFspectrumL;
            second->hpTFspectrumR = first->hpTFspectrumR;
        }
    }

    /// Slides B new samples into the input window.
    void feed(const std::vector<float>& block) {
        const std::ptrdiff_t length = blockLength;
        std::copy(window.begin() + length, window.end(), window.begin());
        std::copy(block.begin(), block.end(), window.begin() + length);
    }
    /// One block; with `update` and two instances it is a crossfade block, but for the very first.
    void run(bool update) {
        filterChangeAll = update;
        first->FDLpos = static_cast<std::int16_t>((first->FDLpos + 1) % partitions);
        if (second != nullptr) {
            second->FDLpos = first->FDLpos;
        }
        if (second != nullptr && update && blockCounter != 0 && heardOfOld >= 0) {
            secondOLSactive = true;
            first->processCrossfade(*second, heardOfOld);
            secondOLSactive = false;
        } else if (second != nullptr && update && blockCounter != 0) {
            secondOLSactive = true;
            second->process();
            for (std::size_t i = 0; i < first->FDL.size(); ++i) {
                first->FDL[i] = second->FDL[i];
            }
            first->process();
            for (std::size_t i = 0; i < first->FDL.size(); ++i) {
                first->FDL[i] = first->FDLown[i];
            }
            secondOLSactive = false;
        } else {
            first->process();
        }
        filterChangeAll = false;
        forceUpdateAll = false;
        ++blockCounter;
    }

    std::int32_t blockLength;
    std::int16_t partitions;
    std::vector<float> window;
    std::vector<float> filterLeft;
    std::vector<float> filterRight;
    std::vector<float> firstLeft;
    std::vector<float> firstRight;
    std::vector<float> secondLeft;
    std::vector<float> secondRight;
    float* input = window.data();
    float* filterLeftPointer = filterLeft.data();
    float* filterRightPointer = filterRight.data();
    float* firstLeftPointer = firstLeft.data();
    float* firstRightPointer = firstRight.data();
    float* secondLeftPointer = secondLeft.data();
    float* secondRightPointer = secondRight.data();
    std::uint8_t directFilterFeed = 0;
    bool filterChangeAll = false;
    bool forceUpdateAll = false;
    bool qualityFlag = false;
    bool filterUpdatePending = false;
    bool fading = true;
    bool secondOLSactive = false;
    bool hpTFactive = false;
    bool holdInterpPair = false;
    float interpAngleOffset = 0.0f;
    float distance = 1.0f;
    float blockGainLinear = 1.0f;
    float* hpTFfilter = nullptr;
    std::int16_t hpTFselect = 0;
    std::uint32_t blockCounter = 0;
    /// From 0 on crossfade blocks run in one call that promises so many samples of the old
    /// response; below they run in the plain order.
    std::int32_t heardOfOld = -1;
    std::unique_ptr<convClass> first;
    std::unique_ptr<convClass> second;
};

/// sum over t of h[t] w[n - t], indices modulo the window: what the spectra's product stands for.
inline std::vector<double> circularProduct(const std::vector<double>& window,
                                           const std::vector<double>& response) {
    std::vector<double> result(window.size());
    for (std::size_t n = 0; n < window.size(); ++n) {
        for (std::size_t t = 0; t < response.size(); ++t) {
            result[n] += response[t] * window[(n + window.size() - t) % window.size()];
        }
    }
    return result;
}

/// One ear of one instance in the time domain: a ring of input windows against a response in
/// partitions of B samples. Results carry the factor 2B of the unscaled transforms.
class RingModel {
public:
    using Window = std::vector<double>;

    RingModel(std::size_t blockLength, std::size_t partitions)
        : ring(partitions, Window(2 * blockLength)), parts(partitions, Window(blockLength)) {}

    void setResponse(const std::vector<float>& fir) {
        for (std::size_t p = 0; p < parts.size(); ++p) {
            for (std::size_t i = 0; i < parts[p].size(); ++i) {
                parts[p][i] = static_cast<double>(fir[p * parts[p].size() + i]);
            }
        }
    }
    /// Slot r = (newest + i) mod N against partition (N - i) mod N.
    Window output(const std::vector<Window>& slots, std::size_t newest) const {
        const std::size_t n = parts.size();
        Window sum(slots[0].size());
        for (std::size_t i = 0; i < n; ++i) {
            const Window product = circularProduct(slots[(newest + i) % n], parts[(n - i) % n]);
            for (std::size_t k = 0; k < sum.size(); ++k) {
                sum[k] += product[k] * static_cast<double>(sum.size());
            }
        }
        return sum;
    }

    std::vector<Window> ring;
    std::vector<Window> parts;
};

}  // namespace tessaly::test
