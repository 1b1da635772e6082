#pragma once

#include <string>
#include <string_view>

namespace tessel::embedded {

// UTF-8 of UTF-16 text. A lone surrogate becomes the three bytes that its
// number takes, so that no two texts give the same bytes.
std::string toUtf8(std::u16string_view text);

}  // namespace tessel::embedded
