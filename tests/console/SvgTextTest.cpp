#include <gtest/gtest.h>

#include <string>

#include "hosts/console/SvgText.hpp"

namespace {

using tessel::console::SvgText;
using tessel::console::TextAnchor;
using tessel::console::xmlText;

TEST(SvgText, EscapesWhatXmlCannotHold) {
    EXPECT_EQ(xmlText("a<b>&\"c"), "a&lt;b&gt;&amp;&quot;c");
    EXPECT_EQ(xmlText("\xC3\xBC"), "\xC3\xBC");
    EXPECT_EQ(xmlText("\xEF\xBF\xBE\xEF\xBF\xBF\xEF\xBF\xBC"),
              "\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBC");
    EXPECT_EQ(xmlText("a\xFF\n"), "a\xEF\xBF\xBD\xEF\xBF\xBD");
}

TEST(SvgText, BuildsAPicture) {
    SvgText svg(100, 50);
    svg.box(1, 2, 3.5, 4, "#123456", "a & b");
    svg.line(0, 0, 1, 1, "#000");
    svg.text(5, 6, 12, TextAnchor::Middle, "x<y");
    const std::string text = svg.finished();
    EXPECT_TRUE(text.starts_with("<svg xmlns=")) << text;
    EXPECT_TRUE(text.ends_with("</svg>\n"));
    EXPECT_NE(text.find("viewBox=\"0 0 100 50\""), std::string::npos);
    EXPECT_NE(text.find("<rect x=\"1.00\" y=\"2.00\" width=\"3.50\" "
                        "height=\"4.00\" fill=\"#123456\"><title>a &amp; "
                        "b</title></rect>"),
              std::string::npos)
        << text;
    EXPECT_NE(text.find("text-anchor=\"middle\">x&lt;y</text>"),
              std::string::npos);
}

}  // namespace
