// Terminal progress line.
#include "data/progress.h"

#include <fmt/format.h>

#if defined(_WIN32)
#include <io.h>
#else
#include <unistd.h>
#endif

namespace tessaly::data {

namespace {

bool isTerminal(std::FILE* stream) {
#if defined(_WIN32)
    return _isatty(_fileno(stream)) != 0;
#else
    return isatty(fileno(stream)) != 0;
#endif
}

constexpr const char* clearLine = "\r\033[K";

}  // namespace

Progress::Progress(std::FILE* stream) : stream_(stream), enabled_(isTerminal(stream)) {}

Progress::~Progress() { finish(); }

void Progress::finish() {
    if (enabled_ && shown_ >= 0) {
        std::fputs(clearLine, stream_);
        std::fflush(stream_);
    }
    shown_ = -1;
}

void Progress::stage(const std::string& name, std::size_t steps) {
    name_ = name;
    steps_ = steps;
    done_ = 0;
    show(0);
}

void Progress::step() {
    ++done_;
    const int percent = steps_ == 0 ? 100 : static_cast<int>(100 * done_ / steps_);
    if (percent != shown_) {
        show(percent);
    }
}

void Progress::show(int percent) {
    shown_ = percent;
    if (enabled_) {
        const std::string line = fmt::format("{}{} {:3d} %", clearLine, name_, percent);
        std::fputs(line.c_str(), stream_);
        std::fflush(stream_);
    }
}

}  // namespace tessaly::data
