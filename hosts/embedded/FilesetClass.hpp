#pragma once

#include "hosts/embedded/Host.hpp"

namespace tessel::embedded {

inline constexpr const char* filesetClassName =
    "velox.io.datastore.internal.fileset.HuffmanPaths";

// What the host adds to the class of file sets: a copy is filled by the
// constructor's mode "copy", and the stored form is saved in a field PathTree,
// where custom load looks for it. Every Host has it.
ClassExtension filesetExtension();

}  // namespace tessel::embedded
