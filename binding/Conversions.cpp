#include "binding/Conversions.hpp"

#include <algorithm>
#include <exception>
#include <utility>

namespace tessel::binding {

namespace {

// Only a host that breaks its promise gets here.
class NoNativeObjectException : public std::exception {
public:
    const char* what() const noexcept override {
        return "The value is no instance of HuffmanPaths.";
    }
};

std::vector<std::u16string> textList(const HostArray* outerCell,
                                     Element element, std::size_t outer) {
    HostInterface& from = host();
    const HostArray* const cell = from.hostCellElement(outerCell, outer);
    const std::size_t count = from.hostNumel(cell);
    checkNotEmpty(count, element, {outer + 1});
    std::vector<std::u16string> texts;
    for (std::size_t i = 0; i < count; ++i) {
        const HostArray* const text = from.hostCellElement(cell, i);
        checkNotEmpty(from.hostNumel(text), element, {outer + 1, i + 1});
        texts.push_back(from.hostGetUString(text));
    }
    return texts;
}

template <class Value>
OwnedArray columnOf(std::span<const Value> values,
                    HostNumericClass numericClass) {
    OwnedArray array = createNumeric(values.size(), numericClass);
    auto* const data = static_cast<Value*>(host().hostNumericData(array.get()));
    std::copy(values.begin(), values.end(), data);
    return array;
}

}  // namespace

HuffmanPathTree& coderOf(const HostArray* instance) {
    void* const native =
        host().hostNativeObject(instance, huffmanPathsFullName);
    if (native == nullptr) throw NoNativeObjectException();
    return *static_cast<HuffmanPathTree*>(native);
}

TextLists textLists(const HostArray* outerCell, Element element) {
    const std::size_t count = host().hostNumel(outerCell);
    TextLists lists;
    lists.reserve(count);
    for (std::size_t i = 0; i < count; ++i)
        lists.push_back(textList(outerCell, element, i));
    return lists;
}

std::vector<double> doubles(const HostArray* numeric) {
    std::vector<double> values;
    host().hostRealElements(numeric, values);
    return values;
}

std::vector<std::uint8_t> bytes(const HostArray* numeric) {
    std::vector<std::uint8_t> values;
    host().hostRealElements(numeric, values);
    return values;
}

OwnedArray column(std::span<const double> values) {
    return columnOf(values, HostNumericClass::Double);
}

OwnedArray column(std::span<const std::uint8_t> values) {
    return columnOf(values, HostNumericClass::Uint8);
}

void setCell(const OwnedArray& cell, std::size_t index, OwnedArray element) {
    host().hostSetCell(cell.get(), index, element.release());
}

}  // namespace tessel::binding
