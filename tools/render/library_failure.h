// What the error state of an engine's process means to a user.
#pragma once

namespace tessaly {

/// @throws std::runtime_error with one line unless the state is good
/// @param errorState  as the library's GetErrorState tells it
void checkErrorState(int errorState);

}  // namespace tessaly
