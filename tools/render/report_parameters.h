// All that a scene sets, as rows of a table.
#pragma once

#include <vector>

#include "report/report.h"
#include "scene/scene.h"

namespace tessaly {

/// Rows of the scene itself, its listener, each source and each return, in this order.
/// @param duration  of the scene without its tail, seconds
std::vector<ReportParameter> reportParameters(const Scene& scene, double duration);

}  // namespace tessaly
