// Rendering of several scenes at a time, with their reports.
#pragma once

#include <cstddef>
#include <functional>
#include <string>
#include <vector>

#include "render/options.h"
#include "render/scene_renderer.h"
#include "report/report.h"
#include "scene/scene.h"

namespace tessaly {

/// One scene to render, and what comes of it.
struct Rendering {
    Scene scene;
    SceneInputs inputs;
    SceneResult result;
    std::vector<ReportResponse> responses;  ///< if a report is wanted
};

/// Renders all on all cores, each with process-wide state of its own, quietly, with progress. The
/// library's last log line is added to a failure.
/// @param finished  called for each once its result is there, on the thread that rendered it
/// @throws std::runtime_error with one line, Interrupted
void renderAll(const RenderOptions& options,
               std::vector<Rendering>& renderings,
               const std::function<void(std::size_t)>& finished);

/// Page of all renderings; takes their sounds.
Report reportOf(std::string title, std::string introduction, std::vector<Rendering>&& renderings);

}  // namespace tessaly
