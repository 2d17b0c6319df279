// SVG elements as text.
#include "render/svg_canvas.h"

#include <fmt/format.h>

#include <cmath>

namespace tessaly {

namespace {

// Two decimals without trailing zeros, and never "-0".
std::string number(double value) {
    const double rounded = std::round(value * 100.0) / 100.0;
    return fmt::format("{:g}", rounded == 0.0 ? 0.0 : rounded);
}

std::string stroke(const LineStyle& style) {
    if (style.width <= 0.0) {
        return "";
    }
    std::string text =
        fmt::format(" stroke=\"{}\" stroke-width=\"{}\"", style.colour, number(style.width));
    if (!style.dashes.empty()) {
        text += fmt::format(" stroke-dasharray=\"{}\"", style.dashes);
    }
    return text;
}

std::string pointList(std::span<const Point> points) {
    std::string text;
    for (const Point& point : points) {
        text += fmt::format("{}{},{}", text.empty() ? "" : " ", number(point.x), number(point.y));
    }
    return text;
}

const char* anchorName(Anchor anchor) {
    switch (anchor) {
        case Anchor::Start:
            return "start";
        case Anchor::Middle:
            return "middle";
        case Anchor::End:
            return "end";
    }
    return "start";
}

// Length of the UTF-8 sequence at the start of the text, 0 if there is no whole one.
std::size_t sequenceLength(std::string_view text) {
    const auto first = static_cast<unsigned char>(text.front());
    const std::size_t length = first < 0x80                    ? 1
                               : first >= 0xC2 && first < 0xE0 ? 2
                               : first >= 0xE0 && first < 0xF0 ? 3
                               : first >= 0xF0 && first < 0xF5 ? 4
                                                               : 0;
    if (length > text.size()) {
        return 0;
    }
    for (std::size_t i = 1; i < length; ++i) {
        if ((static_cast<unsigned char>(text[i]) & 0xC0) != 0x80) {
            return 0;
        }
    }
    return length;
}

}  // namespace

SvgCanvas::SvgCanvas(double width, double height, std::string_view background)
    : canvasWidth(width), canvasHeight(height) {
    if (!background.empty()) {
        rectangle({0.0, 0.0, width, height}, background, {.width = 0.0});
    }
}

void SvgCanvas::text(Point place, std::string_view words, const TextStyle& style) {
    body += fmt::format("<text x=\"{}\" y=\"{}\" font-size=\"{}\" fill=\"{}\"", number(place.x),
                        number(place.y), number(style.size), style.colour);
    if (style.anchor != Anchor::Start) {
        body += fmt::format(" text-anchor=\"{}\"", anchorName(style.anchor));
    }
    if (style.bold) {
        body += " font-weight=\"bold\"";
    }
    if (style.turned != 0.0) {
        body += fmt::format(" transform=\"rotate({} {} {})\"", number(style.turned),
                            number(place.x), number(place.y));
    }
    body += fmt::format(">{}</text>\n", escapedXml(words));
}

void SvgCanvas::line(Point from, Point to, const LineStyle& style) {
    body += fmt::format("<line x1=\"{}\" y1=\"{}\" x2=\"{}\" y2=\"{}\"{}/>\n", number(from.x),
                        number(from.y), number(to.x), number(to.y), stroke(style));
}

void SvgCanvas::polyline(std::span<const Point> points, const LineStyle& style) {
    if (points.size() < 2) {
        return;
    }
    body += fmt::format("<polyline points=\"{}\" fill=\"none\" stroke-linejoin=\"round\"{}/>\n",
                        pointList(points), stroke(style));
}

void SvgCanvas::polygon(std::span<const Point> points, std::string_view fill) {
    body += fmt::format("<polygon points=\"{}\" fill=\"{}\"/>\n", pointList(points), fill);
}

void SvgCanvas::circle(Point centre, double radius, std::string_view fill, const LineStyle& edge) {
    body += fmt::format("<circle cx=\"{}\" cy=\"{}\" r=\"{}\" fill=\"{}\"{}/>\n", number(centre.x),
                        number(centre.y), number(radius), fill, stroke(edge));
}

void SvgCanvas::ellipse(
    Point centre, double radiusX, double radiusY, std::string_view fill, const LineStyle& edge) {
    body += fmt::format("<ellipse cx=\"{}\" cy=\"{}\" rx=\"{}\" ry=\"{}\" fill=\"{}\"{}/>\n",
                        number(centre.x), number(centre.y), number(radiusX), number(radiusY), fill,
                        stroke(edge));
}

void SvgCanvas::rectangle(const Box& box, std::string_view fill, const LineStyle& edge) {
    body += fmt::format("<rect x=\"{}\" y=\"{}\" width=\"{}\" height=\"{}\" fill=\"{}\"{}/>\n",
                        number(box.x), number(box.y), number(box.width), number(box.height), fill,
                        stroke(edge));
}

void SvgCanvas::beginClip(const Box& box) {
    ++clips;
    body += fmt::format(
        "<clipPath id=\"clip{0}\"><rect x=\"{1}\" y=\"{2}\" width=\"{3}\" height=\"{4}\"/>"
        "</clipPath>\n<g clip-path=\"url(#clip{0})\">\n",
        clips, number(box.x), number(box.y), number(box.width), number(box.height));
}

void SvgCanvas::endClip() { body += "</g>\n"; }

std::string SvgCanvas::document() const {
    return fmt::format(
        "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
        "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"{0}\" height=\"{1}\" "
        "viewBox=\"0 0 {0} {1}\" font-family=\"Helvetica, Arial, 'DejaVu Sans', sans-serif\">\n"
        "{2}</svg>\n",
        number(canvasWidth), number(canvasHeight), body);
}

std::string SvgCanvas::pageElement(std::string_view attributes) const {
    return fmt::format("<svg viewBox=\"0 0 {} {}\" {}>\n{}</svg>\n", number(canvasWidth),
                       number(canvasHeight), attributes, body);
}

std::string escapedXml(std::string_view text) {
    std::string escaped;
    while (!text.empty()) {
        const std::size_t length = sequenceLength(text);
        const std::string_view one = text.substr(0, length);
        if (length == 0) {
            escaped += '?';
        } else if (one == "&") {
            escaped += "&amp;";
        } else if (one == "<") {
            escaped += "&lt;";
        } else if (one == ">") {
            escaped += "&gt;";
        } else if (one == "\"") {
            escaped += "&quot;";
        } else if (one == "'") {
            escaped += "&apos;";
        } else if (length == 1 && static_cast<unsigned char>(one.front()) < 0x20) {
            escaped += ' ';
        } else {
            escaped += one;
        }
        text.remove_prefix(length == 0 ? 1 : length);
    }
    return escaped;
}

}  // namespace tessaly
