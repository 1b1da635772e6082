#pragma once

#include "archive/ArchiveOptions.hpp"
#include "archive/FrontCoder.hpp"
#include "archive/ListParser.hpp"
#include "archive/TokenModel.hpp"
#include "archive/Workers.hpp"
#include "packing/FunctionRef.hpp"

namespace tessel::archive {

// A model and the list cut by it.
struct TrainedParse {
    TokenModel model;
    ParsedList parsed;
};

// Learns tokens from a sample of the list, works out what they cost, and cuts
// the whole list at the least cost. `progress` is told the share that is done.
//
// Cost: nearly all of the time that building a segment takes.
TrainedParse trainAndParse(const FrontCoder& list, ArchiveLevel level,
                           Workers& workers,
                           FunctionRef<void(double)> progress);

}  // namespace tessel::archive
