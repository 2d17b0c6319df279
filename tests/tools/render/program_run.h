// Runs a built program and keeps what it says.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace tessaly {

struct ProgramRun {
    int exitCode = -1;  ///< -1 if it did not end by itself
    std::string output;
    std::string errors;
};

/// Runs it without a shell and waits for its end.
ProgramRun runProgram(const std::string& program, const std::vector<std::string>& arguments);

/// Runs it, sends SIGTERM once `ready` says so, and waits for its end.
ProgramRun interruptProgram(const std::string& program,
                            const std::vector<std::string>& arguments,
                            const std::function<bool()>& ready);

}  // namespace tessaly
