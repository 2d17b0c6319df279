// tessaly-render: moving sources through the built library, into sounds, pictures and pages.
#include <fmt/format.h>

#include <cstdio>
#include <exception>
#include <filesystem>
#include <new>
#include <system_error>

#include "render/interruption.h"
#include "render/options.h"
#include "render/render_commands.h"

namespace tessaly {
namespace {

constexpr int usageFailure = 2;
constexpr int workFailure = 1;
constexpr int interruptedFailure = 130;

std::filesystem::path defaultDataDirectory() {
    // Programs lie in build/<preset>/bin, the data in build/data.
    std::error_code ignored;
    const std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", ignored);
    return (program.parent_path() / ".." / ".." / "data").lexically_normal();
}

void dispatch(const RenderOptions& options) {
    if (options.list) {
        printListing(options);
    } else if (!options.scenes.empty()) {
        renderScenes(options);
    } else if (options.everyRoom) {
        renderEveryRoom(options);
    } else {
        renderOneSound(options);
    }
}

int run(int argumentCount, char** arguments) {
    try {
        dispatch(parseOptions(argumentCount, arguments, defaultDataDirectory()));
        return 0;
    } catch (const HelpRequest& help) {
        fmt::print("{}", help.what());
        return 0;
    } catch (const UsageError& failure) {
        fmt::print(stderr, "tessaly-render: {}\n", failure.what());
        return usageFailure;
    } catch (const Interrupted&) {
        fmt::print(stderr, "tessaly-render: interrupted, nothing written\n");
        return interruptedFailure;
    } catch (const std::bad_alloc&) {
        fmt::print(stderr, "tessaly-render: out of memory\n");
        return workFailure;
    } catch (const std::exception& failure) {
        fmt::print(stderr, "tessaly-render: {}\n", failure.what());
        return workFailure;
    }
}

}  // namespace
}  // namespace tessaly

int main(int argumentCount, char** arguments) {
    tessaly::watchForInterruption();
    return tessaly::run(argumentCount, arguments);
}
