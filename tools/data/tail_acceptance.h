// The figures that stored tails must keep.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "data/figure_table.h"
#include "data/tail_analysis.h"
#include "data/tail_builder.h"

namespace tessaly::data {

/// Diffuse coherence of a set for the directions that each kind of room draws from.
class SetCoherence {
public:
    explicit SetCoherence(const HrirSet& hrirs);
    const Coherence& of(const TailDesign& design) const;

private:
    Coherence enclosed_;
    Coherence corridor_;
    Coherence open_;
};

/// One tail's measures.
struct TailMeasures {
    const TailDesign* design = nullptr;
    int sampleRate = 0;
    bool measured = false;  ///< a user's own: only what every tail must keep is limited
    TailSamplesCheck samples;
    OctaveTimes times{};
    OctaveTimes designed{};
    EchoDensity density;
    Coherence coherence{};           ///< less the set's
    std::size_t coherenceCount = 0;  ///< octaves below half the rate
    double wantedDirectToTail = 0.0;
    double directToTail = 0.0;  ///< dB; NaN without a set
    double directToRoom = 0.0;  ///< dB, reflections and tail; NaN without a set
    std::vector<Figure> figures;
};

/// @param hrirs   set of the rate, or null: levels and coherence are left out
/// @param origin  where the tail comes from
TailMeasures measureTail(const TailDesign& design,
                         const std::vector<float>& tail,
                         int sampleRate,
                         const HrirSet* hrirs,
                         const SetCoherence* coherence,
                         const TailOptions& options,
                         const TailOrigin& origin);

/// Least and greatest value of each figure over all tails.
FigureColumn summariseTails(const std::string& title, const std::vector<TailMeasures>& tails);

/// A line a preset: decay times, density, coherence, levels.
std::string tailTable(const std::vector<TailMeasures>& tails);

}  // namespace tessaly::data
