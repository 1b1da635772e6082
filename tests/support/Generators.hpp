#pragma once

#include <rapidcheck.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <string>
#include <vector>

// Random input for properties.
namespace support {

// Any UTF-16 code unit, the awkward ones often: NUL, U+FFFF, surrogates that
// stand alone.
inline rc::Gen<char16_t> anyCodeUnit() {
    return rc::gen::weightedOneOf<char16_t>(
        {{4, rc::gen::inRange<char16_t>(u'a', u'z' + 1)},
         {2, rc::gen::element<char16_t>(0, 0xFFFF, 0xD800, 0xDBFF, 0xDC00,
                                        0xDFFF, 0xFF, 0x100)},
         {2, rc::gen::map(rc::gen::inRange<std::uint32_t>(0, 0x10000),
                          [](std::uint32_t unit) {
                              return static_cast<char16_t>(unit);
                          })}});
}

inline rc::Gen<std::u16string> anyTextOf(rc::Gen<char16_t> units) {
    return rc::gen::nonEmpty(
        rc::gen::container<std::u16string>(std::move(units)));
}

// A frequency: small and often equal to another, or of any size, or none.
inline rc::Gen<double> anyFrequency() {
    return rc::gen::weightedOneOf<double>(
        {{6, rc::gen::map(rc::gen::inRange(0, 5),
                          [](int n) { return static_cast<double>(n); })},
         {3, rc::gen::map(rc::gen::inRange(-300, 300),
                          [](int n) { return std::ldexp(1.0, n); })},
         {1, rc::gen::element(std::numeric_limits<double>::quiet_NaN(),
                              std::numeric_limits<double>::infinity(),
                              -std::numeric_limits<double>::infinity(), -1.0,
                              -0.0)}});
}

inline rc::Gen<std::uint8_t> anyByte() {
    return rc::gen::map(rc::gen::inRange(0, 256), [](int byte) {
        return static_cast<std::uint8_t>(byte);
    });
}

}  // namespace support
