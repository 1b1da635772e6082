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
    HostException(std::string identifier,
                  std::vector<HostMessageArgument> arguments, std::string text);

    // Component, colon, key.
    const std::string& identifier() const noexcept { return identifier_; }
    const std::vector<HostMessageArgument>& arguments() const noexcept {
        return arguments_;
    }
    const char* what() const noexcept override { return text_.c_str(); }

private:
    std::string identifier_;
    std::vector<HostMessageArgument> arguments_;
    std::string text_;
};

// The decimal number or the text.
std::string toText(const HostMessageArgument& argument);

}  // namespace tessel::embedded
