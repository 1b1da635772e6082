#include "hosts/console/SvgText.hpp"

#include <fmt/format.h>

#include <cstddef>
#include <iterator>

#include "hosts/patterns/Utf8.hpp"
#include "paths/PathText.hpp"

namespace tessel::console {

namespace {

std::string_view anchorName(TextAnchor anchor) noexcept {
    if (anchor == TextAnchor::Start) return "start";
    return anchor == TextAnchor::Middle ? "middle" : "end";
}

// XML 1.0 has no way to write control characters, U+FFFE and U+FFFF.
bool isAllowedInXml(std::string_view character) noexcept {
    return static_cast<unsigned char>(character.front()) >= 0x20 &&
           character != "\xEF\xBF\xBE" && character != "\xEF\xBF\xBF";
}

void appendCharacter(std::string_view character, std::string& text) {
    if (character == "<")
        text += "&lt;";
    else if (character == ">")
        text += "&gt;";
    else if (character == "&")
        text += "&amp;";
    else if (character == "\"")
        text += "&quot;";
    else if (!patterns::isUtf8(character) || !isAllowedInXml(character))
        text += "\xEF\xBF\xBD";
    else
        text += character;
}

}  // namespace

std::string xmlText(std::string_view text) {
    std::string escaped;
    while (!text.empty()) {
        const std::size_t size = paths::decodeCharacter(text).byteCount;
        appendCharacter(text.substr(0, size), escaped);
        text.remove_prefix(size);
    }
    return escaped;
}

SvgText::SvgText(double width, double height)
    : body_(fmt::format(
          "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"{0:g}\" "
          "height=\"{1:g}\" viewBox=\"0 0 {0:g} {1:g}\" "
          "font-family=\"sans-serif\" fill=\"#222\">\n"
          "<rect width=\"{0:g}\" height=\"{1:g}\" fill=\"#fff\"/>\n",
          width, height)) {}

void SvgText::box(double x, double y, double width, double height,
                  std::string_view colour, std::string_view hint) {
    fmt::format_to(std::back_inserter(body_),
                   "<rect x=\"{:.2f}\" y=\"{:.2f}\" width=\"{:.2f}\" "
                   "height=\"{:.2f}\" fill=\"{}\"><title>{}</title></rect>\n",
                   x, y, width, height, colour, xmlText(hint));
}

void SvgText::line(double x1, double y1, double x2, double y2,
                   std::string_view colour) {
    fmt::format_to(std::back_inserter(body_),
                   "<line x1=\"{:.2f}\" y1=\"{:.2f}\" x2=\"{:.2f}\" "
                   "y2=\"{:.2f}\" stroke=\"{}\"/>\n",
                   x1, y1, x2, y2, colour);
}

void SvgText::text(double x, double y, double size, TextAnchor anchor,
                   std::string_view text) {
    fmt::format_to(std::back_inserter(body_),
                   "<text x=\"{:.2f}\" y=\"{:.2f}\" font-size=\"{:g}\" "
                   "text-anchor=\"{}\">{}</text>\n",
                   x, y, size, anchorName(anchor), xmlText(text));
}

}  // namespace tessel::console
