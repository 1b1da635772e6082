#include "hosts/embedded/Names.hpp"

namespace tessel::embedded {

const Name* NameTable::intern(std::string_view text) {
    if (text.empty()) return nullptr;
    auto found = names_.find(text);
    if (found == names_.end()) found = names_.emplace(text).first;
    return &*found;
}

}  // namespace tessel::embedded
