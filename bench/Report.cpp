#include "bench/Report.hpp"

#include <sys/utsname.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <stdexcept>
#include <thread>

namespace bench {

namespace {

std::string quoted(std::string_view value) {
    std::string text = "\"";
    for (const char c : value) {
        if (c == '"' || c == '\\') text += '\\';
        text += static_cast<unsigned char>(c) < 0x20 ? ' ' : c;
    }
    return text + '"';
}

std::string formatted(const char* format, double number) {
    std::array<char, 64> text{};
    const int length = std::snprintf(text.data(), text.size(), format, number);
    return {text.data(), static_cast<std::size_t>(length)};
}

std::string padded(const std::string& cell, std::size_t width, bool left) {
    const std::string blanks(width - cell.size(), ' ');
    return left ? cell + blanks : blanks + cell;
}

std::string processorName() {
    std::ifstream file("/proc/cpuinfo");
    for (std::string line; std::getline(file, line);) {
        const std::size_t colon = line.find(": ");
        if (line.starts_with("model name") && colon != std::string::npos) {
            return line.substr(colon + 2);
        }
    }
    return "unknown";
}

}  // namespace

std::string grouped(std::size_t number) {
    std::string digits = std::to_string(number);
    for (std::size_t i = digits.size(); i > 3;) {
        i -= 3;
        digits.insert(i, 1, ',');
    }
    return digits;
}

std::string fixed(double number, int digits) {
    return formatted(("%." + std::to_string(digits) + "f").c_str(), number);
}

std::string threeDigits(double number) {
    if (std::isnan(number)) return "-";
    if (number == 0 || std::isinf(number)) return formatted("%g", number);
    const int before = static_cast<int>(std::floor(std::log10(number))) + 1;
    return fixed(number, std::clamp(3 - before, 0, 9));
}

std::string Table::text() const {
    std::vector<std::size_t> widths;
    for (const auto& cells : rows_) {
        widths.resize(std::max(widths.size(), cells.size()));
        for (std::size_t i = 0; i < cells.size(); ++i) {
            widths[i] = std::max(widths[i], cells[i].size());
        }
    }
    std::string all;
    for (std::size_t r = 0; r < rows_.size(); ++r) {
        for (std::size_t i = 0; i < widths.size(); ++i) {
            const std::string cell =
                i < rows_[r].size() ? rows_[r][i] : std::string();
            all += "| " + padded(cell, widths[i], i == 0) + ' ';
        }
        all += "|\n";
        if (r != 0) continue;
        for (std::size_t i = 0; i < widths.size(); ++i) {
            all += '|' + std::string(widths[i] + 1, '-') + (i == 0 ? "-" : ":");
        }
        all += "|\n";
    }
    return all;
}

void Json::key(std::string_view name) {
    if (!body_.empty()) body_ += ", ";
    body_ += quoted(name) + ": ";
}

Json& Json::number(std::string_view name, double value) {
    key(name);
    body_ += std::isfinite(value) ? formatted("%.17g", value) : "null";
    return *this;
}

Json& Json::text(std::string_view name, std::string_view value) {
    key(name);
    body_ += quoted(value);
    return *this;
}

Json& Json::object(std::string_view name, const Json& value) {
    key(name);
    body_ += value.dump();
    return *this;
}

Json& Json::list(std::string_view name, const std::vector<Json>& values) {
    key(name);
    body_ += '[';
    for (std::size_t i = 0; i < values.size(); ++i) {
        body_ += (i == 0 ? "\n " : ",\n ") + values[i].dump();
    }
    body_ += ']';
    return *this;
}

std::vector<std::pair<std::string, std::string>> machineFacts() {
    utsname system{};
    ::uname(&system);
#ifdef __clang__
    const std::string compiler = __VERSION__;
#else
    const std::string compiler = "g++ " __VERSION__;
#endif
    return {
        {"compiler", compiler},
        {"processor", processorName()},
        {"cores", std::to_string(std::thread::hardware_concurrency())},
        {"system", std::string(&system.sysname[0]) + " " + &system.machine[0]}};
}

void writeJson(const std::string& file, Json json) {
    Json machine;
    for (const auto& [name, value] : machineFacts()) machine.text(name, value);
    json.object("machine", machine);
    std::ofstream out(file);
    out << json.dump() << '\n';
    out.flush();
    if (!out) throw std::runtime_error("Cannot write " + file + ".");
}

}  // namespace bench
