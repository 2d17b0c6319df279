// Sums direct sound, reflections and tail into one response per ear.
#pragma once

#include <cstdint>

#include "base/aligned_array.h"
#include "base/audio_thread.h"
#include "convolution/fir_notes.h"
#include "engine/distance_law.h"
#include "engine/engine_settings.h"
#include "engine/fir_interpolation.h"
#include "engine/fir_size.h"
#include "engine/input_front_end.h"
#include "engine/live_controls.h"
#include "engine/reflections.h"
#include "engine/response_pieces.h"
#include "engine/reverb_tail.h"
#include "engine/source_direction.h"

namespace tessaly {

/// What a composition reads of the engine, and the filters it redesigns on the way.
struct CompositionInputs {
    const EffectiveSettings& switches;
    const FirSizes& sizes;
    int sampleRate;  ///< Hz
    const SourceDirection& direction;
    const DistanceLaw& law;
    const MixParameters& mix;
    const LiveControls& controls;
    HrirSlot staticFilter;  ///< used when directions are not tracked; null: silence
    bool filterChange;      ///< process-wide flags of this block
    bool forceUpdate;
    unsigned int blockCounter;
    InputFrontEnd& frontEnd;  ///< its two distance filters are redesigned
    Reflections& reflections;
    ReverbTail& tail;
    bool unheard = false;  ///< this block is silent whatever the responses are
};

class FirComposer {
public:
    /// Load time: allocates both responses.
    void prepare(int firBufferSize);
    /// Load time: allocates what spares filtering in later blocks.
    void prepareKeptParts(int hrirLength, ReverbTail& tail);

    /// Rebuilds both ears from nothing. Block time. `left` and `right` hold `sizes.firBufferSize`
    /// floats and are overwritten; whatever would lie before or behind them is dropped.
    void composeFIR(float* left,
                    float* right,
                    CompositionInputs& inputs) noexcept TESSALY_NONBLOCKING;
    /// Divides the last 15 samples of the response by 4, 8, ... 60. Block time.
    /// @param end  samples from here on are left alone
    void fadeFilterTail(int FIR_size, int end) noexcept TESSALY_NONBLOCKING;
    void fadeFilterTail(int FIR_size) noexcept TESSALY_NONBLOCKING {
        fadeFilterTail(FIR_size, static_cast<int>(filterLeftBuffer.size()));
    }
    /// Decides what is composed and blended in this block. Block time.
    void refreshFilter(CompositionInputs& inputs,
                       FirInterpolation& interpolation) noexcept TESSALY_NONBLOCKING;
    /// Writes what was composed last while nobody heard it. Before the first block that is heard
    /// again, and before the responses are read by others. Block time.
    /// @return whether there was anything
    bool catchUp(CompositionInputs& inputs) noexcept TESSALY_NONBLOCKING;
    /// There is a composition that has not been written.
    bool isBehind() const noexcept { return postponed_; }
    /// The responses were written by somebody else: the next composition starts from nothing.
    /// Block time.
    void forget() noexcept;

    AlignedArray<float> filterLeftBuffer;
    AlignedArray<float> filterRightBuffer;
    /// `firBufferSize` floats; from `notes.scaledEnd.begin` on without the gain of the tail.
    float* filterLeft = nullptr;
    float* filterRight = nullptr;  ///< likewise
    /// For the convolver: what was written, and the end of the tail that stands without its gain.
    FirNotes notes;
    float earlyGain = 0.0f;      ///< of the last composition
    float reverbMixGain = 0.0f;  ///< of the last composition

private:
    /// All that decides the samples of a response.
    struct Ingredients {
        PieceList pieces;
        float tailGain = 0.0f;    ///< linear; of the synthetic tail the mix's share of it
        float tailCutOff = 0.0f;  ///< Hz
        float roomSizeFactor = 0.0f;
    };

    void listIngredients(const CompositionInputs& inputs) noexcept;
    void composeChanges(CompositionInputs& inputs) noexcept;
    void writeChanges(CompositionInputs& inputs) noexcept;
    void writeWhole(const EarBuffers& ears,
                    CompositionInputs& inputs,
                    int piecesEnd,
                    const FirStretches& changed) noexcept;
    void writeEnd(const EarBuffers& ears, CompositionInputs& inputs) noexcept;
    void writeStart(const EarBuffers& ears, CompositionInputs& inputs, int end) noexcept;
    void writeStretches(const EarBuffers& ears,
                        CompositionInputs& inputs,
                        int end,
                        const FirStretches& changed) noexcept;

    Ingredients wanted_;              ///< of the newest composition
    Ingredients standing_;            ///< of the responses as they stand
    PieceWriter writer_;              ///< for the engine's responses
    PieceWriter plainWriter_;         ///< keeps nothing
    std::uint32_t listedStream_ = 0;  ///< packed HRIR set that `wanted_` points into
    std::uint32_t lastTables_ = 0;    ///< version of the HRIR tables behind what stands
    bool startKnown_ = false;         ///< up to the scaled end: what the last ingredients make
    bool endKnown_ = false;           ///< from there on
    bool postponed_ = false;          ///< the responses are behind `wanted_`
};

}  // namespace tessaly
