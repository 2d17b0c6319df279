// One line of progress on a terminal, nothing in a pipe.
#pragma once

#include <cstdio>
#include <string>

namespace tessaly::data {

/// Shows a stage and its percentage in place. Silent if the stream is no terminal.
class Progress {
public:
    explicit Progress(std::FILE* stream);
    Progress(const Progress&) = delete;
    Progress& operator=(const Progress&) = delete;
    ~Progress();

    /// Starts a stage of `steps` steps.
    void stage(const std::string& name, std::size_t steps);
    void step();
    /// Takes the line away, so that other lines can follow.
    void finish();

private:
    void show(int percent);

    std::FILE* stream_;
    bool enabled_;
    std::string name_;
    std::size_t steps_ = 0;
    std::size_t done_ = 0;
    int shown_ = -1;
};

}  // namespace tessaly::data
