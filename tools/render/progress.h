// One line of progress with the time left, on a terminal only.
#pragma once

#include <chrono>
#include <cstddef>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

namespace tessaly {

class Progress {
public:
    /// @param descriptor  where to write; nothing is written if it is no terminal
    /// @param task        what is going on, e.g. "rendering"
    Progress(int descriptor, std::string task);

    /// Wipes the line.
    ~Progress();
    Progress(const Progress&) = delete;
    Progress& operator=(const Progress&) = delete;

    /// @param fraction  done, 0 to 1; may be called as often as one likes
    void update(double fraction);

private:
    using Clock = std::chrono::steady_clock;

    int terminal;
    bool shown;
    std::string taskName;
    Clock::time_point started;
    Clock::time_point lastLine;
};

/// One line for several pieces of work that go on at once. Any thread.
class JointProgress {
public:
    JointProgress(int descriptor, std::string task, std::size_t pieces)
        : line(descriptor, std::move(task)), done(pieces) {}

    /// @param fraction  of this piece done, 0 to 1
    void update(std::size_t piece, double fraction);

private:
    std::mutex guard;
    Progress line;
    std::vector<double> done;
};

/// Text of the line, e.g. "rendering  43 %, 12 s left".
std::string progressLine(const std::string& task, double fraction, double elapsedSeconds);

}  // namespace tessaly
