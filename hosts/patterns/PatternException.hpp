#pragma once

#include <stdexcept>

namespace tessel::patterns {

// A pattern is none. what() is one line that has the pattern and says what is
// wrong with it, without a full stop.
class PatternException : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

}  // namespace tessel::patterns
