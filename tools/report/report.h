// The report: rendered sounds as one page that opens from disk.
#pragma once

#include <string>
#include <vector>

#include "minihost/pose.h"

namespace tessaly {

/// Where something was over time, for the top view.
struct ReportPath {
    std::string name;
    std::vector<double> times;       ///< seconds, rising
    std::vector<Vector3> positions;  ///< one a time, metres
    std::vector<double> headings;    ///< degrees to the right, one a time; empty for sources
};

/// A response measured through the same chain that was heard.
struct ReportResponse {
    std::string label;         ///< e.g. "voice at 2.0 s"
    std::vector<float> left;   ///< at the entry's rate
    std::vector<float> right;  ///< the same length
};

struct ReportParameter {
    std::string owner;  ///< e.g. "voice", "return hall", "scene"
    std::string name;
    std::string unit;
    std::string value;  ///< as text; a changing value names its keyframes
};

/// One output with all that is shown of it.
struct ReportEntry {
    std::string title;
    std::string description;
    std::vector<float> stereo;  ///< interleaved, left first, full scale 1.0
    int sampleRate = 48000;     ///< Hz
    std::vector<ReportPath> sources;
    ReportPath listener;
    std::vector<ReportResponse> responses;
    std::vector<ReportParameter> parameters;
    std::vector<std::string> remarks;  ///< warnings of the rendering
};

struct Report {
    std::string title;
    std::string introduction;
    std::vector<ReportEntry> entries;  ///< one or more
};

/// The whole page with sounds, pictures, style and script inside; refers to nothing outside.
std::string reportPage(const Report& report);

}  // namespace tessaly
