// One spatial engine of the reference: a source's whole signal path, in double precision.
//
// What decides an integer (delays, table indices, alignment) follows the system's single-precision
// arithmetic step by step, so that both come to the same integer. All gains, filters, responses
// and sums are plain double arithmetic. Headphone compensation is not modelled (never active).
#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <vector>

#include "support/reference/reference_convolver.h"
#include "support/reference/reference_filter.h"
#include "support/reference/reference_process.h"

namespace tessaly::reference {

/// What an engine reads through its input pointers, at construction and in every block.
struct SourceInputs {
    std::int16_t azimuth = 0;    ///< degrees, positive to the right
    std::int16_t elevation = 0;  ///< degrees
    float distance = 1.0f;       ///< metres
    float gainDb = 0.0f;         ///< level of the whole output
};

/// The record shared by handler and engine: linear gains, then what is only compared.
struct MixLevels {
    double direct = 1.0;
    double early = 1.0;
    double reverb = 1.0;
    double mixCutoffSlot = 20000.0;
    double reverbCutoff = 20000.0;
    double mixSlot = 0.0;
    double unityAttenuation = 1.0;
    bool unityDistance = false;
    double mixRoomSlot = 40.0;
    double roomSize = 1.0;

    /// All ten values equal; a NaN equals nothing.
    bool operator==(const MixLevels&) const = default;
};

/// What a handler writes into a running engine.
struct LiveControls {
    float reflectionLP_Fc = 20000.0f;   ///< Hz, filter class 0
    float reflectionLP2_Fc = 20000.0f;  ///< Hz, filter class 1
    float reverbLP_Fc = 20000.0f;       ///< Hz
    float roomSizeFactor = 1.0f;        ///< below 1 cuts the tail
    bool bassBoost = false;             ///< run the low shelf
    std::array<float, 6> roomDistances{1.0f, 1.0f, 1.0f, 1.0f, 1.0f, 1.0f};
};

/// One preset reflection.
struct ReflectionRecord {
    std::int16_t relativePhi = 0;
    std::int16_t relativeTheta = 0;
    std::int16_t phi = 0;
    std::int16_t theta = 0;
    std::int16_t indexPhi = 0;
    std::int16_t indexTheta = 0;
    std::int16_t presetDelaySamples = 0;
    std::int16_t delaySamples = 0;
    float distanceGain = 1.0f;
    float gain = 0.0f;
    std::int16_t filterClass = -1;  ///< -1 none, 0 or 1
    float wallDistance = 0.0f;
    float reflectionDistance = 1.0f;
};

/// One room of the preset table; lists in record order, delays in samples at 44100 Hz.
struct PresetRow {
    std::vector<int> phi;
    std::vector<int> theta;
    std::vector<int> delay;
    std::vector<float> gain;
    std::vector<int> filterClass;  ///< empty: all 0
    int earlyFlexFirSize = 0;
    float earlyPresetGain = 1.0f;
    std::array<float, 6> roomDistances{1.0f, 1.0f, 1.0f, 1.0f, 1.0f, 1.0f};
    float reflectionLP_Fc = 20000.0f;
    float reflectionLP2_Fc = 20000.0f;
    float reverbLP_Fc = 20000.0f;
    bool presetUsesFilters = false;
    bool hasReverbLowPass = false;
};

/// A measured tail: interleaved pairs, left first.
struct Tail {
    std::vector<float> pairs;
    float presetGain = 0.0f;
};

/// Everything an engine is built with. Start values are those of a handler at 48000 Hz without
/// a room.
struct EngineOptions {
    int blockLength = 1024;
    int qualityValue = 0;  ///< 0: the switches below as they stand; 1 and up: the ladder

    bool qvInterpolateSpectra = false;
    bool qvInterpolateFilters = false;
    bool qvEarlyReflections = false;
    bool qvFlexReflections = true;
    int qvReverb = 0;
    bool qvSmoothSteps = false;
    bool fading = true;
    bool qvTrackDirection = true;
    bool qvUse256HRIR = false;
    int limitPhi = 180;
    int limitTheta = 90;
    int qvUpdateInterval = 1;
    int atmoSelect = 0;
    bool alwaysUpdateFilter = true;
    int earlyFlexRefPreset = 0;
    int sampleRate = 48000;
    int defaultFirSize = 4096;
    bool auralisation = false;
    bool doppler = false;
    bool bypass3DAudio = false;

    // What the system takes from tables and files, given by whoever compares.
    PresetRow presetRow;           ///< used if earlyFlexRefPreset is above 0 and reflections are on
    Tail tail;                     ///< used if qvReverb is above 1
    std::vector<double> ambience;  ///< interleaved stereo loop; frames behind its end are silent

    Arithmetic arithmetic = Arithmetic::transformed;
};

/// Frames of an HRIR at a rate: 70, 128, 139 at 24000, 44100, 48000 Hz, or 256.
int hrirFrames(int sampleRate, bool use256);

/// Frames of a tail at a rate, by its length at 48000 Hz; single precision can cut one frame off.
int tailFrames(int framesAt48000, int sampleRate);

/// Size of a room's reflection buffer by preset number 1 to 60, 0 for any other.
int earlyFlexFirSizeOf(int preset);

/// One engine. The inputs and the mix record stay with the caller and are read in every block.
class Engine {
public:
    Engine(Process& process,
           const SourceInputs& inputs,
           const MixLevels& mix,
           const EngineOptions& options);
    ~Engine();
    Engine(const Engine&) = delete;
    Engine& operator=(const Engine&) = delete;

    /// One block. `input` holds blockLength stereo frames of which the left slots count.
    /// @param output  resized to 2 * blockLength, interleaved
    void process(std::span<const double> input, std::vector<double>& output);
    void process(std::span<const float> input, std::vector<double>& output);

    /// Occlusion from 0 to 1: designs the input low-pass anew if the level differs.
    void setInputLowPass(float level);

    LiveControls controls;
    std::vector<ReflectionRecord> records;  ///< from the preset row; tests may put in their own

    bool built() const { return built_; }
    int instanceNumber() const { return instanceNumber_; }
    int firSize() const { return firSize_; }
    int partitions() const { return partitions_; }
    int hrirLength() const { return hrirLength_; }
    float distance() const { return distance_; }
    double directGain() const { return directGain_; }
    double earlyDistanceGain() const { return earlyDistanceGain_; }
    double reverbDistanceGain() const { return reverbDistanceGain_; }
    int phi() const { return phi_; }
    int theta() const { return theta_; }
    int indexPhi() const { return indexPhi_; }
    int indexTheta() const { return indexTheta_; }
    const std::vector<double>& responseLeft() const { return filter_.left; }
    const std::vector<double>& responseRight() const { return filter_.right; }

private:
    /// A response of firBufferSize taps an ear.
    struct Response {
        std::vector<double> left;
        std::vector<double> right;
        void resize(int taps);
        /// Adds to one tap; what lies outside the buffer is dropped.
        static void add(std::vector<double>& ear, int tap, double value);
        static double get(const std::vector<double>& ear, int tap);
    };

    // Construction (reference_engine_setup.cpp).
    void applyLadder();
    void settingsStep();
    void deriveFirSize();
    bool loadDatabase();
    void mapPackedSet();
    bool loadFilter(int& cell);
    void writePanPair(int hrir);
    void loadFixedPair();
    void loadPresetRow();

    // Direction and order of a block (reference_engine.cpp).
    void directionStage();
    void directionUpdate();
    void stepBookkeeping();
    void stepAxis(float step, float& moved, std::int16_t& index, std::int16_t& indexOld);
    bool directionChanged() const;
    void updateReflections();
    void convolve();
    void writeOutput(std::vector<double>& output);

    // Distance, delay line and input filters (reference_front_end.cpp).
    void distanceUpdate();
    void inputFrontEnd(std::span<const double> input);
    void runDelayLine(std::span<const double> input);

    // The response (reference_response.cpp).
    void refreshFilter();
    void composeFir(Response& response);
    void addHrir(Response& response, int hrir, int firstTap, int frames, double gain);
    void addFilteredHrir(Response& response, const ReflectionRecord& record, double gain);
    void addFixedPair(Response& response);
    void addRecords(Response& response);
    void addSyntheticTail(Response& response);
    void addMeasuredTail(Response& response);
    void redesignDistanceFilters();
    void fadeFilterTail();
    void interpolateFir();

    double frequency(float cutoff) const;

    Process& process_;
    const SourceInputs& inputs_;
    const MixLevels& mix_;
    const EngineOptions options_;
    bool built_ = false;
    int instanceNumber_ = 0;

    // Effective switches.
    bool qvInterpolateSpectra_ = false;
    bool qvInterpolateFilters_ = false;
    bool interpolateAngles_ = false;
    bool qvEarlyReflections_ = false;
    bool qvFlexReflections_ = false;
    int qvReverb_ = 0;
    bool qvSmoothSteps_ = false;
    bool fading_ = false;
    bool qvTrackDirection_ = false;
    bool qvUse256HRIR_ = false;
    int qvUpdateInterval_ = 0;
    int atmoSelect_ = 0;
    bool useElevation_ = false;
    int limitPhi_ = 0;
    int limitTheta_ = 0;
    bool doppler_ = false;
    bool bypass3DAudio_ = false;
    int earlyFlexRefPreset_ = 0;

    // Sizes and constants.
    int blockLength_ = 0;
    int hrirLength_ = 0;
    int reverbLength_ = 0;
    int firSize_ = 0;
    int firBufferSize_ = 0;
    int partitions_ = 0;
    int phiSteps_ = 0;
    int thetaSteps_ = 0;
    float sampleRateRatio_ = 1.0f;
    float samplesPerMetre_ = 0.0f;

    // Database loading.
    int fileCount_ = 0;
    bool mappingReflections_ = false;
    int staticFilter_ = noHrir;

    // Direction.
    std::int16_t phi_ = 0;
    std::int16_t theta_ = 0;
    std::int16_t phiNew_ = 0;
    std::int16_t thetaNew_ = 0;
    std::int16_t phiOld_ = 0;
    std::int16_t thetaOld_ = 0;
    std::int16_t indexPhi_ = 0;
    std::int16_t indexTheta_ = 0;
    std::int16_t indexPhiOld_ = 0;
    std::int16_t indexThetaOld_ = 0;
    std::int16_t angleStep_ = 5;
    float phiStep_ = 0.0f;
    float thetaStep_ = 0.0f;
    float phiMoved_ = 0.0f;
    float thetaMoved_ = 0.0f;
    float phiStepMoved_ = 0.0f;
    float thetaStepMoved_ = 0.0f;
    bool filterUpdatePending_ = true;
    MixLevels mixOld_;
    bool mixChanged_ = false;

    // Distance and gains.
    float distance_ = 0.0f;
    float distanceNew_ = 0.0f;
    float distanceOld_ = 0.0f;
    double directGain_ = 1.0;
    double earlyDistanceGain_ = 1.0;
    double reverbDistanceGain_ = 1.0;
    double distanceFade_ = 0.0;

    // Input side.
    std::vector<double> inputHistory_;
    std::vector<double> dopplerLine_;
    float inputLowPassLevel_ = 0.0f;
    Filter bassShelveFilter_;
    Filter inputLowPass_;
    Filter highCutFilter_;
    Filter lowCutFilter_;

    // Response.
    Response filter_;
    std::array<Response, 2> interpFilter_;
    int interpNew_ = 0;
    int interpOld_ = 0;
    int peakShiftLeft_ = 0;
    int peakShiftRight_ = 0;
    float interpAngleOffset_ = 0.0f;
    bool holdInterpPair_ = false;
    std::array<int, 2> fixedHrirCell_{noHrir, noHrir};  ///< index into the direction table
    std::array<int, 2> fixedHrir_{noHrir, noHrir};      ///< an HRIR loaded for the pair alone
    std::array<int, 2> fixedDelay_{0, 0};
    std::array<int, 2> fixedLength_{0, 0};
    bool hasReverbLowPass_ = false;
    float earlyPresetGain_ = 1.0f;

    // Convolution and output.
    std::vector<WindowRing> rings_;  ///< one, or two with fading
    std::vector<PartitionedResponse> response_;
    int ringPosition_ = 0;
    bool crossfadeBlock_ = false;
    Pairs firstOut_;
    Pairs secondOut_;
};

}  // namespace tessaly::reference
