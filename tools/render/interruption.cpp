// The mark that a signal leaves.
#include "render/interruption.h"

#include <atomic>
#include <csignal>

namespace tessaly {

namespace {

std::atomic<bool> interrupted{false};
static_assert(std::atomic<bool>::is_always_lock_free, "set by a signal handler");

extern "C" void onSignal(int) { interrupted = true; }

}  // namespace

void watchForInterruption() {
    std::signal(SIGINT, onSignal);
    std::signal(SIGTERM, onSignal);
    std::signal(SIGHUP, onSignal);
}

void stopIfInterrupted() {
    if (interrupted) {
        throw Interrupted();
    }
}

}  // namespace tessaly
