// Ends the work on a signal in good order: what is half done is removed on the way out.
#pragma once

#include <exception>

namespace tessaly {

/// Thrown through the work after a signal.
class Interrupted : public std::exception {};

/// From now on the signals that end a program only set a mark.
void watchForInterruption();

/// Any thread. @throws Interrupted after a signal
void stopIfInterrupted();

}  // namespace tessaly
