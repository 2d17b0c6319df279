// Builds an SVG document from a few shapes, with all text escaped.
#pragma once

#include <span>
#include <string>
#include <string_view>

namespace tessaly {

struct Point {
    double x = 0.0;
    double y = 0.0;
};

/// Pixels; x to the right, y downwards.
struct Box {
    double x = 0.0;
    double y = 0.0;
    double width = 0.0;
    double height = 0.0;

    double right() const noexcept { return x + width; }
    double bottom() const noexcept { return y + height; }
};

enum class Anchor { Start, Middle, End };

struct TextStyle {
    double size = 12.0;
    Anchor anchor = Anchor::Start;
    std::string_view colour = "#333333";
    bool bold = false;
    double turned = 0.0;  ///< degrees clockwise round the text's place
};

struct LineStyle {
    std::string_view colour = "#333333";
    double width = 1.0;
    std::string_view dashes = {};  ///< e.g. "4 3"; empty for a full line
};

/// Shapes are drawn in the order of the calls. Coordinates keep two decimals.
class SvgCanvas {
public:
    /// @param background  colour behind everything; empty for none
    SvgCanvas(double width, double height, std::string_view background = "#ffffff");

    void text(Point place, std::string_view words, const TextStyle& style = {});
    void line(Point from, Point to, const LineStyle& style = {});
    void polyline(std::span<const Point> points, const LineStyle& style = {});
    void polygon(std::span<const Point> points, std::string_view fill);
    void circle(Point centre, double radius, std::string_view fill, const LineStyle& edge);
    void ellipse(
        Point centre, double radiusX, double radiusY, std::string_view fill, const LineStyle& edge);
    void rectangle(const Box& box, std::string_view fill, const LineStyle& edge);

    /// What is drawn until endClip() shows inside the box only.
    void beginClip(const Box& box);
    void endClip();

    /// @returns the whole document
    std::string document() const;

    /// The shapes as an element of an HTML page. Clips are numbered in each canvas anew, so a page
    /// can hold one canvas with clips at most.
    /// @param attributes  further ones of the svg element, as they are written
    std::string pageElement(std::string_view attributes) const;

private:
    std::string body;
    int clips = 0;
    double canvasWidth;
    double canvasHeight;
};

/// Text with the characters that have a meaning in XML written as entities. What XML cannot hold
/// is replaced: control characters by blanks, bytes that are no UTF-8 by question marks.
std::string escapedXml(std::string_view text);

}  // namespace tessaly
