#pragma once

// A finished list, in a file that is mapped: see archive/PathArchive.hpp for
// reading and archive/ArchiveWriter.hpp for writing.
#include "archive/ArchiveWriter.hpp"
#include "archive/PathArchive.hpp"
