#pragma once

#include <cstddef>
#include <exception>
#include <memory>
#include <string>
#include <vector>

#include "binding/HostInterface.hpp"

namespace tessel::binding {

// MessageIdError is an error that the host knows by a message identifier: a
// component, a colon and a key.
//
// Invariants: what() is the full identifier.
// Ownership: a plain value.
class MessageIdError : public std::exception {
public:
    const std::string& identifier() const noexcept { return fullIdentifier_; }
    const std::vector<HostMessageArgument>& argumentList() const noexcept {
        return arguments_;
    }
    const char* what() const noexcept override {
        return fullIdentifier_.c_str();
    }

    virtual std::unique_ptr<MessageIdError> clone() const = 0;

    // Throws a copy of the error as its own type.
    virtual void rethrow() const = 0;

protected:
    MessageIdError(std::vector<HostMessageArgument> arguments,
                   std::string component, std::string key);

private:
    std::vector<HostMessageArgument> arguments_;
    std::string component_;
    std::string key_;
    std::string fullIdentifier_;
};

// Raises an error of the host. If the host's operation returns, throws the
// error as its own type instead.
[[noreturn]] void raiseHostError(const MessageIdError& error);

// Which of the two lists of addPaths an element is in.
enum class Element { Folder, File };

// The position of an element, counted from 1: an entry of the list, or, if
// `inner` is not 0, a text in that entry.
struct ElementPosition {
    std::size_t outer = 1;
    std::size_t inner = 0;
};

// Does nothing if `count` is not 0. Otherwise raises folderElementEmpty or
// fileElementEmpty at that position.
void checkNotEmpty(std::size_t count, Element element,
                   ElementPosition position);

}  // namespace tessel::binding

// The errors that the binding itself raises. A type and its namespace spell its
// identifier, so they keep its letters.
// NOLINTBEGIN(readability-identifier-naming)
namespace VELOX::datastoreio::huffmanpaths {

// Gives an error type its copy and its rethrow.
template <class Self>
class ErrorOf : public tessel::binding::MessageIdError {
public:
    std::unique_ptr<tessel::binding::MessageIdError> clone() const override {
        return std::make_unique<Self>(static_cast<const Self&>(*this));
    }
    void rethrow() const override { throw static_cast<const Self&>(*this); }

protected:
    ErrorOf(std::vector<tessel::HostMessageArgument> arguments, std::string key)
        : MessageIdError(std::move(arguments), "VELOX:datastoreio:huffmanpaths",
                         std::move(key)) {}
};

// Mode "files" was given a cell with an odd number of elements.
class fileListNotEven : public ErrorOf<fileListNotEven> {
public:
    fileListNotEven() : ErrorOf({}, "fileListNotEven") {}
};

// addPaths was given different numbers of folders and of file lists.
class unequalNumFolderFileList : public ErrorOf<unequalNumFolderFileList> {
public:
    unequalNumFolderFileList() : ErrorOf({}, "unequalNumFolderFileList") {}
};

// addPaths was given an empty folder, or an empty text inside one.
class folderElementEmpty : public ErrorOf<folderElementEmpty> {
public:
    explicit folderElementEmpty(std::string position)
        : ErrorOf({std::move(position)}, "folderElementEmpty") {}
};

// addPaths was given an empty file list, or an empty text inside one.
class fileElementEmpty : public ErrorOf<fileElementEmpty> {
public:
    explicit fileElementEmpty(std::string position)
        : ErrorOf({std::move(position)}, "fileElementEmpty") {}
};

}  // namespace VELOX::datastoreio::huffmanpaths
// NOLINTEND(readability-identifier-naming)
