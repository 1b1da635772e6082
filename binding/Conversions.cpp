#include "binding/Conversions.hpp"

#include <algorithm>
#include <exception>
#include <utility>

#include "binding/Errors.hpp"

namespace tessel {

namespace {

// Only a host that breaks its promise gets here.
class NoNativeObjectException : public std::exception {
public:
    const char* what() const noexcept override {
        return "The value is no instance of HuffmanPaths.";
    }
};

std::vector<std::u16string> textList(const HostArray* outerCell, bool inFolders,
                                     std::size_t outer) {
    HostInterface& from = host();
    const HostArray* const cell = from.hostCellElement(outerCell, outer);
    const std::size_t count = from.hostNumel(cell);
    checkElement(count, inFolders, outer + 1, 0);
    std::vector<std::u16string> texts;
    for (std::size_t i = 0; i < count; ++i) {
        const HostArray* const text = from.hostCellElement(cell, i);
        checkElement(from.hostNumel(text), inFolders, outer + 1, i + 1);
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

TextLists textLists(const HostArray* outerCell, bool inFolders) {
    const std::size_t count = host().hostNumel(outerCell);
    TextLists lists;
    lists.reserve(count);
    for (std::size_t i = 0; i < count; ++i) {
        lists.push_back(textList(outerCell, inFolders, i));
    }
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

OwnedArray decodedColumn(const HuffmanPathTree& coder,
                         const Components& components) {
    OwnedArray cell = createCell(components.size(), 1);
    for (std::size_t i = 0; i < components.size(); ++i) {
        setCell(cell, i, createText(coder.generatePathFrom(components[i])));
    }
    return cell;
}

OwnedArray decodedColumns(const HuffmanPathTree& coder,
                          const ComponentLists& lists) {
    OwnedArray cell = createCell(lists.size(), 1);
    for (std::size_t i = 0; i < lists.size(); ++i) {
        setCell(cell, i, decodedColumn(coder, lists[i]));
    }
    return cell;
}

void setCell(const OwnedArray& cell, std::size_t index, OwnedArray element) {
    host().hostSetCell(cell.get(), index, element.release());
}

}  // namespace tessel
