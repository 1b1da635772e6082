#include "pathtree/NodeStack.hpp"

#include "pathtree/containers.hpp"

namespace tessel {

void NodeStack::grow(std::size_t more) { reserveGently(ranges_, more); }

}  // namespace tessel
