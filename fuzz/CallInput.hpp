#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <stdexcept>

#include "coder/CoderErrors.hpp"
#include "fuzz/Input.hpp"
#include "packing/sixpacks.hpp"
#include "pathtree/BPathTree.hpp"

namespace tessel::fuzz {

// Calls of one input at most, so that a run takes a bounded time.
constexpr std::size_t maxCalls = 300;

// A number that a careless caller might set: small, or at a border.
inline std::uint64_t wildNumber(Input& input) {
    constexpr std::uint64_t one = 1;
    constexpr std::array<std::uint64_t, 8> borders{
        0,         (one << 31) - 1, one << 31, one << 32,
        one << 60, one << 63,       ~one,      ~std::uint64_t{0}};
    const std::uint8_t choice = input.byte();
    return choice < 0xF0 ? choice % 16 : borders[choice % borders.size()];
}

inline std::int32_t wildPosition(Input& input) {
    return static_cast<std::int32_t>(wildNumber(input));
}

inline Component takeComponent(Input& input) {
    return input.bytes(input.byte() % 8);
}

inline Components takeComponents(Input& input) {
    Components components;
    for (std::size_t left = input.byte() % 6; left > 0; --left)
        components.push_back(takeComponent(input));
    return components;
}

inline PathTrack takeTrack(Input& input) {
    PathTrack track;
    for (std::size_t left = input.byte() % 5; left > 0; --left)
        track.push_back(wildNumber(input));
    return track;
}

// Runs a call that may be refused. Any exception but the documented ones ends
// the process, that memory ran out among them.
template <class Call>
bool answered(Call call) {
    try {
        call();
        return true;
    } catch (const std::logic_error&) {
    } catch (const DamagedFormException&) {
    } catch (const InvalidUintConversionException&) {
    } catch (const UnknownNodeTypeException&) {
    } catch (const NoCodeForEmptyString&) {
    } catch (const CodeNotFoundException&) {
    } catch (const NoMorePathException&) {
    } catch (const NoTreeToTraverseException&) {
    } catch (const EmptyPathForTraverseException&) {
    }
    return false;
}

}  // namespace tessel::fuzz
