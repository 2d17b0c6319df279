// Catches what is written to the two log streams, line by line and in the order written.
#pragma once

#include <array>
#include <cstddef>
#include <iosfwd>
#include <memory>
#include <streambuf>
#include <string>
#include <string_view>
#include <vector>

namespace tessaly::test {

/// Which stream a line went to.
enum class LogStream { output, error };

/// One finished line, without its end-of-line.
struct LogLine {
    LogStream stream;
    std::string text;

    bool operator==(const LogLine&) const = default;
};

/// Puts its own buffers behind std::cout and std::cerr and gives the old ones back when it goes.
class LogCapture {
public:
    LogCapture();
    ~LogCapture();
    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;

    /// Puts the buffers in place again, after something else has replaced them: a new instance
    /// handler installs its own behind std::cout. What was replaced is not restored later.
    void reattach();

    /// All text of one stream so far, end-of-lines included.
    const std::string& output() const { return text_[0]; }
    const std::string& error() const { return text_[1]; }

    /// Finished lines of both streams in the order of their ends.
    const std::vector<LogLine>& lines() const { return lines_; }
    /// Finished lines of one stream.
    std::vector<std::string> outputLines() const { return linesOf(LogStream::output); }
    std::vector<std::string> errorLines() const { return linesOf(LogStream::error); }
    /// How many lines of a stream hold `part`.
    std::size_t count(LogStream stream, std::string_view part) const;
    /// Flushes seen so far on a stream. Writing to std::cerr flushes std::cout as well, which is
    /// tied to it, and itself after every piece.
    int flushes(LogStream stream) const { return flushes_[indexOf(stream)]; }

    /// Forgets everything caught so far.
    void clear();

private:
    class Buffer;

    static std::size_t indexOf(LogStream stream) { return stream == LogStream::output ? 0 : 1; }
    std::vector<std::string> linesOf(LogStream stream) const;
    void put(LogStream stream, char character);

    std::array<std::string, 2> text_;
    std::array<std::string, 2> pending_;
    std::array<int, 2> flushes_{};
    std::vector<LogLine> lines_;
    std::array<std::unique_ptr<Buffer>, 2> buffers_;
    std::array<std::streambuf*, 2> replaced_{};
};

}  // namespace tessaly::test
