// One library a scene, spread over the cores.
#include "render/rendering.h"

#include <fmt/format.h>

#include <stdexcept>
#include <utility>

#include "data/worker_pool.h"
#include "render/interruption.h"
#include "render/library_log.h"
#include "render/progress.h"
#include "render/report_content.h"

namespace tessaly {

namespace {

constexpr double renderingShare = 0.8;  // of the work, where responses are measured too

void renderWith(const PluginLibrary& library,
                const RenderOptions& options,
                Rendering& rendering,
                const std::function<void(double)>& progress) {
    const bool measures = !options.report.empty();
    rendering.result = renderScene(library, options.dataDirectory, rendering.scene,
                                   rendering.inputs, [&](double fraction) {
                                       stopIfInterrupted();
                                       progress(measures ? renderingShare * fraction : fraction);
                                   });
    if (measures) {
        rendering.responses =
            measureForReport(library, options.dataDirectory, rendering.scene,
                             rendering.inputs.duration, [] { stopIfInterrupted(); });
    }
    progress(1.0);
}

// One scene alone takes the library as it lies there.
PluginLibrary libraryFor(const std::filesystem::path& file, bool alone) {
    return alone ? PluginLibrary(file) : PluginLibrary::privateCopy(file);
}

}  // namespace

void renderAll(const RenderOptions& options,
               std::vector<Rendering>& renderings,
               const std::function<void(std::size_t)>& finished) {
    LibraryLog log(options.verbose);
    try {
        const std::filesystem::path file = PluginLibrary::locate(options.library);
        JointProgress progress(log.ownError(), "rendering", renderings.size());
        data::forEachParallel(renderings.size(), [&](std::size_t i) {
            const PluginLibrary library = libraryFor(file, renderings.size() == 1);
            renderWith(library, options, renderings[i],
                       [&](double fraction) { progress.update(i, fraction); });
            finished(i);
        });
    } catch (const std::runtime_error& failure) {
        const std::string line = log.lastLine();
        throw std::runtime_error(line.empty() ? failure.what()
                                              : fmt::format("{} (the library's last log line: {})",
                                                            failure.what(), line));
    }
}

Report reportOf(std::string title, std::string introduction, std::vector<Rendering>&& renderings) {
    Report report;
    report.title = std::move(title);
    report.introduction = std::move(introduction);
    for (Rendering& rendering : renderings) {
        report.entries.push_back(reportEntry(rendering.scene, rendering.inputs.duration,
                                             std::move(rendering.result),
                                             std::move(rendering.responses)));
    }
    return report;
}

}  // namespace tessaly
