// The values that all effects of the process share.
#include "handler/process_state.h"

#include "base/process_lifetime.h"

namespace tessaly {

namespace {

ProcessLifetime<std::string> dataDirectory;

}  // namespace

std::string& bundleBasePath = *dataDirectory;
constinit bool assetPathSet = false;
constinit std::uint8_t bypass3DAudio = 0;
constinit std::array<float, 6> roomDistances = {1.0f, 1.0f, 1.0f, 1.0f, 1.0f, 1.0f};
constinit bool roomDistancesSet = false;
constinit int buffersizeSpat = 0;
constinit int buffersizeReverb = 0;
constinit std::int16_t handlerCount = 0;

}  // namespace tessaly
