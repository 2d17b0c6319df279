// Graphs as markup.
#include "report/plot.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <cstddef>

namespace tessaly {

namespace {

// Units of the stretched drawing; lines keep their width by the page's style.
constexpr double drawingWidth = 1000.0;
constexpr double drawingHeight = 400.0;

constexpr std::size_t fewTicks = 6;

// The hyphen of a formatted number becomes a minus sign.
std::string withMinus(const std::string& number) {
    return number.starts_with('-') ? "\xE2\x88\x92" + number.substr(1) : number;
}

void flush(SvgCanvas& canvas, std::vector<Point>& run, const LineStyle& style) {
    if (run.size() == 1) {
        run.push_back(run.front());  // round caps make it a dot
    }
    canvas.polyline(run, style);
    run.clear();
}

}  // namespace

std::string plotMarkup(const Plot& plot) {
    std::string text = fmt::format("<figure class=\"graph\">\n<figcaption><span class=\"title\">{}",
                                   escapedXml(plot.title));
    if (!plot.unit.empty()) {
        text += fmt::format(" <span class=\"unit\">{}</span>", escapedXml(plot.unit));
    }
    text += "</span>";
    if (plot.ears) {
        text +=
            "<span class=\"legend\"><span class=\"key left\">left</span>"
            "<span class=\"key right\">right</span></span>";
    }
    text += "</figcaption>\n";
    const std::string seek =
        plot.seconds ? fmt::format(" data-seconds=\"{:.6f}\"", *plot.seconds) : std::string();
    text += fmt::format("<div class=\"plot {}\" role=\"img\" aria-label=\"{}\"{}>\n", plot.kind,
                        escapedXml(plot.label), seek);
    text += plot.body;
    if (plot.seconds) {
        text += "<div class=\"playhead\"></div>\n";
    }
    for (const Tick& tick : plot.upright) {
        text += fmt::format("<span class=\"y\" style=\"bottom:{:.2f}%\">{}</span>",
                            100.0 * tick.place, escapedXml(tick.label));
    }
    // On a narrow display every other one of many would touch its neighbours.
    const bool many = plot.across.size() > fewTicks;
    for (std::size_t i = 0; i < plot.across.size(); ++i) {
        text += fmt::format("<span class=\"x{}\" style=\"left:{:.2f}%\">{}</span>",
                            many && i % 2 == 1 ? " odd" : "", 100.0 * plot.across[i].place,
                            escapedXml(plot.across[i].label));
    }
    return text + "\n</div>\n" + plot.below + "</figure>\n";
}

std::vector<Tick> ticksOf(const AxisRange& range, int wanted, std::string_view unit) {
    const double step = niceStep(range.low, range.high, wanted);
    std::vector<Tick> ticks;
    forEachTick(range, step, [&](double value) {
        std::string label = shownTick(value, step);
        if (!unit.empty()) {
            label += fmt::format(" {}", unit);
        }
        ticks.push_back({range.place(value, 0.0, 1.0), label});
    });
    return ticks;
}

std::string curvesMarkup(const AxisRange& across,
                         const AxisRange& upright,
                         std::span<const Tick> acrossTicks,
                         std::span<const Tick> uprightTicks,
                         std::span<const Curve> curves) {
    SvgCanvas canvas(drawingWidth, drawingHeight, "");
    for (const Tick& tick : acrossTicks) {
        const double x = drawingWidth * tick.place;
        canvas.line({x, 0.0}, {x, drawingHeight}, {.colour = "var(--grid)"});
    }
    for (const Tick& tick : uprightTicks) {
        const double y = drawingHeight * (1.0 - tick.place);
        canvas.line({0.0, y}, {drawingWidth, y}, {.colour = "var(--grid)"});
    }
    if (upright.low < 0.0 && upright.high > 0.0) {
        const double y = upright.place(0.0, drawingHeight, 0.0);
        canvas.line({0.0, y}, {drawingWidth, y}, {.colour = "var(--axis)"});
    }
    for (const Curve& curve : curves) {
        std::vector<Point> run;
        for (const Point& point : curve.run) {
            if (!std::isfinite(point.y)) {
                flush(canvas, run, curve.style);
                continue;
            }
            const double x = across.place(point.x, 0.0, drawingWidth);
            const double y = upright.place(point.y, drawingHeight, 0.0);
            // Far outside is as good as just outside: the box cuts both.
            run.push_back({x, std::clamp(y, -drawingHeight, 2.0 * drawingHeight)});
        }
        flush(canvas, run, curve.style);
    }
    return canvas.pageElement("preserveAspectRatio=\"none\" aria-hidden=\"true\"");
}

std::string shownTick(double value, double step) { return withMinus(tickLabel(value, step)); }

std::string shownNumber(double value, int decimals) {
    const double unit = std::pow(10.0, -decimals);
    const double shown = std::abs(value) < 0.5 * unit ? 0.0 : value;
    return withMinus(fmt::format("{:.{}f}", shown, decimals));
}

}  // namespace tessaly
