#include "hosts/embedded/Names.hpp"

namespace tessel::embedded {

const Name* NameTable::intern(std::string_view text) {
    if (text.empty()) return nullptr;
    auto found = names.find(text);
    if (found == names.end()) found = names.emplace(text).first;
    return &*found;
}

}  // namespace tessel::embedded
