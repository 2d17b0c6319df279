// The page around the sections.
#include "report/report.h"

#include <fmt/format.h>

#include "render/svg_canvas.h"
#include "report/colour_scale.h"
#include "report/entry_section.h"
#include "report/page_assets.h"

namespace tessaly {

namespace {

// The page asks nobody for anything; a browser holds it to that.
constexpr const char* policy =
    "default-src 'none'; style-src 'unsafe-inline'; script-src 'unsafe-inline'; img-src data:; "
    "media-src data:";

std::string contents(const Report& report) {
    std::string items;
    for (std::size_t i = 0; i < report.entries.size(); ++i) {
        items += fmt::format("<li><a href=\"#{}\">{}</a></li>\n", sectionId(i),
                             escapedXml(report.entries[i].title));
    }
    return fmt::format(
        "<nav aria-labelledby=\"contents\">\n<h2 id=\"contents\">Contents</h2>\n"
        "<ol>\n{}</ol>\n</nav>\n",
        items);
}

}  // namespace

std::string reportPage(const Report& report) {
    std::string page = fmt::format(
        "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n"
        "<meta http-equiv=\"Content-Security-Policy\" content=\"{}\">\n"
        "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\">\n"
        "<meta name=\"color-scheme\" content=\"light dark\">\n"
        "<link rel=\"icon\" href=\"data:,\">\n<title>{}</title>\n"
        "<style>\n{}.bar.levels {{ background: {}; }}\n</style>\n</head>\n<body>\n"
        "<a class=\"skip\" href=\"#sounds\">Skip to the sounds</a>\n"
        "<header>\n<h1>{}</h1>\n",
        policy, escapedXml(report.title), pageStyle(), levelGradient(), escapedXml(report.title));
    if (!report.introduction.empty()) {
        page += fmt::format("<p class=\"lead\">{}</p>\n", escapedXml(report.introduction));
    }
    page += contents(report) + "</header>\n<main id=\"sounds\" tabindex=\"-1\">\n";
    for (std::size_t i = 0; i < report.entries.size(); ++i) {
        page += entrySection(report.entries[i], i);
    }
    return page + fmt::format("</main>\n<script>\n{}</script>\n</body>\n</html>\n", pageScript());
}

}  // namespace tessaly
