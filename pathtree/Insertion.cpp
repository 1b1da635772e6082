#include "pathtree/Insertion.hpp"

namespace tessel {

std::uint64_t Insertion::make(ComponentView value, NodePool::Kind kind) {
    const std::size_t position = node_->children().size();
    if (firstChanged_ == nullptr) {
        firstChanged_ = node_;
        childrenBefore_ = position;
    }
    node_ = &pool_.add(*node_, value, kind);
    return position;
}

// All new nodes are below the first one that was made.
void Insertion::takeBack() noexcept {
    index_.clear();  // it may know nodes that go
    if (firstChanged_ != nullptr)
        NodePool::truncate(*firstChanged_, childrenBefore_);
    track_.resize(trackLength_);
}

}  // namespace tessel
