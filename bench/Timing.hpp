#pragma once

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <vector>

namespace bench {

// Seconds since its construction.
class Stopwatch {
public:
    double seconds() const {
        return std::chrono::duration<double>(Clock::now() - begin_).count();
    }

private:
    using Clock = std::chrono::steady_clock;
    Clock::time_point begin_ = Clock::now();
};

// How long a call takes, in seconds.
template <class Call>
double secondsOf(Call call) {
    const Stopwatch watch;
    call();
    return watch.seconds();
}

// The middle of some values, at least one.
inline double median(std::vector<double> values) {
    const auto middle =
        values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    if (values.size() % 2 == 1) return *middle;
    return (*middle + *std::max_element(values.begin(), middle)) / 2;
}

// The middle of the ratios of values that were taken in the same run.
inline double medianRatio(const std::vector<double>& above,
                          const std::vector<double>& below) {
    std::vector<double> ratios;
    for (std::size_t i = 0; i < above.size(); ++i) {
        ratios.push_back(above[i] / below[i]);
    }
    return median(std::move(ratios));
}

// Keeps the compiler from leaving out what nobody reads.
template <class T>
void keep(const T& value) {
    asm volatile("" : : "g"(&value) : "memory");
}

}  // namespace bench
