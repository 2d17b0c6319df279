// Catches what the standard output log hands to the debugger, call by call.
#pragma once

#include <algorithm>
#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "host/debug_log.h"

namespace tessaly::test {

/// Takes all debug texts while it lives. One at a time.
class DebugTextCapture {
public:
    DebugTextCapture() {
        calls().clear();
        setDebugTextSink([](const std::string& text) { calls().push_back(text); });
    }
    ~DebugTextCapture() { setDebugTextSink(nullptr); }
    DebugTextCapture(const DebugTextCapture&) = delete;
    DebugTextCapture& operator=(const DebugTextCapture&) = delete;

    /// One entry a call of the platform's debugger output.
    static std::vector<std::string>& calls() {
        static std::vector<std::string> texts;
        return texts;
    }

    static std::size_t count(std::string_view part) {
        return static_cast<std::size_t>(std::count_if(
            calls().begin(), calls().end(),
            [part](const std::string& text) { return text.find(part) != std::string::npos; }));
    }
};

}  // namespace tessaly::test
