#pragma once

#include <cstdint>
#include <exception>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

#include "binding/HostInterface.hpp"

namespace tessel::embedded {

// HostException is an error of the host, whoever raised it: the plug-in through
// HostError, or the host itself. what() is the message text.
class HostException : public std::exception {
public:
    HostException(std::string messageIdentifier,
                  std::vector<HostMessageArgument> messageArguments,
                  std::string messageText);

    // Component, colon, key.
    const std::string& identifier() const noexcept { return name_; }
    const std::vector<HostMessageArgument>& arguments() const noexcept {
        return values_;
    }
    const char* what() const noexcept override { return text_.c_str(); }

private:
    std::string name_;
    std::vector<HostMessageArgument> values_;
    std::string text_;
};

// The decimal number or the text.
std::string toText(const HostMessageArgument& argument);

}  // namespace tessel::embedded
