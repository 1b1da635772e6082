#pragma once

#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

#include "binding/HostInterface.hpp"

namespace tessel::embedded {

class Instance;

// The classes of values. An object's exact class is its instances' business.
enum class ValueClass { Double, Char, Uint8, Logical, Cell, Struct, Object };

// "double", "char" and so on; "object" for objects.
const char* className(ValueClass valueClass) noexcept;

using Dimensions = std::vector<std::size_t>;

// The product of the dimensions, 1 without any. Throws std::length_error if it
// does not fit.
std::size_t elementCount(const Dimensions& dimensions);

// Value is one value of the host: an array of any dimensions whose elements, in
// column-major order, are all of one class.
//
// Invariants: there are as many elements as elementCount(dimensions()), except
//   that complex data holds two numbers for each, real part first.
// Ownership: a regular value; copying copies all elements. Instances alone are
//   shared: a copied object refers to the same instances.
// Threads: as any standard container.
// Failures: an accessor for another class than the value's throws
//   std::bad_variant_access, an index outside throws std::out_of_range.
class Value final : public HostArray {
public:
    // 0 x 0 double: what a cell element or field is before it is set.
    Value() = default;
    Value(const Value&) = default;
    Value& operator=(const Value&) = default;
    // Both leave the other value without elements.
    Value(Value&& other) noexcept;
    Value& operator=(Value&& other) noexcept;
    ~Value() = default;

    // Each throws std::invalid_argument if the number of elements is not the
    // one that the dimensions ask for, or an instance is null.
    static Value chars(const Dimensions& dimensions, std::u16string text);
    static Value doubles(const Dimensions& dimensions,
                         std::vector<double> values);
    // Interleaved: real part, imaginary part, real part, and so on.
    static Value complexDoubles(const Dimensions& dimensions,
                                std::vector<double> parts);
    static Value bytes(const Dimensions& dimensions,
                       std::vector<std::uint8_t> values);
    static Value logicals(const Dimensions& dimensions,
                          std::vector<std::uint8_t> truths);
    static Value objects(const Dimensions& dimensions,
                         std::vector<std::shared_ptr<Instance>> instances);

    // Elements are 0 x 0 doubles, a struct has no fields.
    static Value cell(const Dimensions& dimensions);
    static Value structure(const Dimensions& dimensions = {1, 1});

    // A char row; a double or logical scalar; a double or uint8 column; a cell
    // row or column of the given elements.
    static Value text(std::u16string_view text);
    static Value scalar(double number);
    static Value logical(bool truth);
    static Value column(std::vector<double> values);
    static Value byteColumn(std::vector<std::uint8_t> values);
    static Value cellRow(std::vector<Value> elements);
    static Value cellColumn(std::vector<Value> elements);
    // A cell column of char rows, and one of such cells.
    static Value texts(const std::vector<std::u16string>& rows);
    static Value textLists(
        const std::vector<std::vector<std::u16string>>& lists);

    ValueClass valueClass() const noexcept;
    Dimensions dimensions() const;
    std::size_t numel() const;
    bool isComplex() const noexcept { return complexParts_; }

    const std::u16string& charData() const;
    // Of complex data both parts, interleaved.
    const std::vector<double>& doubleData() const;
    std::vector<double>& doubleData();
    const std::vector<std::uint8_t>& byteData() const;
    std::vector<std::uint8_t>& byteData();
    bool truth(std::size_t index) const;
    const std::shared_ptr<Instance>& instance(std::size_t index) const;

    const Value& element(std::size_t index) const;
    void setElement(std::size_t index, Value element);

    // Fields, in the order in which they were first set.
    std::vector<std::string> fieldNames() const;
    bool hasField(std::string_view name) const;
    const Value& field(std::string_view name, std::size_t index = 0) const;
    // Adds the field to all elements if it is new.
    void setField(std::string_view name, Value value, std::size_t index = 0);

    // Equal class, dimensions and elements; instances by identity.
    friend bool operator==(const Value& a, const Value& b);

private:
    struct Logicals {
        std::vector<std::uint8_t> truths;
        friend bool operator==(const Logicals&, const Logicals&) = default;
    };
    struct Fields {
        std::vector<std::pair<std::string, std::vector<Value>>> columns;
        bool operator==(const Fields& other) const;
    };
    // In the order of ValueClass.
    using Elements =
        std::variant<std::vector<double>, std::u16string,
                     std::vector<std::uint8_t>, Logicals, std::vector<Value>,
                     Fields, std::vector<std::shared_ptr<Instance>>>;

    Value(const Dimensions& dimensions, Elements content,
          bool isComplex = false);

    const std::vector<Value>* findField(std::string_view name) const;

    Elements elements_;
    std::size_t rows_ = 0;
    std::size_t columns_ = 0;
    // All dimensions, if there are not two of them; rows and columns are then
    // 0. Values never change it, so copies share it.
    std::shared_ptr<const Dimensions> otherShape_;
    bool complexParts_ = false;
};

}  // namespace tessel::embedded
