#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "archive/Format.hpp"
#include "archive/SegmentList.hpp"
#include "archive/Workers.hpp"

namespace tessel::archive {

// A segment's list in the order in which its blocks will hold it.
struct Arrangement {
    ListOrder order = ListOrder::Sorted;
    // In stored order; folders are numbered by first appearance in it.
    std::vector<NameRef> names;
    // The list's number of each of these folders; empty if they are the same.
    std::vector<std::uint32_t> listFolders;
    // The number of each stored path; empty if it is its place.
    std::vector<std::uint32_t> numbers;

    std::uint32_t listFolder(std::uint32_t folder) const noexcept {
        return listFolders.empty() ? folder : listFolders[folder];
    }
};

// Decides the order in which a list is stored, and sorts if that is better.
//
// A list in folder runs is kept as it is, sorted or not. If paths of one
// folder are scattered (more than every second path comes back to a folder
// that was there before), it is sorted and its order stored beside it: that
// costs log2 N bits per path but saves at least as many for jumps, and brings
// similar names together.
Arrangement arrange(const SegmentList& list, Workers& workers);

// The list sorted, with the number of each path; equal paths by number.
// Cost: a sort of the folders, one of the names in each folder, one merge.
Arrangement arrangeSorted(const SegmentList& list, Workers& workers);

}  // namespace tessel::archive
