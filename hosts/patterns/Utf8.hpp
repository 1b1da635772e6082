#pragma once

#include <string_view>

namespace tessel::patterns {

// Whether the bytes are UTF-8, read strictly: no overlong forms, surrogates or
// values above U+10FFFF.
bool isUtf8(std::string_view bytes) noexcept;

}  // namespace tessel::patterns
