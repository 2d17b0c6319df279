// What a report tells about a rendered scene.
#pragma once

#include <filesystem>
#include <functional>
#include <vector>

#include "minihost/plugin_library.h"
#include "render/scene_renderer.h"
#include "report/report.h"
#include "scene/scene.h"

namespace tessaly {

/// Responses of the first sources, four at most, in the middle of the scene.
/// @param library   the one that rendered the scene
/// @param duration  of the scene without its tail, seconds
/// @param onBlock   called before each block; may throw to stop
std::vector<ReportResponse> measureForReport(const PluginLibrary& library,
                                             const std::filesystem::path& dataDirectory,
                                             const Scene& scene,
                                             double duration,
                                             const std::function<void()>& onBlock);

/// One output of a report: paths over time, parameters as a table, warnings.
ReportEntry reportEntry(const Scene& scene,
                        double duration,
                        SceneResult result,
                        std::vector<ReportResponse> responses);

}  // namespace tessaly
