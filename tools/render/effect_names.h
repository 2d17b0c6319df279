// Names by which the renderer knows the library's effects and those parameters it sets itself.
#pragma once

namespace tessaly {

inline constexpr const char* spatializerName = "Tessaly Engine";  ///< on each source
inline constexpr const char* reverbName = "Tessaly Reverb";       ///< on each return

inline constexpr const char* roomParameter = "Room Selection";
inline constexpr const char* reverbIdParameter = "ReverbID";

// Sends are told by these three in turn: the count, then for each its target and level.
inline constexpr const char* sendCountParameter = "Reverb Size";
inline constexpr const char* sendTargetParameter = "Reverb ID";
inline constexpr const char* sendLevelParameter = "Reverb Send";

}  // namespace tessaly
