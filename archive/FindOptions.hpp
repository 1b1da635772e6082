#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "archive/ScanOptions.hpp"
#include "packing/FunctionRef.hpp"

namespace tessel {

struct FindOptions : ScanOptions {
    // If set, only paths below this folder are looked at, as
    // PathArchive::folder understands it.
    std::optional<std::string> folder;
};

// Whether a path is to be found. It may be called on several threads at a
// time, with views that are valid until it returns.
using PathPredicate = FunctionRef<bool(std::string_view path)>;

}  // namespace tessel
