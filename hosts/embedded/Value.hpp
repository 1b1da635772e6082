#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "binding/HostInterface.hpp"
#include "hosts/embedded/Array.hpp"

namespace tessel::embedded {

class Instance;

// "double", "char" and so on; "object" for objects.
const char* className(ValueClass valueClass) noexcept;

// Value is one value of the host: an array of any dimensions whose elements, in
// column-major order, are all of one class.
//
// Invariants: there are as many elements as elementCount(dimensions()), except
//   that complex data holds two numbers for each, real part first.
// Ownership: a regular value. Copies share one array until one of them is
//   changed, which then gets an array of its own. Instances are always shared:
//   a copied object refers to the same instances.
// Threads: as any standard container.
// Cost: a pointer; copying counts a reference. Texts, cells and logicals take
//   one heap block each. Cells and structs may be nested as deep as there is
//   memory: nothing here recurses.
// Failures: an accessor for another class than the value's throws
//   std::bad_variant_access, an index outside throws std::out_of_range.
class Value {
public:
    using Cells = InlineArray<Value>;

    // 0 x 0 double: what a cell element or field is before it is set.
    Value() noexcept = default;
    Value(const Value& other) noexcept : array_(other.array_) {
        if (array_ != nullptr) array_->addReference();
    }
    // Both leave the other value 0 x 0.
    Value(Value&& other) noexcept
        : array_(std::exchange(other.array_, nullptr)) {}
    Value& operator=(Value other) noexcept {
        std::swap(array_, other.array_);
        return *this;
    }
    ~Value() {
        if (array_ != nullptr) array_->drop();
    }

    // Each throws std::invalid_argument if the number of elements is not the
    // one that the dimensions ask for, or an instance is null.
    static Value chars(const Dimensions& dimensions, std::u16string_view text);
    static Value doubles(const Dimensions& dimensions,
                         std::vector<double> values);
    // Interleaved: real part, imaginary part, real part, and so on.
    static Value complexDoubles(const Dimensions& dimensions,
                                std::vector<double> parts);
    static Value bytes(const Dimensions& dimensions,
                       std::vector<std::uint8_t> values);
    static Value logicals(const Dimensions& dimensions,
                          const std::vector<std::uint8_t>& truths);
    static Value objects(const Dimensions& dimensions,
                         std::vector<std::shared_ptr<Instance>> instances);

    // Elements are 0 x 0 doubles, a struct has no fields.
    static Value cell(const Dimensions& dimensions);
    static Value cell(std::size_t rows, std::size_t columns);
    static Value structure(const Dimensions& dimensions = {1, 1});

    // A char row; a double or logical scalar; a double or uint8 column; a cell
    // row or column of the given elements.
    static Value text(std::u16string_view text);
    static Value scalar(double number);
    static Value logical(bool truth);
    static Value column(std::vector<double> values);
    static Value byteColumn(std::vector<std::uint8_t> values);
    static Value cellRow(const std::vector<Value>& elements);
    static Value cellColumn(const std::vector<Value>& elements);
    // A cell column of char rows, and one of such cells.
    static Value texts(const std::vector<std::u16string>& rows);
    static Value textLists(
        const std::vector<std::vector<std::u16string>>& lists);

    ValueClass valueClass() const noexcept { return shown().valueClass(); }
    Dimensions dimensions() const { return shown().shape().dimensions(); }
    std::size_t numel() const noexcept { return shown().numel(); }
    bool isComplex() const noexcept;

    // Views and references hold as long as the value is neither changed nor
    // gone.
    std::u16string_view charData() const {
        const auto text = as<Texts>(ValueClass::Char).elements();
        return {text.data(), text.size()};
    }
    // Of complex data both parts, interleaved.
    const std::vector<double>& doubleData() const;
    const std::vector<std::uint8_t>& byteData() const;
    bool truth(std::size_t index) const;
    const std::shared_ptr<Instance>& instance(std::size_t index) const;

    const Value& element(std::size_t index) const {
        const auto elements = as<Cells>(ValueClass::Cell).elements();
        if (index >= elements.size()) refuseIndex();
        return elements[index];
    }
    void setElement(std::size_t index, Value element);

    // Fields, in the order in which they were first set.
    std::vector<std::string> fieldNames() const;
    bool hasField(std::string_view name) const;
    const Value& field(std::string_view name, std::size_t index = 0) const;
    // Adds the field to all elements if it is new.
    void setField(std::string_view name, Value value, std::size_t index = 0);

    // A copy that shares no array with this value.
    Value clone() const { return Value(shown().clone()); }

    // Equal class, dimensions and elements; instances by identity.
    friend bool operator==(const Value& a, const Value& b);

    // ---- Values as a plug-in sees them ----

    // The value's array, borrowed: as long as the value is neither changed nor
    // gone. The second one first gets an array of its own, which may be
    // changed.
    const HostArray* array() const noexcept { return &shown(); }
    HostArray* ownArray() { return &changeable(); }

    // The numbers of a real double or uint8 array, to be written.
    void* ownNumericData();

    // Hands the array out, with its reference, and leaves the value 0 x 0.
    HostArray* release();

    // The value of an array that was handed over: from release() or from a
    // creating operation. Null gives 0 x 0.
    static Value adopt(HostArray* array) noexcept;

    // The value of a borrowed array, for longer than it is borrowed.
    static Value share(const HostArray* array) noexcept;

private:
    friend class Array;
    friend class BorrowedValue;

    // A field's name and its values, one per element of the struct.
    using Column = std::pair<std::string, std::vector<Value>>;
    struct Fields {
        std::vector<Column> columns;
        bool operator==(const Fields& other) const = default;
    };
    using ArrayPairs = std::vector<std::pair<const Array*, const Array*>>;
    struct Doubles {
        std::vector<double> parts;
        bool isComplex;
        bool operator==(const Doubles& other) const = default;
    };
    using Texts = InlineArray<char16_t>;
    using Truths = InlineArray<std::uint8_t>;
    using Numbers = ContainerArray<Doubles>;
    using Bytes = ContainerArray<std::vector<std::uint8_t>>;
    using Structs = ContainerArray<Fields>;
    using Objects = ContainerArray<std::vector<std::shared_ptr<Instance>>>;

    // Takes over the array's one reference.
    explicit Value(Array* array) noexcept : array_(array) {}

    static Value complexOrReal(Shape shape, std::vector<double> parts,
                               bool isComplex);
    // The array of a value without one; never changed, never deleted.
    static const Array& empty() noexcept;

    const Array& shown() const noexcept {
        return array_ != nullptr ? *array_ : empty();
    }
    Array& changeable();
    template <class Kind>
    const Kind& as(ValueClass valueClass) const {
        const Array& array = shown();
        if (array.valueClass() != valueClass) refuseClass();
        return static_cast<const Kind&>(array);
    }
    [[noreturn]] static void refuseClass();
    [[noreturn]] static void refuseIndex();
    template <class Kind>
    Kind& changeableAs(ValueClass valueClass);
    const std::vector<Value>* findField(std::string_view name) const;

    // Calls visit(Value&) for each element of a cell and each field of a
    // struct, in the same order each time, until it returns false.
    template <class Visit>
    static void visitElements(Array& array, Visit visit);
    static Value* firstElement(Array& array) noexcept;
    // Whether two arrays are equal as far as one can see without a look into
    // the arrays in them, which are added to `inner`.
    static bool areAlike(const Array& a, const Array& b, ArrayPairs& inner);

    Array* array_ = nullptr;
};

// BorrowedValue is the value of an array that somebody else holds meanwhile. It
// takes no reference, so that looking into an array counts nothing.
class BorrowedValue {
public:
    explicit BorrowedValue(const HostArray* array) noexcept
        : value_(static_cast<Array*>(const_cast<HostArray*>(array))) {}
    BorrowedValue(BorrowedValue&&) noexcept = default;
    BorrowedValue& operator=(BorrowedValue&&) = delete;
    ~BorrowedValue() { value_.array_ = nullptr; }

    const Value& operator*() const noexcept { return value_; }
    const Value* operator->() const noexcept { return &value_; }

    // To change the array, which must have one reference: the caller's.
    Value& own() noexcept { return value_; }

private:
    Value value_;
};

}  // namespace tessel::embedded
