// Pending files, WAV writing, text writing.
#include "render/output_file.h"

#include <fcntl.h>
#include <sndfile.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <utility>

namespace tessaly {

namespace {

struct CloseFile {
    void operator()(SNDFILE* file) const noexcept { sf_close(file); }
};

struct CloseStream {
    void operator()(std::FILE* file) const noexcept { std::fclose(file); }
};

int soundFormat(SampleFormat format) {
    switch (format) {
        case SampleFormat::Float:
            return SF_FORMAT_WAV | SF_FORMAT_FLOAT;
        case SampleFormat::Int16:
            return SF_FORMAT_WAV | SF_FORMAT_PCM_16;
        case SampleFormat::Int24:
            return SF_FORMAT_WAV | SF_FORMAT_PCM_24;
    }
    return SF_FORMAT_WAV | SF_FORMAT_FLOAT;
}

std::runtime_error cannotWrite(const std::filesystem::path& file, const std::string& reason) {
    return std::runtime_error("cannot write " + file.string() + ": " + reason);
}

}  // namespace

PendingFile::PendingFile(const std::filesystem::path& finalFile)
    : place(finalFile), passing(finalFile.string() + ".part-" + std::to_string(getpid())) {
    std::error_code ignored;
    if (std::filesystem::is_directory(place, ignored)) {
        throw cannotWrite(place, "it is a directory");
    }
    const int descriptor = open(passing.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666);
    if (descriptor < 0) {
        throw cannotWrite(place, std::strerror(errno));
    }
    close(descriptor);
}

PendingFile::~PendingFile() {
    if (pending) {
        std::error_code ignored;
        std::filesystem::remove(passing, ignored);
    }
}

void PendingFile::complete() {
    std::error_code failure;
    std::filesystem::rename(passing, place, failure);
    if (failure) {
        throw cannotWrite(place, failure.message());
    }
    pending = false;
}

NewDirectory::NewDirectory(std::filesystem::path wanted) : place(std::move(wanted)) {
    if (!place.has_filename()) {
        place = place.parent_path();  // a slash at the end
    }
    std::error_code failure;
    for (std::filesystem::path one = place; !one.empty() && !std::filesystem::exists(one, failure);
         one = one.parent_path()) {
        made.push_back(one);
    }
    std::filesystem::create_directories(place, failure);
    if (failure || !std::filesystem::is_directory(place, failure)) {
        removeEmpty();
        throw cannotWrite(place, failure ? failure.message() : "it is no directory");
    }
}

NewDirectory::~NewDirectory() { removeEmpty(); }

void NewDirectory::removeEmpty() noexcept {
    for (const std::filesystem::path& one : made) {
        std::error_code ignored;
        std::filesystem::remove(one, ignored);  // only if it is empty
    }
}

std::size_t writeWav(const PendingFile& file,
                     std::span<const float> stereo,
                     int sampleRate,
                     SampleFormat format) {
    SF_INFO info{};
    info.channels = 2;
    info.samplerate = sampleRate;
    info.format = soundFormat(format);
    std::unique_ptr<SNDFILE, CloseFile> opened(
        sf_open(file.passingName().c_str(), SFM_WRITE, &info));
    if (!opened) {
        throw cannotWrite(file.finalName(), sf_strerror(nullptr));
    }
    // The peak chunk carries the time of writing: equal sounds would give different files.
    sf_command(opened.get(), SFC_SET_ADD_PEAK_CHUNK, nullptr, SF_FALSE);
    // Without clipping, a value beyond full scale would wrap round in the integer formats.
    sf_command(opened.get(), SFC_SET_CLIPPING, nullptr, SF_TRUE);
    std::size_t cut = 0;
    if (format != SampleFormat::Float) {
        cut = static_cast<std::size_t>(std::count_if(stereo.begin(), stereo.end(),
                                                     [](float x) { return std::abs(x) > 1.0f; }));
    }
    const auto frames = static_cast<sf_count_t>(stereo.size() / 2);
    errno = 0;
    const bool written = sf_writef_float(opened.get(), stereo.data(), frames) == frames;
    if (!written || sf_error(opened.get()) != SF_ERR_NO_ERROR) {
        throw cannotWrite(file.finalName(),
                          errno != 0 ? std::strerror(errno) : sf_strerror(opened.get()));
    }
    if (sf_close(opened.release()) != 0) {
        throw cannotWrite(file.finalName(),
                          errno != 0 ? std::strerror(errno) : "the file cannot be completed");
    }
    return cut;
}

void writeText(const PendingFile& file, const std::string& text) {
    std::unique_ptr<std::FILE, CloseStream> stream(std::fopen(file.passingName().c_str(), "wb"));
    if (!stream || std::fwrite(text.data(), 1, text.size(), stream.get()) != text.size() ||
        std::fflush(stream.get()) != 0) {
        throw cannotWrite(file.finalName(), std::strerror(errno));
    }
    if (std::fclose(stream.release()) != 0) {
        throw cannotWrite(file.finalName(), std::strerror(errno));
    }
}

}  // namespace tessaly
