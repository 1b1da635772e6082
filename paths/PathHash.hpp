#pragma once

#include <cstdint>
#include <string_view>

#include "pathtree/HashIndex.hpp"

namespace tessel::paths {

// PathHash hashes texts for HashIndex and for the containers of the standard
// library, whose own hash has no key: somebody who knows that one can make
// paths that all collide. This one is keyed with a secret of the process, so
// it differs from run to run; store none.
struct PathHash {
    using is_transparent = void;

    std::uint32_t operator()(std::string_view text) const noexcept {
        return HashIndex::hashOf(
            {reinterpret_cast<const std::uint8_t*>(text.data()), text.size()});
    }
};

}  // namespace tessel::paths
