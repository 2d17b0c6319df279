// The engine's values that a handler writes live, before each block.
#pragma once

#include <array>

namespace tessaly {

/// Plain record owned by the engine. A room preset sets the cut-offs and wall distances at load;
/// the handler reads them once after a load and writes them from then on.
struct LiveControls {
    float reflectionLP_Fc = 20000.0f;   ///< Hz, low-pass of first-order reflections
    float reflectionLP2_Fc = 20000.0f;  ///< Hz, low-pass of second-order reflections
    float reverbLP_Fc = 20000.0f;       ///< Hz, low-pass of the tail; 20000 and above: none
    float roomSizeFactor = 1.0f;        ///< below 1 the tail is cut shorter; 0 keeps its first half
    bool bassBoost = false;             ///< run the low shelf on the input
    /// Metres: above, below, front, back, positive side, negative side; -1: no such wall.
    std::array<float, 6> roomDistances = {1.0f, 1.0f, 1.0f, 1.0f, 1.0f, 1.0f};

    bool operator==(const LiveControls&) const = default;
};

}  // namespace tessaly
