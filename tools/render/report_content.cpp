// Paths, responses and remarks of a scene for its report.
#include "render/report_content.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "render/report_parameters.h"

namespace tessaly {

namespace {

constexpr std::size_t mostResponses = 4;
constexpr double finestPathStep = 0.02;  // seconds
constexpr double mostPathPoints = 400.0;

ReportPath emptyPath(const std::string& name, double duration, double length) {
    ReportPath path;
    path.name = name;
    const double step = std::max(finestPathStep, duration / mostPathPoints);
    for (double seconds = 0.0; seconds < length; seconds += step) {
        path.times.push_back(seconds);
    }
    path.times.push_back(length);
    return path;
}

ReportPath sourcePath(const SceneSource& source, double duration, double length) {
    ReportPath path = emptyPath(source.name, duration, length);
    for (const double seconds : path.times) {
        path.positions.push_back(positionAt(source.path, seconds, duration));
    }
    return path;
}

ReportPath listenerPath(const SceneListener& listener, double duration, double length) {
    ReportPath path = emptyPath("listener", duration, length);
    for (const double seconds : path.times) {
        const Pose pose = listenerAt(listener, seconds);
        path.positions.push_back(pose.position);
        path.headings.push_back(pose.yaw);
    }
    return path;
}

}  // namespace

std::vector<ReportResponse> measureForReport(const PluginLibrary& library,
                                             const std::filesystem::path& dataDirectory,
                                             const Scene& scene,
                                             double duration,
                                             const std::function<void()>& onBlock) {
    std::vector<ReportResponse> responses;
    const double middle = 0.5 * duration;
    for (std::size_t i = 0; i < std::min(scene.sources.size(), mostResponses); ++i) {
        MeasuredResponse measured =
            measureResponse(library, dataDirectory, scene, duration, i, middle, onBlock);
        if (!measured.left.empty()) {
            responses.push_back({fmt::format("{} at {:.1f} s", scene.sources[i].name, middle),
                                 std::move(measured.left), std::move(measured.right)});
        }
    }
    return responses;
}

ReportEntry reportEntry(const Scene& scene,
                        double duration,
                        SceneResult result,
                        std::vector<ReportResponse> responses) {
    ReportEntry entry;
    entry.title = scene.title;
    entry.description = scene.description;
    entry.sampleRate = scene.sampleRate;
    const double length = static_cast<double>(result.stereo.size() / 2) / scene.sampleRate;
    entry.stereo = std::move(result.stereo);
    for (const SceneSource& source : scene.sources) {
        entry.sources.push_back(sourcePath(source, duration, length));
    }
    entry.listener = listenerPath(scene.listener, duration, length);
    entry.responses = std::move(responses);
    entry.parameters = reportParameters(scene, duration);
    entry.remarks = std::move(result.warnings);
    return entry;
}

}  // namespace tessaly
