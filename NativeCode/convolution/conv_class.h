// The partitioned overlap-save convolver: one mono stream in, a stereo pair out.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "base/aligned_array.h"
#include "convolution/continuation.h"
#include "convolution/far_tail.h"
#include "convolution/fir_notes.h"
#include "convolution/input_ring.h"
#include "convolution/partition_sums.h"
#include "convolution/spectral_primitives.h"

namespace tessaly {

struct Kernels;

/// Instances of `convClass` ever constructed, never decremented. Written and read by construction:
/// the instance that finds 0 is the one that fills `HpTF_Freq`.
extern constinit std::int32_t convInstanceCount;
/// Spectrum of the headphone compensation filter. Written by the first instance of the process
/// alone, read by every instance; null until the first one makes it.
extern constinit ComplexBin* HpTF_Freq;
/// Bins behind `HpTF_Freq`: a later engine may have longer blocks than the one that made it.
extern constinit std::int32_t HpTF_FreqBins;
/// Floats behind the headphone filter in the time domain. Written by the engine that loads the
/// filter, read where the filter is transformed; beyond it the filter counts as zero.
extern constinit std::int32_t hpTFtimeLength;

/// Puts the values above back to their start and releases the headphone spectra that are kept for
/// the process's life. For test fixtures, and only while no `convClass` lives.
void resetConvolutionState() noexcept;

/// Uniformly partitioned convolution with two impulse responses that may change at any block.
/// The impulse response is N partitions of one block length B, each held as a spectrum; the input
/// is a ring of N spectra (`FDL`). The class owns no policy: it reads the engine's buffers and
/// flags by reference, and the engine moves `FDLpos` and swaps `FDL`.
///
/// Spectra are block spectra: B bins in the kernels' own order, enough for the half of a result
/// that is heard (spectral_primitives.h). Where the other half matters, with `directFilterFeed` and
/// with headphone compensation of one partition, they are B+1 bins in natural order. There is room
/// for these in each. Where compensation comes and goes, crossfade blocks have to go through
/// `processCrossfade`, in which the second instance takes the kind of spectra over.
///
/// With a second instance the engine lets it borrow `filterPartsL`, `filterPartsR`,
/// `hpTFspectrumL` and `hpTFspectrumR` of the first one, entry by entry; it neither writes nor
/// releases them. After `processCrossfade` neither runs once the other one is gone.
// The fields keep this order, whatever padding it costs.
// NOLINTNEXTLINE(clang-analyzer-optin.performance.Padding)
class convClass {
public:
    /// Load time: allocates. `essError` becomes -201 without a transform plan, -202 without memory
    /// for a spectrum; the object stays safe to run and destroy, and its output is then undefined
    /// or unchanged.
    /// @param blockLength       B, a power of two from 2
    /// @param input             2B floats, the sliding input window
    /// @param outputL, outputR  2B floats each, results
    /// @param firL, firR        `firBufferSize` floats each, at least 2B
    /// @param directFilterFeed  transform the engine's FIR buffers as they stand, 2B samples of
    /// them
    /// @param isSecondInstance  1 for the instance that renders the old filter in crossfade blocks
    /// @param hpTFtime          headphone filter, `hpTFtimeLength` floats, may be null
    /// @param FIR_size          floats of impulse response, N * B
    /// @param partitions        N, at least 1
    convClass(std::string instanceName,
              std::int32_t blockLength,
              float*& input,
              float*& outputL,
              float*& outputR,
              float*& firL,
              float*& firR,
              bool& filterChangeAll,
              bool& forceUpdateAll,
              bool& qualityFlagRef,
              std::uint8_t directFilterFeed,
              bool& filterUpdatePendingRef,
              float& interpAngleOffsetRef,
              float& distanceRef,
              std::uint8_t isSecondInstance,
              bool& fadingRef,
              bool& secondOLSactive,
              bool& hpTFactive,
              float*& hpTFtime,
              std::int16_t& hpTFselect,
              float& blockGainLinearRef,
              bool& holdInterpPairRef,
              std::uint32_t& blockCounterRef,
              std::int32_t FIR_size,
              std::int32_t firBufferSize,
              std::int16_t partitions);
    ~convClass();
    convClass(const convClass&) = delete;
    convClass& operator=(const convClass&) = delete;

    /// One block. The result is samples B to 2B - 1 of `outputL` and `outputR`, times 2B; those
    /// before are undefined. Block time; a changed headphone selection allocates, a refused
    /// transform logs.
    /// @return `outputL`
    float* process() noexcept;

    /// One crossfade block of the first instance and its second: the second takes the input into
    /// its ring and renders with the spectra as they stand, then this one updates them and renders
    /// the same ring; its own ring stays as it is, newest slot included. So it sounds; what is made
    /// is less: the sum over partitions that no update touches once for both, without any a copy of
    /// this one's result for the second, and in a run of such blocks what the last result goes on
    /// to be (`continueResults`). Of the second's block only the first `heardOfOld` samples are
    /// promised. Block time.
    void processCrossfade(convClass& second, std::int32_t heardOfOld) noexcept;

    /// Who writes the responses tells here which samples, taken and cleared by each update, and
    /// whether their end has a gain. Null: all of them may have changed. Load time: allocates.
    /// @param compared  samples of the start that are often written again as they were: an update
    ///                  looks for what differs there. Behind them all that is written counts as
    ///                  changed, and no copy is kept
    void watch(FirNotes* notes, std::int32_t compared);

    /// Takes the far part of a long response in larger partitions, of `ratio` blocks, wherever that
    /// gives the same: FarTail. Load time: allocates. Without memory all stays uniform.
    void splitFarTail(std::int32_t ratio);
    /// In crossfade blocks one after the other the first samples of the old response come from what
    /// the last result goes on to be, and partitions that change in each of them keep no spectra.
    /// For whoever calls `beforeWriting`; behind `splitFarTail`, if that is called. Load time:
    /// allocates. Without memory, and with many or short blocks, all is convolved. Blocks on the
    /// thread that calls this work in memory that all convolvers of that thread share; blocks on
    /// another one do not, and keep all spectra.
    void continueResults();
    /// Once before each block, and before the responses are written for it. Block time.
    /// Clearing the responses is writing, too. Where it is left out, or its promise broken, the
    /// next old response is lost: the samples of partitions without spectra stand in the responses
    /// only.
    /// @param crossfade  the block will be made, by `processCrossfade` with the same second
    ///                   instance, and its input window is that of the block before, moved on
    void beforeWriting(bool crossfade) noexcept;
    /// The last block's old response was continued. For tests.
    bool oldContinued() const noexcept { return oldContinued_; }
    /// This block's far part came from larger partitions. For tests.
    bool farTailHeard() const noexcept { return farHeard_; }

    /// The window of the next block is known to be zeros. Block time.
    void expectSilence() noexcept { expectsSilence_ = true; }
    /// One more block like the last one, which was silent throughout: the input was, all that the
    /// ring holds and the result, nothing was updated, and it is so again. Results stay as they
    /// are. Block time.
    /// @param taker  the second instance if the last block was a crossfade block, else null
    void rest(convClass* taker) noexcept;

    /// The last block's result is zeros for certain.
    bool resultSilent() const noexcept { return resultSilent_; }

    /// Takes what was written into the responses although no block asked for an update: the old
    /// response of the next crossfade. Block time.
    void takeResponses() noexcept;
    /// The ring that the next block of this instance reads holds no sound but, it may be, that of
    /// the block itself.
    bool pastSilent() const noexcept { return ring_.silent(); }

    /// Zeroes every spectrum in `FDL`. Block time.
    void clearFDL() noexcept;

    /// Makes the compensation spectrum ready and fresh, zeroed product spectra. Load time, and in
    /// the block that first sees a changed selection: allocates.
    void HpTF_Freq() noexcept;

    std::int32_t convNumber = 0;
    bool& filterChangeAll;
    bool& forceUpdateAll;
    bool& qualityFlagRef;
    std::uint8_t directFilterFeed;
    bool& filterUpdatePendingRef;
    float& interpAngleOffsetRef;
    std::uint8_t isSecondInstance;
    bool& fadingRef;
    bool& secondOLSactive;
    float& distanceRef;
    bool& hpTFactive;
    std::int16_t hpTFselectSeen = 0;
    std::uint8_t hpTFloaded = 0;
    std::int16_t& hpTFselect;
    std::string instanceName;
    float*& input;
    float*& outputL;
    float*& outputR;
    float*& firL;
    float*& firR;
    /// Per partition the B samples last transformed; null where none are kept. With
    /// `directFilterFeed` entry 0 points at the engine's buffer, which stays the engine's.
    std::vector<float*> timePartsL;
    std::vector<float*> timePartsR;
    float* hpTFtimeCopy = nullptr;
    float*& hpTFtime;
    std::int32_t fftLength = 0;    ///< 2B
    std::int32_t blockLength = 0;  ///< B
    std::int32_t binCount = 0;     ///< B+1
    std::int32_t fftOrder = 0;     ///< log2 of 2B, truncated
    TransformHandle fftHandle;
    TransformHandle ifftHandle;
    /// Never created: compensation of more than one partition stays refused.
    TransformHandle fftHandleFull;
    TransformHandle ifftHandleFull;
    std::int32_t firLength = 0;
    std::int32_t firLengthHalf = 0;
    std::int32_t firBufferSize = 0;
    float& blockGainLinearRef;
    bool& holdInterpPairRef;
    std::uint32_t& blockCounterRef;
    std::int32_t dftiStatus = 0;  ///< status of the last call of the transform service
    /// The larger of B+1 and `firLengthHalf` + 1 bins, so that both branches stay inside.
    ComplexBin* hpTFspectrumL = nullptr;
    ComplexBin* hpTFspectrumR = nullptr;
    std::vector<ComplexBin*> FDL;     ///< ring of input spectra in use
    std::vector<ComplexBin*> FDLown;  ///< first instance: its own ring, to restore `FDL` from
    /// Of partitions that change in every block of a run of crossfades, see `continueResults`,
    /// these are older ones.
    std::vector<ComplexBin*> filterPartsL;
    std::vector<ComplexBin*> filterPartsR;
    /// Result spectra of the current block, unless it works in shared memory (`continueResults`).
    ComplexBin* accumL = nullptr;
    ComplexBin* accumR = nullptr;
    std::int16_t FDLpos = 0;  ///< ring index of the newest spectrum, 0 to N - 1
    std::int16_t FDLtoBUFConv = 1;
    std::int16_t partitionsAtCreation = 1;

private:
    std::size_t newestSlot() const noexcept;
    std::int32_t headphoneBins() const noexcept;
    void transformHeadphoneFilter() noexcept;
    void watchSelection() noexcept;
    void updateFilter() noexcept;
    void feedDirectly(float* fir,
                      std::vector<float*>& timeParts,
                      const std::vector<ComplexBin*>& filterParts) noexcept;
    void fullLengthBranch() noexcept;
    static void multiplyHeadphone(const ComplexBin* filter,
                                  ComplexBin* product,
                                  std::int32_t bins) noexcept;
    void borrowAndProcess(convClass& second) noexcept;
    bool sharesWith(const convClass& second) noexcept;
    void findChangedPartitions() noexcept;
    void findChangedPartitions(std::size_t first, std::size_t end) noexcept;
    void transformChanged() noexcept;
    void keepTimeParts(std::size_t partitions);

    /// How the end of the response counts: partitions from `begin` on, `gain` times.
    struct ScaledPartitions {
        std::size_t begin = 0;
        float gain = 1.0f;

        bool operator==(const ScaledPartitions&) const = default;
    };
    /// A ring that a block is made from. Without a state nothing is known of its slots.
    struct RingView {
        const std::vector<ComplexBin*>& spectra;
        const InputRing* state;
        std::size_t newest;
    };
    ScaledPartitions scaledNow() const noexcept;
    RingView ownRing() const noexcept;
    /// The first of `shared_`, or the instance's own.
    EarSpectra accumulators() const noexcept {
        return inShared_ ? EarSpectra{shared_, shared_ + stride_} : EarSpectra{accumL, accumR};
    }
    void chooseMemory() noexcept;
    void clearSums(const EarSpectra& sums) const noexcept;
    bool takeInput(std::uint64_t block) noexcept;
    std::uint64_t blockNumber() const noexcept;
    void advanceFarTail(bool silent, bool taken = true) noexcept;
    bool canSum(const RingView& ring, bool compensated) const noexcept;
    void render(const RingView& ring, const RingView& other, bool goesOn = false) noexcept;
    void renderSilence() noexcept;
    void renderOldByTaps(convClass& second, std::int32_t heard) noexcept;
    bool followRing(const convClass& second) noexcept;
    bool mayContinue() const noexcept;
    bool continuesOld(const RingView& ring,
                      const ScaledPartitions& before,
                      std::int32_t heard) noexcept;
    void continueOld(convClass& second,
                     const ScaledPartitions& before,
                     std::int32_t heard) noexcept;
    void keepResult(bool made, std::size_t partitions) noexcept;
    void chooseOwed() noexcept;
    void settle() noexcept;
    bool addOwed(const RingView& ring, bool summed) noexcept;
    void takePartition(std::size_t partition, ComplexBin* left, ComplexBin* right) noexcept;
    void noteStartChange(std::int32_t taps) noexcept;
    void findStartChange() noexcept;
    void renderBoth(convClass& second, const ScaledPartitions& before, std::int32_t heard) noexcept;
    std::size_t bins() const noexcept;
    void useNaturalOrder() noexcept;
    void followCompensation() noexcept;
    void reorderResponse() noexcept;
    std::int32_t transformWindow(const float* samples, ComplexBin* spectrum) noexcept;
    std::int32_t transformPartition(const float* samples,
                                    ComplexBin* spectrum,
                                    std::uint64_t sounding) noexcept;
    bool transformBack(std::int32_t samples, bool alsoWrapped = false) noexcept;
    /// Partitions [0, scaledBegin) of the uniform sums and [scaledBegin, end), which count `gain`
    /// times, as does the far tail behind them.
    struct Layout {
        std::size_t scaledBegin;
        std::size_t end;
        float gain;
    };
    Layout layoutOf(const ScaledPartitions& scaled) const noexcept;
    enum class Pick : std::uint8_t { all, touched, untouched };  ///< by an update
    void collect(const RingView& ring, std::size_t begin, std::size_t end, Pick pick) noexcept;
    bool findFarCorrections(const RingView& ring,
                            const RingView& other,
                            const ScaledPartitions& before,
                            const ScaledPartitions& now) noexcept;
    bool standsBeforeFar(const ScaledPartitions& scaled) const noexcept;
    void addFarHeld() noexcept;
    void subtractFarExpected(const EarSpectra& sum, float gain) noexcept;

    FirNotes* notes_ = nullptr;
    ScaledPartitions scaled_;            ///< of the spectra as they stand
    std::vector<std::uint8_t> changed_;  ///< per partition: its samples are not those transformed
    std::int32_t changedCount_ = 0;
    std::vector<std::uint8_t> silent_;  ///< per partition: both spectra are known to be zero
    InputRing ring_;                    ///< of the ring that this instance owns
    bool resultSilent_ = false;
    bool expectsSilence_ = false;

    const convClass* partner_ = nullptr;  ///< the second instance that `processCrossfade` met
    std::unique_ptr<FarTail> far_;
    bool farHeard_ = false;
    /// Slots of a ring that hold something else than the input as it came: what they hold counts,
    /// what they should hold, which `far_` has counted, does not.
    struct FarCorrection {
        std::size_t partition;
        const ComplexBin* spectrum;
    };
    std::vector<FarCorrection> farHeld_;
    std::vector<FarCorrection> farExpected_;

    Continuation continuation_;  ///< of this instance's results from the second one's ring
    const convClass* followed_ = nullptr;  ///< whose ring its windows came to
    std::uint64_t followedWrites_ = 0;     ///< that the ring had seen then
    std::size_t followedSlot_ = 0;
    bool windowFollows_ = false;  ///< as promised for the next block
    bool oldContinued_ = false;

    /// Per partition: the spectrum is not that of its samples, which stand in the responses and go
    /// through `addOwed`. For partitions that change in each block.
    std::vector<std::uint8_t> owed_;
    std::int32_t owedCount_ = 0;
    static constexpr std::int32_t passingPairs = 2;  ///< of spectra on their way
    static constexpr std::int32_t sharedPairs = 1 + passingPairs;
    ComplexBin* shared_ = nullptr;             ///< the sums' pair and those, `stride_` apart
    std::thread::id sharedBy_;                 ///< the thread that alone may use it
    bool inShared_ = false;                    ///< this block does
    std::vector<std::uint8_t> changedBefore_;  ///< as `changed_`, in the block before
    bool naturalOrder_ = false;                ///< of all spectra; once so, for good
    AlignedArray<float> padded_;               ///< a partition and B zeros, for natural order
    PartitionSums sums_;
    EarSpectra end_;  ///< sum over the scaled end, without its gain

    /// Per ear the first samples of the response as last transformed, but while the first partition
    /// is owed, and what they were more than what they are. A change of these alone is heard in the
    /// old block without a transform.
    static constexpr std::int32_t directTaps = 256;
    AlignedArray<float> startTaps_;
    AlignedArray<float> startChange_;
    std::int32_t changedTaps_ = 0;  ///< of the start, where nothing behind them changed; else 0

    /// One block of memory for each array above; the stride between two spectra is whole cache
    /// lines and no multiple of 4 KB, so that neighbours do not share cache sets.
    std::int32_t stride_ = 0;
    ComplexBin* ringMemory_ = nullptr;
    ComplexBin* partsMemoryL_ = nullptr;
    ComplexBin* partsMemoryR_ = nullptr;
    AlignedArray<float> timeMemoryL_;
    AlignedArray<float> timeMemoryR_;
    const Kernels* kernels_ = nullptr;
};

}  // namespace tessaly
