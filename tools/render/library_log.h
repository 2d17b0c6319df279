// Keeps the library's log lines off the terminal and at hand for a failure.
#pragma once

#include <string>

namespace tessaly {

/// The library writes its log to standard error. While one of these is alive and not verbose, what
/// reaches standard error goes to memory; our own lines go through ownError().
class LibraryLog {
public:
    explicit LibraryLog(bool verbose);
    ~LibraryLog();
    LibraryLog(const LibraryLog&) = delete;
    LibraryLog& operator=(const LibraryLog&) = delete;

    /// File descriptor of the real standard error.
    int ownError() const noexcept { return own; }

    /// The last line kept that is not blank, empty if there is none.
    std::string lastLine() const;

private:
    int own;
    int kept = -1;
};

}  // namespace tessaly
