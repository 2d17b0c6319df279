// Redirection of standard error into memory.
#include "render/library_log.h"

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>

#if defined(__SANITIZE_ADDRESS__)
#define TESSALY_SANITIZER_REPORTS 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define TESSALY_SANITIZER_REPORTS 1
#endif
#endif

#if defined(TESSALY_SANITIZER_REPORTS)
// NOLINTNEXTLINE(bugprone-reserved-identifier): the sanitizer's name
extern "C" void __sanitizer_set_report_fd(void* descriptor);
#endif

namespace tessaly {

#if defined(TESSALY_SANITIZER_REPORTS)
namespace {

// The sanitizer takes a file descriptor in the shape of a pointer.
void sendReportsTo(int descriptor) {
    // NOLINTNEXTLINE(performance-no-int-to-ptr)
    __sanitizer_set_report_fd(reinterpret_cast<void*>(static_cast<std::intptr_t>(descriptor)));
}

}  // namespace
#endif

LibraryLog::LibraryLog(bool verbose) : own(STDERR_FILENO) {
    if (verbose) {
        return;
    }
    kept = memfd_create("library-log", MFD_CLOEXEC);
    const int copy = dup(STDERR_FILENO);
    if (kept < 0 || copy < 0 || dup2(kept, STDERR_FILENO) < 0) {
        // A system without the call shows the lines: noise, not a failure.
        close(kept);
        close(copy);
        kept = -1;
        return;
    }
    own = copy;
#if defined(TESSALY_SANITIZER_REPORTS)
    sendReportsTo(own);
#endif
}

LibraryLog::~LibraryLog() {
    if (kept >= 0) {
        std::fflush(stderr);
        dup2(own, STDERR_FILENO);
#if defined(TESSALY_SANITIZER_REPORTS)
        sendReportsTo(STDERR_FILENO);
#endif
        close(own);
        close(kept);
    }
}

std::string LibraryLog::lastLine() const {
    if (kept < 0) {
        return "";
    }
    constexpr off_t tail = 1024;
    const off_t end = lseek(kept, 0, SEEK_END);
    const off_t begin = std::max<off_t>(end - tail, 0);
    std::string text(static_cast<std::size_t>(std::max<off_t>(end - begin, 0)), '\0');
    const ssize_t got = pread(kept, text.data(), text.size(), begin);
    text.resize(static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
    while (!text.empty() && (text.back() == '\n' || text.back() == ' ')) {
        text.pop_back();
    }
    const std::size_t newline = text.rfind('\n');
    return newline == std::string::npos ? text : text.substr(newline + 1);
}

}  // namespace tessaly
