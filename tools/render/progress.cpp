// Progress line, rewritten in place about ten times a second.
#include "render/progress.h"

#include <fmt/format.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <numeric>
#include <utility>

namespace tessaly {

namespace {

constexpr std::chrono::milliseconds between(100);

void writeAll(int descriptor, const std::string& text) {
    // A terminal that does not take the line is no reason to stop.
    [[maybe_unused]] const ssize_t ignored = write(descriptor, text.data(), text.size());
}

}  // namespace

Progress::Progress(int descriptor, std::string task)
    : terminal(descriptor),
      shown(isatty(descriptor) == 1),
      taskName(std::move(task)),
      started(Clock::now()),
      lastLine(started) {}

Progress::~Progress() {
    if (shown) {
        writeAll(terminal, "\r\033[K");
    }
}

void Progress::update(double fraction) {
    const Clock::time_point now = Clock::now();
    if (!shown || now - lastLine < between) {
        return;
    }
    lastLine = now;
    const std::chrono::duration<double> elapsed = now - started;
    writeAll(terminal, "\r" + progressLine(taskName, fraction, elapsed.count()) + "\033[K");
}

void JointProgress::update(std::size_t piece, double fraction) {
    const std::lock_guard lock(guard);
    done[piece] = fraction;
    line.update(std::accumulate(done.begin(), done.end(), 0.0) / static_cast<double>(done.size()));
}

std::string progressLine(const std::string& task, double fraction, double elapsedSeconds) {
    const double done = std::clamp(fraction, 0.0, 1.0);
    std::string line = fmt::format("{} {:3.0f} %", task, std::floor(100.0 * done));
    if (done > 0.0) {
        const double left = std::ceil(elapsedSeconds * (1.0 - done) / done);
        line += left < 120.0 ? fmt::format(", {:.0f} s left", left)
                             : fmt::format(", {:.0f} min left", std::ceil(left / 60.0));
    }
    return line;
}

}  // namespace tessaly
