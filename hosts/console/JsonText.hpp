#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <string_view>

namespace tessel::console {

// Keeps its members in the order in which they are added.
using Json = nlohmann::ordered_json;

// Base64 with padding, as RFC 4648, section 4, has it.
std::string base64(std::string_view bytes);

// Bytes as JSON: a string if they are UTF-8, otherwise {"bytes": "<base64>"}.
Json jsonOfBytes(std::string_view bytes);

}  // namespace tessel::console
