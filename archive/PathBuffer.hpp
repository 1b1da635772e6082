#pragma once

#include <array>
#include <cstddef>
#include <memory>

namespace tessel::archive {

// Bytes to decode into: within the object if they are few, which saves an
// allocation per path that is read, and on the heap otherwise. Not
// initialized.
class PathBuffer {
public:
    // Lists of files have paths of a few hundred bytes.
    static constexpr std::size_t inlineBytes = 4096;

    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-member-init): left so
    explicit PathBuffer(std::size_t bytes)
        : heap_(bytes > inlineBytes
                    ? std::make_unique_for_overwrite<char[]>(bytes)
                    : nullptr) {}

    PathBuffer(const PathBuffer&) = delete;
    PathBuffer& operator=(const PathBuffer&) = delete;
    ~PathBuffer() = default;

    char* data() noexcept { return heap_ ? heap_.get() : inline_.data(); }

private:
    std::unique_ptr<char[]> heap_;
    std::array<char, inlineBytes> inline_;
};

}  // namespace tessel::archive
