#include "pathtree/ChildBlock.hpp"

#include <array>
#include <cstdlib>
#include <new>

#include "pathtree/FolderNode.hpp"

namespace tessel {

// ---- Entries ----

// A long name, or a folder that was a file: its name says how long the file's
// entry was.
std::size_t ChildBlock::sizeOfRare(const std::uint8_t* entry) noexcept {
    const std::size_t length = *entry == packed::longMark
                                   ? packed::readComponent(entry).size()
                                   : folderAt(entry)->value().size();
    return fileBytes(length, true);
}

std::uint64_t ChildBlock::offsetOf(std::uint64_t position) const noexcept {
    if (!hasFiles()) return position * folderEntryBytes;
    const std::uint64_t j = position / childrenPerSample;
    const std::uint8_t* const first = entries();
    const std::uint8_t* entry = first + (j == 0 ? 0 : sample(j));
    const bool isPadded = this->isPadded();
    for (std::uint64_t left = position % childrenPerSample; left > 0; --left)
        entry += sizeOf(entry, isPadded);
    return static_cast<std::uint64_t>(entry - first);
}

// ---- Making blocks ----

ChildBlock::Plan::Plan(std::uint64_t children, std::uint64_t bytes,
                       std::uint64_t slack, std::uint8_t kind) noexcept
    : count(children), used(bytes), flags(kind) {
    constexpr std::array<std::uint8_t, 3> widths = {0, 1, 3};
    for (const std::uint8_t exponent : widths) {
        flags = static_cast<std::uint8_t>(kind | exponent);
        capacity = bytes + slack + sampleBytes(children, numberBytes());
        const std::uint64_t most = maxNumber(numberBytes());
        if (count <= most && capacity <= most) return;
    }
}

ChildBlock ChildBlock::begin(std::uint8_t* memory, const Plan& plan) noexcept {
    *memory = plan.flags;
    ChildBlock block(memory);
    block.setNumber(0, 0);
    block.setNumber(1, 0);
    block.setNumber(2, plan.capacity);
    return block;
}

ChildBlock ChildBlock::allocate(const Plan& plan) {
    void* memory = std::malloc(static_cast<std::size_t>(plan.totalBytes()));
    if (memory == nullptr) throw std::bad_alloc();
    return begin(static_cast<std::uint8_t*>(memory), plan);
}

namespace {

template <class Number>
void writeAs(std::uint8_t* at, std::uint64_t value) noexcept {
    const auto stored = static_cast<Number>(value);
    std::memcpy(at, &stored, sizeof stored);
}

}  // namespace

void ChildBlock::setNumberAt(std::uint8_t* at, std::uint64_t value) noexcept {
    switch (numberBytes()) {
        case sizeof(std::uint8_t):
            return writeAs<std::uint8_t>(at, value);
        case sizeof(std::uint16_t):
            return writeAs<std::uint16_t>(at, value);
        default:
            return writeAs<std::uint64_t>(at, value);
    }
}

std::size_t ChildBlock::exactBytes(const ChildBatch& batch) noexcept {
    return static_cast<std::size_t>(
        Plan(batch.count, batch.entries.size(), 0, 0).totalBytes());
}

void ChildBlock::write(std::uint8_t* memory, const ChildBatch& batch) noexcept {
    begin(memory, Plan(batch.count, batch.entries.size(), 0, 0)).append(batch);
}

ChildBlock::Plan ChildBlock::planToGrow(
    std::uint64_t moreChildren, std::uint64_t moreBytes) const noexcept {
    constexpr std::uint64_t growth = 8;
    const std::uint64_t used = usedBytes();
    return {count() + moreChildren, used + moreBytes, used / growth,
            isPadded() ? padded : std::uint8_t{0}};
}

std::uint8_t* ChildBlock::grownCopy(std::uint64_t moreChildren,
                                    std::uint64_t moreBytes) const {
    ChildBlock block = allocate(planToGrow(moreChildren, moreBytes));
    const std::uint64_t used = usedBytes();
    if (used > 0) std::memcpy(block.entries(), entries(), used);
    block.setAppended(used, all());
    return block.memory_;
}

std::uint8_t* ChildBlock::grow(std::uint64_t moreChildren,
                               std::uint64_t moreBytes) {
    const Plan plan = planToGrow(moreChildren, moreBytes);
    if (plan.numberBytes() != numberBytes()) {
        std::uint8_t* const copy = grownCopy(moreChildren, moreBytes);
        std::free(memory_);
        return copy;
    }
    void* const memory =
        std::realloc(memory_, static_cast<std::size_t>(plan.totalBytes()));
    if (memory == nullptr) throw std::bad_alloc();
    memory_ = static_cast<std::uint8_t*>(memory);
    setCapacity(plan.capacity);
    return memory_;
}

std::uint8_t* ChildBlock::shrink() noexcept {
    const std::uint64_t slack = slackBytes();
    if (slack == 0) return memory_;
    setCapacity(capacity() - slack);
    void* const memory = std::realloc(
        memory_,
        static_cast<std::size_t>(headerBytes(numberBytes()) + capacity()));
    // Without memory for it, the block stays where it is.
    return memory == nullptr ? memory_ : static_cast<std::uint8_t*>(memory);
}

// Moves the samples to where the capacity will end.
void ChildBlock::setCapacity(std::uint64_t bytes) noexcept {
    const std::uint64_t samples = sampleBytes(count(), numberBytes());
    std::memmove(entries() + bytes - samples, entries() + capacity() - samples,
                 samples);
    setNumber(2, bytes);
}

std::uint8_t* ChildBlock::paddedCopy() const {
    ChildBlock block = allocate(Plan(count(), paddedBytes(all()), 0, padded));
    block.append(all());
    return block.memory_;
}

std::uint64_t ChildBlock::slackBytes() const noexcept {
    if (memory_ == nullptr) return 0;
    return capacity() - usedBytes() - sampleBytes(count(), numberBytes());
}

// ---- Appending ----

std::uint64_t ChildBlock::paddedBytes(const ChildBatch& batch) noexcept {
    std::uint64_t bytes = 0;
    const std::uint8_t* from = batch.entries.data();
    for (std::uint64_t left = batch.count; left > 0; --left) {
        const std::size_t size = sizeOf(from, false);
        bytes += std::max(size, folderEntryBytes);
        from += size;
    }
    return bytes;
}

std::uint64_t ChildBlock::bytesFor(const ChildBatch& batch) const noexcept {
    return isPadded() ? paddedBytes(batch) : batch.entries.size();
}

bool ChildBlock::hasRoomFor(std::uint64_t moreChildren,
                            std::uint64_t moreBytes) const noexcept {
    if (memory_ == nullptr) return false;
    const std::uint64_t children = count() + moreChildren;
    if (children > maxNumber(numberBytes())) return false;
    const std::uint64_t samples = sampleBytes(children, numberBytes());
    const std::uint64_t free = capacity() - usedBytes();
    return moreBytes <= free && samples <= free - moreBytes;
}

void ChildBlock::append(const ChildBatch& batch) noexcept {
    std::uint8_t* to = entries() + usedBytes();
    const std::uint8_t* from = batch.entries.data();
    std::uint64_t bytes = batch.entries.size();
    if (!isPadded()) {
        if (bytes > 0) std::memcpy(to, from, bytes);
    } else {
        bytes = 0;
        for (std::uint64_t left = batch.count; left > 0; --left) {
            const std::size_t size = sizeOf(from, false);
            std::memcpy(to + bytes, from, size);
            bytes += std::max(size, folderEntryBytes);
            from += size;
        }
    }
    setAppended(bytes, batch);
}

// Counts the batch, whose entries were written after the last one.
void ChildBlock::setAppended(std::uint64_t bytes,
                             const ChildBatch& batch) noexcept {
    std::uint64_t position = count();
    std::uint64_t offset = usedBytes();
    const std::uint64_t end = position + batch.count;
    setNumber(0, end);
    setNumber(1, offset + bytes);
    if (batch.hasFolders) *memory_ |= folders;
    if (batch.hasFiles) *memory_ |= files;
    const bool isPadded = this->isPadded();
    const std::uint8_t* const first = entries();
    const std::uint64_t lastSampled =
        end == 0 ? 0 : (end - 1) / childrenPerSample * childrenPerSample;
    for (; position <= lastSampled; ++position) {
        if (position % childrenPerSample == 0 && position > 0)
            setNumberAt(sampleAt(position / childrenPerSample), offset);
        if (position < lastSampled) offset += sizeOf(first + offset, isPadded);
    }
}

void ChildBlock::promote(std::uint64_t position, FolderNode* folder) noexcept {
    std::uint8_t* entry = entries() + offsetOf(position);
    const bool fits = sizeOf(entry, isPadded()) == folderEntryBytes;
    writeFolder(entry, folder);
    if (!fits) *entry = packed::promotedMark;
    *memory_ |= folders;
}

// ---- Release ----
//
// A dead block needs no counts, so the numbers of its header serve the walk:
// the first says where it goes on, the third where its current folder is.

void ChildBlock::beginRelease() noexcept {
    if (memory_ != nullptr) setNumber(0, hasFolders() ? 0 : usedBytes());
}

std::uint8_t* ChildBlock::nextDeadFolder() noexcept {
    if (memory_ == nullptr) return nullptr;
    const std::uint64_t end = usedBytes();
    for (std::uint64_t offset = number(0); offset < end;) {
        std::uint8_t* entry = entries() + offset;
        const std::uint64_t next = offset + sizeOf(entry, isPadded());
        if (read(entry).folder != nullptr) {
            setNumber(0, next);
            setNumber(2, offset);
            return entry;
        }
        offset = next;
    }
    return nullptr;
}

std::uint8_t* ChildBlock::currentDeadFolder() const noexcept {
    return entries() + number(2);
}

}  // namespace tessel
