// The process-wide error state.
#include "base/ess_error.h"

namespace tessaly {

constinit int essError = essErrorNone;

}  // namespace tessaly
