#include "hosts/console/RandomSample.hpp"

#include <random>
#include <set>

namespace tessel::console {

namespace {

// The standard fixes this generator's numbers, but not those of its
// distributions.
using Generator = std::mt19937_64;

// A number below `bound`, which must not be 0, all equally likely.
std::uint64_t drawBelow(std::uint64_t bound, Generator& generate) {
    // Of the 2^64 values, the lowest 2^64 % bound would favour some numbers.
    const std::uint64_t uneven = (std::uint64_t{0} - bound) % bound;
    std::uint64_t value = generate();
    while (value < uneven) value = generate();
    return value % bound;
}

void drawFew(std::uint64_t count, std::uint64_t size, Generator& generate,
             const std::function<void(std::uint64_t)>& show) {
    std::set<std::uint64_t> drawn;
    for (std::uint64_t last = size - count; last < size; ++last)
        if (!drawn.insert(drawBelow(last + 1, generate)).second)
            drawn.insert(last);
    for (const std::uint64_t number : drawn) show(number);
}

void drawMany(std::uint64_t count, std::uint64_t size, Generator& generate,
              const std::function<void(std::uint64_t)>& show) {
    for (std::uint64_t number = 0; count > 0; ++number) {
        if (drawBelow(size - number, generate) >= count) continue;
        show(number);
        --count;
    }
}

}  // namespace

void drawSample(std::uint64_t count, std::uint64_t size, std::uint64_t seed,
                const std::function<void(std::uint64_t)>& show) {
    Generator generate(seed);
    if (count <= size / 64)
        drawFew(count, size, generate, show);
    else
        drawMany(count, size, generate, show);
}

}  // namespace tessel::console
