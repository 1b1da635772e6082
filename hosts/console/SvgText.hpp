#pragma once

#include <string>
#include <string_view>

namespace tessel::console {

// Where a text is, relative to its position.
enum class TextAnchor { Start, Middle, End };

// SvgText builds an SVG picture with a white ground from boxes and texts.
// Lengths are pixels, from the top left corner.
class SvgText {
public:
    SvgText(double width, double height);

    // A filled box. `hint` is shown when the pointer rests on it, if not
    // empty.
    void box(double x, double y, double width, double height,
             std::string_view colour, std::string_view hint);

    void line(double x1, double y1, double x2, double y2,
              std::string_view colour);

    // `size` is the height of the letters.
    void text(double x, double y, double size, TextAnchor anchor,
              std::string_view text);

    // The whole picture, with a newline at the end.
    std::string finished() const { return body_ + "</svg>\n"; }

private:
    std::string body_;
};

// The text as XML holds it: <, >, & and quotes escaped, bytes that are not
// UTF-8 and control characters replaced by U+FFFD.
std::string xmlText(std::string_view text);

}  // namespace tessel::console
