#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

namespace tessel::archive {

// The folders of a segment's list, each once, numbered in the order in which
// they were first asked for.
//
// Ownership: the table owns the text. Views of it hold until the next new
//   folder.
// Threads: no locks. Reading from several threads is safe.
// Cost: a hash and one comparison per call (open addressing, linear probing);
//   the text once and 16 bytes per folder.
class FolderTable {
public:
    // The number of the folder, which is a new one if it was not there yet.
    // If it throws std::bad_alloc, the table holds what it held before.
    std::uint32_t numberOf(std::string_view folder);

    std::size_t size() const noexcept { return starts_.size() - 1; }

    std::string_view operator[](std::uint32_t number) const noexcept {
        return {text_.data() + starts_[number],
                starts_[number + 1] - starts_[number] - 1};
    }

    // Forgets all folders but keeps the memory.
    void clear();

private:
    void growSlots();

    std::vector<char> text_;  // each folder ends with a zero byte
    std::vector<std::uint32_t> starts_{0};
    std::vector<std::uint32_t> hashes_;  // [number]: low half of the hash
    std::vector<std::uint32_t> slots_;   // number + 1, or 0; a power of two
};

}  // namespace tessel::archive
