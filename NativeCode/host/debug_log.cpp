// Where the standard output log goes on each platform.
#include "host/debug_log.h"

#include <cstdio>
#include <memory>
#include <vector>

#include "base/log.h"

#if defined(_WIN32)
#define WIN32_LEAN_AND_MEAN
#include <windows.h>
#elif defined(__ANDROID__)
#include <android/log.h>
#endif

namespace tessaly {

namespace {

void writeToPlatformLog(const std::string& text) {
#if defined(_WIN32)
    OutputDebugStringA(text.c_str());
#elif defined(__ANDROID__)
    __android_log_write(ANDROID_LOG_INFO, "Tessaly", text.c_str());
#else
    std::fwrite(text.data(), 1, text.size(), stderr);
    std::fflush(stderr);
#endif
}

/// Written by tests only.
constinit DebugTextSink debugTextSink = &writeToPlatformLog;

/// Every buffer that was ever installed. Never emptied and never destroyed: the stream is flushed
/// once more when the library goes, and a thread may still be writing into a replaced one.
std::vector<std::unique_ptr<windowsbuf>>& installedBuffers() {
    static auto* buffers = new std::vector<std::unique_ptr<windowsbuf>>;
    return *buffers;
}

}  // namespace

void setDebugTextSink(DebugTextSink sink) noexcept {
    debugTextSink = sink != nullptr ? sink : &writeToPlatformLog;
}

void installDebugLog() {
    auto& buffers = installedBuffers();
    buffers.push_back(std::make_unique<windowsbuf>());
    std::cout.rdbuf(buffers.back().get());
    std::cout.clear();
}

windowsbuf::windowsbuf() { resetPutArea(); }

windowsbuf::~windowsbuf() = default;

void windowsbuf::resetPutArea() {
    // One less than the array, so that an end-of-file marker finds room even in a full area.
    setp(buffer.data(), buffer.data() + buffer.size() - 1);
}

windowsbuf::int_type windowsbuf::overflow(int_type c) {
    const bool endOfFile = traits_type::eq_int_type(c, traits_type::eof());
    if (endOfFile) {
        *pptr() = traits_type::to_char_type(traits_type::eof());
        if (pptr() < epptr()) {
            pbump(1);
        }
    }
    if (sync() != 0) {
        return traits_type::eof();
    }
    return endOfFile ? 0 : c;
}

int windowsbuf::sync() {
    if (pptr() > pbase()) {
        debugTextSink(std::string(pbase(), pptr()));
        resetPutArea();
    }
    return 0;
}

}  // namespace tessaly
