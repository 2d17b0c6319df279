// The stream buffer that brings the standard output log to a debugger.
#pragma once

#include <array>
#include <cstddef>
#include <iosfwd>
#include <streambuf>
#include <string>

namespace tessaly {

/// Takes one flushed text, its end-of-line included.
using DebugTextSink = void (*)(const std::string& text);

/// Sends all further log texts to `sink`; null: to the platform's log, as from the start.
/// Only for tests.
void setDebugTextSink(DebugTextSink sink) noexcept;

/// Collects characters and hands them over as one text at each flush.
class windowsbuf : public std::streambuf {
public:
    windowsbuf();
    ~windowsbuf() override;

protected:
    /// Stores nothing but an end-of-file marker, as 0xFF, and flushes. The character that finds
    /// the area full is lost on purpose: a text of more than 127 characters arrives in pieces,
    /// one character missing at each seam, and readers of the log rely on that form.
    int_type overflow(int_type c) override;

    /// Hands the collected text over, if there is any. @return 0
    int sync() override;

private:
    static constexpr std::size_t bufferSize = 128;

    void resetPutArea();

    std::array<char, bufferSize> buffer{};
};

}  // namespace tessaly
