#pragma once

#include <sys/types.h>

#include <cstdint>
#include <string>
#include <string_view>

#include "archive/ArchiveTarget.hpp"

namespace tessel::archive {

// Replaces a file as a whole. The bytes go to a hidden file beside it, named
// `.NAME.tessel-XXXXXX.tmp`; `commit` flushes that, renames it, and flushes
// the folder. So the target is the old file or the new one at every moment,
// after a crash too.
//
// The hidden file is locked (flock) while its writer lives. A killed writer
// leaves it behind unlocked, and the next writer of the same target removes
// it. On a file system without locks, it stays.
//
// The new file has the permissions of the old one, if there was one. If the
// target is a symbolic link, what it points to is replaced, or made.
//
// All members throw std::system_error, which names the file.
class FileTarget final : public ArchiveTarget {
public:
    explicit FileTarget(const std::string& file);
    ~FileTarget() override;
    FileTarget(const FileTarget&) = delete;
    FileTarget& operator=(const FileTarget&) = delete;

    void append(Bytes bytes) override;
    void rewriteStart(Bytes bytes) override;
    void commit() override;

    // Whether a path names a hidden file of a writer of this target, so that
    // whoever lists the target's folder can leave it out.
    static bool isHiddenFile(const std::string& target, std::string_view path);

private:
    FileTarget() = default;

    bool tryCreate();
    void removeTemporary() noexcept;
    void takePermissions(mode_t mode) const;
    void write(Bytes bytes, std::uint64_t offset) const;
    void flushFolder() const;

    std::string file_;       // the target, after links
    std::string folder_;     // where it is, with a final '/'
    std::string prefix_;     // of the names of its hidden files
    std::string temporary_;  // path of the hidden file; empty: there is none
    int descriptor_ = -1;
    std::uint64_t size_ = 0;
};

}  // namespace tessel::archive
