#pragma once

#include <set>
#include <string>
#include <string_view>

#include "binding/HostInterface.hpp"

namespace tessel::embedded {

// A text of a NameTable.
class Name final : public HostOpaque<HostNameTag> {
public:
    explicit Name(std::string_view text) : text_(text) {}
    const std::string& str() const noexcept { return text_; }

private:
    std::string text_;
};

// NameTable keeps each text once, so that names can be compared as pointers.
//
// Ownership: owns the names, which live as long as the table.
class NameTable {
public:
    // The name of a text; null for the empty text.
    const Name* intern(std::string_view text);

private:
    struct Order {
        using is_transparent = void;
        bool operator()(const Name& a, const Name& b) const {
            return a.str() < b.str();
        }
        bool operator()(const Name& a, std::string_view b) const {
            return a.str() < b;
        }
        bool operator()(std::string_view a, const Name& b) const {
            return a < b.str();
        }
    };
    std::set<Name, Order> names_;
};

}  // namespace tessel::embedded
