// The SVG writer: well-formed, escaped, tidy numbers.
#include "render/svg_canvas.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>

#include "tools/render/xml_check.h"

namespace tessaly {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;

TEST(XmlCheck, FindsTheFaultsItLooksFor) {
    EXPECT_EQ(xmlFault("<a><b x=\"1\"/>text &amp; more</a>\n"), "");
    for (const char* wrong :
         {"", "text", "<a>", "<a></b>", "<a/><b/>", "<a x=1/>", "<a x=\"1\" x=\"2\"/>",
          "<a>&nbsp;</a>", "<a>x & y</a>", "<a x=\"<\"/>", "<a x=\"1/>", "<a/>text"}) {
        EXPECT_NE(xmlFault(wrong), "") << wrong;
    }
}

TEST(SvgCanvas, PageElementHasTheShapesAloneWithoutABackground) {
    SvgCanvas canvas(100.0, 50.0, "");
    canvas.line({0.0, 1.0}, {2.0, 3.0}, {.colour = "var(--left)"});
    const std::string element = canvas.pageElement("aria-hidden=\"true\"");
    EXPECT_EQ(xmlFault(element), "");
    EXPECT_THAT(element,
                ::testing::StartsWith("<svg viewBox=\"0 0 100 50\" aria-hidden=\"true\">"));
    EXPECT_EQ(countElements(element, "line"), 1);
    EXPECT_EQ(countElements(element, "rect"), 0);
    EXPECT_THAT(element, HasSubstr("stroke=\"var(--left)\""));
    EXPECT_THAT(element, Not(HasSubstr("http")));
}

TEST(SvgCanvas, EveryShapeIsWellFormed) {
    SvgCanvas canvas(100.0, 50.0);
    const std::array<Point, 3> points = {{{1.0, 2.0}, {3.0, 4.0}, {5.0, 6.0}}};
    canvas.beginClip({0.0, 0.0, 10.0, 10.0});
    canvas.text({1.0, 2.0}, "a < b & \"c\"", {.anchor = Anchor::End, .bold = true, .turned = 90.0});
    canvas.line({0.0, 0.0}, {1.0, 1.0}, {.dashes = "2 2"});
    canvas.polyline(points);
    canvas.polygon(points, "#000000");
    canvas.circle({1.0, 1.0}, 2.0, "none", {});
    canvas.ellipse({1.0, 1.0}, 2.0, 3.0, "none", {});
    canvas.rectangle({1.0, 1.0, 2.0, 3.0}, "none", {});
    canvas.endClip();
    const std::string document = canvas.document();
    EXPECT_EQ(xmlFault(document), "");
    EXPECT_THAT(document, HasSubstr("a &lt; b &amp; &quot;c&quot;"));
    EXPECT_THAT(document, HasSubstr("viewBox=\"0 0 100 50\""));
    for (const char* shape : {"text", "line", "polyline", "polygon", "circle", "ellipse"}) {
        EXPECT_EQ(countElements(document, shape), 1) << shape;
    }
}

TEST(SvgCanvas, LineOfOnePointIsNotDrawn) {
    SvgCanvas canvas(10.0, 10.0);
    const std::array<Point, 1> point = {{{1.0, 2.0}}};
    canvas.polyline(point);
    EXPECT_EQ(countElements(canvas.document(), "polyline"), 0);
}

TEST(SvgCanvas, NumbersHaveAtMostTwoDecimalsAndNoNegativeZero) {
    SvgCanvas canvas(10.0, 10.0);
    canvas.line({-0.0001, 1.23456}, {1000.005, -3.0});
    EXPECT_THAT(canvas.document(), HasSubstr("x1=\"0\" y1=\"1.23\""));
    EXPECT_THAT(canvas.document(), Not(HasSubstr("\"-0\"")));
}

TEST(SvgCanvas, TextThatXmlCannotHoldIsReplaced) {
    EXPECT_EQ(escapedXml("tab\tbell\x07"), "tab bell ");
    EXPECT_EQ(escapedXml("caf\xc3\xa9"), "caf\xc3\xa9");
    EXPECT_EQ(escapedXml("caf\xe9 x"), "caf? x");
    EXPECT_EQ(escapedXml("cut\xc3"), "cut?");
    EXPECT_EQ(escapedXml("'"), "&apos;");
}

}  // namespace
}  // namespace tessaly
