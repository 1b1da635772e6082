#include "hosts/embedded/Value.hpp"

#include <algorithm>
#include <array>
#include <limits>
#include <stdexcept>

namespace tessel::embedded {

namespace {

void requireCount(const Dimensions& dimensions, std::size_t held,
                  std::size_t heldForEach = 1) {
    if (held % heldForEach != 0 ||
        elementCount(dimensions) != held / heldForEach) {
        throw std::invalid_argument(
            "The number of elements does not fit the dimensions.");
    }
}

}  // namespace

const char* className(ValueClass valueClass) noexcept {
    static constexpr std::array names = {"double", "char",   "uint8", "logical",
                                         "cell",   "struct", "object"};
    return names[static_cast<std::size_t>(valueClass)];
}

std::size_t elementCount(const Dimensions& dimensions) {
    std::size_t count = 1;
    for (const std::size_t extent : dimensions) {
        if (extent != 0 &&
            count > std::numeric_limits<std::size_t>::max() / extent) {
            throw std::length_error("The dimensions are too large.");
        }
        count *= extent;
    }
    return count;
}

Value::Value(const Dimensions& dimensions, Elements content, bool isComplex)
    : elements_(std::move(content)), complexParts_(isComplex) {
    if (dimensions.size() == 2) {
        rows_ = dimensions[0];
        columns_ = dimensions[1];
    } else {
        otherShape_ = std::make_shared<const Dimensions>(dimensions);
    }
}

Value::Value(Value&& other) noexcept
    : elements_(std::move(other.elements_)),
      rows_(std::exchange(other.rows_, 0)),
      columns_(std::exchange(other.columns_, 0)),
      otherShape_(std::move(other.otherShape_)),
      complexParts_(other.complexParts_) {}

Value& Value::operator=(Value&& other) noexcept {
    Value taken(std::move(other));
    elements_.swap(taken.elements_);
    std::swap(rows_, taken.rows_);
    std::swap(columns_, taken.columns_);
    otherShape_.swap(taken.otherShape_);
    std::swap(complexParts_, taken.complexParts_);
    return *this;
}

Dimensions Value::dimensions() const {
    return otherShape_ ? *otherShape_ : Dimensions{rows_, columns_};
}

std::size_t Value::numel() const {
    return otherShape_ ? elementCount(*otherShape_) : rows_ * columns_;
}

Value Value::chars(const Dimensions& dimensions, std::u16string text) {
    requireCount(dimensions, text.size());
    return {dimensions, std::move(text)};
}

Value Value::doubles(const Dimensions& dimensions, std::vector<double> values) {
    requireCount(dimensions, values.size());
    return {dimensions, std::move(values)};
}

Value Value::complexDoubles(const Dimensions& dimensions,
                            std::vector<double> parts) {
    requireCount(dimensions, parts.size(), 2);
    return {dimensions, std::move(parts), true};
}

Value Value::bytes(const Dimensions& dimensions,
                   std::vector<std::uint8_t> values) {
    requireCount(dimensions, values.size());
    return {dimensions, std::move(values)};
}

Value Value::logicals(const Dimensions& dimensions,
                      std::vector<std::uint8_t> truths) {
    requireCount(dimensions, truths.size());
    return {dimensions, Logicals{std::move(truths)}};
}

Value Value::objects(const Dimensions& dimensions,
                     std::vector<std::shared_ptr<Instance>> instances) {
    requireCount(dimensions, instances.size());
    if (std::find(instances.begin(), instances.end(), nullptr) !=
        instances.end()) {
        throw std::invalid_argument("An object needs its instance.");
    }
    return {dimensions, std::move(instances)};
}

Value Value::cell(const Dimensions& dimensions) {
    std::vector<Value> unset(elementCount(dimensions));
    return {dimensions, std::move(unset)};
}

Value Value::structure(const Dimensions& dimensions) {
    elementCount(dimensions);  // refuses dimensions that are too large
    return {dimensions, Fields{}};
}

Value Value::text(std::u16string_view text) {
    return {{1, text.size()}, std::u16string(text)};
}

Value Value::scalar(double number) {
    return {{1, 1}, std::vector<double>{number}};
}

Value Value::logical(bool truth) {
    return logicals({1, 1}, {static_cast<std::uint8_t>(truth)});
}

Value Value::column(std::vector<double> values) {
    const std::size_t count = values.size();
    return {{count, 1}, std::move(values)};
}

Value Value::byteColumn(std::vector<std::uint8_t> values) {
    const std::size_t count = values.size();
    return {{count, 1}, std::move(values)};
}

Value Value::cellRow(std::vector<Value> elements) {
    const std::size_t count = elements.size();
    return {{1, count}, std::move(elements)};
}

Value Value::cellColumn(std::vector<Value> elements) {
    const std::size_t count = elements.size();
    return {{count, 1}, std::move(elements)};
}

Value Value::texts(const std::vector<std::u16string>& rows) {
    std::vector<Value> elements;
    elements.reserve(rows.size());
    for (const std::u16string& row : rows) elements.push_back(text(row));
    return cellColumn(std::move(elements));
}

Value Value::textLists(const std::vector<std::vector<std::u16string>>& lists) {
    std::vector<Value> elements;
    elements.reserve(lists.size());
    for (const auto& rows : lists) elements.push_back(texts(rows));
    return cellColumn(std::move(elements));
}

ValueClass Value::valueClass() const noexcept {
    return static_cast<ValueClass>(elements_.index());
}

const std::u16string& Value::charData() const {
    return std::get<std::u16string>(elements_);
}

const std::vector<double>& Value::doubleData() const {
    return std::get<std::vector<double>>(elements_);
}

std::vector<double>& Value::doubleData() {
    return std::get<std::vector<double>>(elements_);
}

const std::vector<std::uint8_t>& Value::byteData() const {
    return std::get<std::vector<std::uint8_t>>(elements_);
}

std::vector<std::uint8_t>& Value::byteData() {
    return std::get<std::vector<std::uint8_t>>(elements_);
}

bool Value::truth(std::size_t index) const {
    return std::get<Logicals>(elements_).truths.at(index) != 0;
}

const std::shared_ptr<Instance>& Value::instance(std::size_t index) const {
    return std::get<std::vector<std::shared_ptr<Instance>>>(elements_).at(
        index);
}

const Value& Value::element(std::size_t index) const {
    return std::get<std::vector<Value>>(elements_).at(index);
}

void Value::setElement(std::size_t index, Value element) {
    std::get<std::vector<Value>>(elements_).at(index) = std::move(element);
}

const std::vector<Value>* Value::findField(std::string_view name) const {
    for (const auto& [columnName, values] :
         std::get<Fields>(elements_).columns) {
        if (columnName == name) return &values;
    }
    return nullptr;
}

std::vector<std::string> Value::fieldNames() const {
    std::vector<std::string> names;
    for (const auto& [name, values] : std::get<Fields>(elements_).columns) {
        names.push_back(name);
    }
    return names;
}

bool Value::hasField(std::string_view name) const {
    return findField(name) != nullptr;
}

const Value& Value::field(std::string_view name, std::size_t index) const {
    const std::vector<Value>* const values = findField(name);
    if (values == nullptr) throw std::out_of_range("There is no such field.");
    return values->at(index);
}

void Value::setField(std::string_view name, Value value, std::size_t index) {
    auto& present = std::get<Fields>(elements_).columns;
    auto found = std::find_if(present.begin(), present.end(),
                              [&](const auto& c) { return c.first == name; });
    if (found == present.end()) {
        present.emplace_back(name, std::vector<Value>(numel()));
        found = std::prev(present.end());
    }
    found->second.at(index) = std::move(value);
}

bool Value::Fields::operator==(const Fields& other) const {
    return columns == other.columns;
}

bool operator==(const Value& a, const Value& b) {
    return a.dimensions() == b.dimensions() &&
           a.complexParts_ == b.complexParts_ && a.elements_ == b.elements_;
}

}  // namespace tessel::embedded
