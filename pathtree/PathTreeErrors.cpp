#include "pathtree/PathTreeErrors.hpp"

namespace tessel {

const char* NoMorePathException::what() const noexcept {
    return "No more paths to provide.";
}

const char* NoTreeToTraverseException::what() const noexcept {
    return "Cannot traverse an empty tree for a path.";
}

const char* EmptyPathForTraverseException::what() const noexcept {
    return "Cannot traverse an tree for an empty path track.";
}

const char* UnknownNodeTypeException::what() const noexcept {
    return "Cannot determine the node type for the given value.";
}

}  // namespace tessel
