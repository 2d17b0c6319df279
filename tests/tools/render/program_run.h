// Runs a built program and keeps what it says.
#pragma once

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

}  // namespace tessaly
