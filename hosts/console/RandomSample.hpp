#pragma once

#include <cstdint>
#include <functional>

namespace tessel::console {

// Shows `count` different numbers below `size`, ascending, each set of them
// equally likely. The same seed shows the same numbers on every machine.
// count must be at most size.
//
// Cost: a small sample takes a set of `count` numbers (Floyd's algorithm); one
// of more than a 64th of all draws once per number below size, without memory
// (selection sampling, Knuth's algorithm S).
void drawSample(std::uint64_t count, std::uint64_t size, std::uint64_t seed,
                const std::function<void(std::uint64_t)>& show);

}  // namespace tessel::console
