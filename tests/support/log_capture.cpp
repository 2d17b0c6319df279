// Catches what is written to the two log streams, line by line and in the order written.
#include "support/log_capture.h"

#include <algorithm>
#include <iostream>

namespace tessaly::test {

/// Unbuffered: every character is recorded at once, so the order of both streams is kept.
class LogCapture::Buffer : public std::streambuf {
public:
    Buffer(LogCapture& owner, LogStream stream) : owner_(owner), stream_(stream) {}

protected:
    int_type overflow(int_type character) override {
        if (!traits_type::eq_int_type(character, traits_type::eof())) {
            owner_.put(stream_, traits_type::to_char_type(character));
        }
        return traits_type::not_eof(character);
    }
    int sync() override {
        ++owner_.flushes_[indexOf(stream_)];
        return 0;
    }

private:
    LogCapture& owner_;
    LogStream stream_;
};

LogCapture::LogCapture() {
    buffers_[0] = std::make_unique<Buffer>(*this, LogStream::output);
    buffers_[1] = std::make_unique<Buffer>(*this, LogStream::error);
    replaced_[0] = std::cout.rdbuf(buffers_[0].get());
    replaced_[1] = std::cerr.rdbuf(buffers_[1].get());
}

LogCapture::~LogCapture() {
    std::cout.rdbuf(replaced_[0]);
    std::cerr.rdbuf(replaced_[1]);
}

void LogCapture::reattach() {
    std::cout.rdbuf(buffers_[0].get());
    std::cerr.rdbuf(buffers_[1].get());
}

std::size_t LogCapture::count(LogStream stream, std::string_view part) const {
    return static_cast<std::size_t>(
        std::count_if(lines_.begin(), lines_.end(), [&](const LogLine& line) {
            return line.stream == stream && line.text.find(part) != std::string::npos;
        }));
}

void LogCapture::clear() {
    text_ = {};
    pending_ = {};
    flushes_ = {};
    lines_.clear();
}

std::vector<std::string> LogCapture::linesOf(LogStream stream) const {
    std::vector<std::string> found;
    for (const LogLine& line : lines_) {
        if (line.stream == stream) {
            found.push_back(line.text);
        }
    }
    return found;
}

void LogCapture::put(LogStream stream, char character) {
    const std::size_t index = indexOf(stream);
    text_[index] += character;
    if (character == '\n') {
        lines_.push_back({stream, pending_[index]});
        pending_[index].clear();
    } else {
        pending_[index] += character;
    }
}

}  // namespace tessaly::test
