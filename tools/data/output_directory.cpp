// Temporary names, flush, rename.
#include "data/output_directory.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>
#include <memory>

#if defined(_WIN32)
#include <io.h>
#include <process.h>
#else
#include <unistd.h>
#endif

#include "data/data_error.h"

namespace tessaly::data {

namespace {

namespace fs = std::filesystem;

int flushToDisk(std::FILE* file) {
    if (std::fflush(file) != 0) {
        return -1;
    }
#if defined(_WIN32)
    return _commit(_fileno(file));
#else
    return fsync(fileno(file));
#endif
}

fs::path temporaryName(const fs::path& directory, const std::string& name) {
#if defined(_WIN32)
    const int process = _getpid();
#else
    const int process = getpid();
#endif
    return directory / fmt::format(".{}.{}.tmp", name, process);
}

void writeFile(const fs::path& path, const std::string& bytes) {
    struct Close {
        void operator()(std::FILE* file) const { std::fclose(file); }
    };
    const std::unique_ptr<std::FILE, Close> file(std::fopen(path.string().c_str(), "wb"));
    if (file == nullptr || std::fwrite(bytes.data(), 1, bytes.size(), file.get()) != bytes.size() ||
        flushToDisk(file.get()) != 0) {
        throw DataError("cannot write into {}: {}; expected a writable directory",
                        path.parent_path().string(), std::strerror(errno));
    }
}

}  // namespace

OutputDirectory::OutputDirectory(fs::path directory) : directory_(std::move(directory)) {
    std::error_code error;
    for (fs::path part = directory_; !part.empty() && !fs::exists(part, error);
         part = part.parent_path()) {
        created_.insert(created_.begin(), part);
    }
    fs::create_directories(directory_, error);
    const bool isDirectory = fs::is_directory(directory_);
    if (isDirectory) {
        const fs::path trial = temporaryName(directory_, "trial");
        try {
            writeFile(trial, "");
        } catch (const DataError&) {
            fs::remove(trial, error);
            removeTemporaries();
            throw;
        }
        fs::remove(trial, error);
        return;
    }
    removeTemporaries();
    throw DataError("{} is no directory and cannot be made one: {}", directory_.string(),
                    error ? error.message() : "a file of this name exists");
}

OutputDirectory::~OutputDirectory() { removeTemporaries(); }

void OutputDirectory::removeTemporaries() noexcept {
    std::error_code ignored;
    for (const File& file : files_) {
        if (!file.temporary.empty()) {
            fs::remove(file.temporary, ignored);
        }
    }
    if (!committed_) {
        // Only empty directories go: someone may have put files there meanwhile.
        std::for_each(created_.rbegin(), created_.rend(),
                      [&ignored](const fs::path& path) { fs::remove(path, ignored); });
    }
}

void OutputDirectory::add(const std::string& name, std::string bytes) {
    files_.push_back({name, std::move(bytes), {}, {}});
}

void OutputDirectory::commit() {
    for (File& file : files_) {
        if (fs::is_directory(directory_ / file.name)) {
            throw DataError("{} is a directory, expected a file or nothing",
                            (directory_ / file.name).string());
        }
        file.temporary = temporaryName(directory_, file.name);
        writeFile(file.temporary, file.bytes);
    }
    // What is replaced steps aside until all are in place.
    for (std::size_t i = 0; i < files_.size(); ++i) {
        File& file = files_[i];
        const fs::path place = directory_ / file.name;
        std::error_code error;
        if (fs::exists(place, error)) {
            file.former = temporaryName(directory_, fmt::format("{}.former{}", file.name, i));
            fs::rename(place, file.former, error);
            if (error) {
                file.former.clear();
            }
        }
        if (!error) {
            fs::rename(file.temporary, place, error);
        }
        if (error) {
            putFormerFilesBack();
            throw DataError("cannot put {} into {}: {}", file.name, directory_.string(),
                            error.message());
        }
        file.temporary.clear();
    }
    for (const File& file : files_) {
        std::error_code ignored;
        if (!file.former.empty()) {
            fs::remove(file.former, ignored);
        }
    }
    committed_ = true;
}

/// The last one replaced first: a name may have been given twice.
void OutputDirectory::putFormerFilesBack() noexcept {
    std::for_each(files_.rbegin(), files_.rend(), [this](const File& file) {
        std::error_code ignored;
        if (file.temporary.empty()) {
            fs::remove(directory_ / file.name, ignored);
        }
        if (!file.former.empty()) {
            fs::rename(file.former, directory_ / file.name, ignored);
        }
    });
}

std::string readIfPresent(const fs::path& path) {
    std::error_code ignored;
    if (!fs::exists(path, ignored)) {
        return "";
    }
    std::ifstream file(path, std::ios::binary);
    std::string bytes((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    if (!file.is_open() || file.bad() || fs::is_directory(path, ignored)) {
        throw DataError("{} cannot be read", path.string());
    }
    return bytes;
}

}  // namespace tessaly::data
