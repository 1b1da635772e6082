#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

// Numbers as tables for people and as JSON for scripts.
namespace bench {

// "1,234,567"
std::string grouped(std::size_t number);
// With this many digits after the point: "12.30"
std::string fixed(double number, int digits);
// With three digits that count, more if it is large: "0.0123", "1.23", "1234".
// "-" for what is not a number.
std::string threeDigits(double number);

// A table in markdown whose columns are also aligned as plain text, the first
// one to the left.
class Table {
public:
    explicit Table(std::vector<std::string> heads) { row(std::move(heads)); }
    void row(std::vector<std::string> cells) {
        rows_.push_back(std::move(cells));
    }
    std::string text() const;

private:
    std::vector<std::vector<std::string>> rows_;
};

// A JSON object, built in order.
class Json {
public:
    Json& number(std::string_view name, double value);
    Json& text(std::string_view name, std::string_view value);
    Json& object(std::string_view name, const Json& value);
    Json& list(std::string_view name, const std::vector<Json>& values);
    std::string dump() const { return "{" + body_ + "}"; }

private:
    void key(std::string_view name);
    std::string body_;
};

// One line each: compiler, processor, cores, system.
std::vector<std::pair<std::string, std::string>> machineFacts();

// Writes `json` with the machine's facts to a file. Throws
// std::runtime_error if that fails.
void writeJson(const std::string& file, Json json);

}  // namespace bench
