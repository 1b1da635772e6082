#include "hosts/embedded/Value.hpp"

#include <algorithm>
#include <array>
#include <span>
#include <stdexcept>
#include <utility>
#include <variant>

namespace tessel::embedded {

namespace {

void requireCount(const Shape& shape, std::size_t held,
                  std::size_t heldPerElement = 1) {
    if (held % heldPerElement != 0 || shape.count() != held / heldPerElement)
        throw std::invalid_argument(
            "The number of elements does not fit the dimensions.");
}

template <class Elements>
auto& elementAt(Elements&& elements, std::size_t index) {
    if (index >= elements.size())
        throw std::out_of_range("There is no such element.");
    return elements[index];
}

}  // namespace

const char* className(ValueClass valueClass) noexcept {
    static constexpr std::array names = {"double", "char",   "uint8", "logical",
                                         "cell",   "struct", "object"};
    return names[static_cast<std::size_t>(valueClass)];
}

// ---- Making values ----

Value Value::chars(const Dimensions& dimensions, std::u16string_view text) {
    Shape shape(dimensions);
    requireCount(shape, text.size());
    return Value(Texts::make(ValueClass::Char, std::move(shape), text));
}

Value Value::complexOrReal(Shape shape, std::vector<double> parts,
                           bool isComplex) {
    requireCount(shape, parts.size(), isComplex ? 2 : 1);
    return Value(new Numbers(ValueClass::Double, std::move(shape),
                             {std::move(parts), isComplex}));
}

Value Value::doubles(const Dimensions& dimensions, std::vector<double> values) {
    return complexOrReal(Shape(dimensions), std::move(values), false);
}

Value Value::complexDoubles(const Dimensions& dimensions,
                            std::vector<double> parts) {
    return complexOrReal(Shape(dimensions), std::move(parts), true);
}

Value Value::bytes(const Dimensions& dimensions,
                   std::vector<std::uint8_t> values) {
    Shape shape(dimensions);
    requireCount(shape, values.size());
    return Value(
        new Bytes(ValueClass::Uint8, std::move(shape), std::move(values)));
}

Value Value::logicals(const Dimensions& dimensions,
                      const std::vector<std::uint8_t>& truths) {
    Shape shape(dimensions);
    requireCount(shape, truths.size());
    return Value(Truths::make(ValueClass::Logical, std::move(shape), truths));
}

Value Value::objects(const Dimensions& dimensions,
                     std::vector<std::shared_ptr<Instance>> instances) {
    Shape shape(dimensions);
    requireCount(shape, instances.size());
    if (std::ranges::find(instances, nullptr) != instances.end())
        throw std::invalid_argument("An object needs its instance.");
    return Value(new Objects(ValueClass::Object, std::move(shape),
                             std::move(instances)));
}

Value Value::cell(const Dimensions& dimensions) {
    return Value(Cells::make(ValueClass::Cell, Shape(dimensions)));
}

Value Value::cell(std::size_t rows, std::size_t columns) {
    return Value(Cells::make(ValueClass::Cell, Shape(rows, columns)));
}

Value Value::structure(const Dimensions& dimensions) {
    return Value(new Structs(ValueClass::Struct, Shape(dimensions), {}));
}

Value Value::text(std::u16string_view text) {
    return Value(Texts::make(ValueClass::Char, Shape(1, text.size()), text));
}

Value Value::scalar(double number) { return doubles({1, 1}, {number}); }

Value Value::logical(bool truth) {
    const auto element = static_cast<std::uint8_t>(truth);
    return Value(Truths::make(ValueClass::Logical, Shape(1, 1), {&element, 1}));
}

Value Value::column(std::vector<double> values) {
    const std::size_t count = values.size();
    return complexOrReal(Shape(count, 1), std::move(values), false);
}

Value Value::byteColumn(std::vector<std::uint8_t> values) {
    const std::size_t count = values.size();
    return bytes({count, 1}, std::move(values));
}

Value Value::cellRow(const std::vector<Value>& elements) {
    return Value(
        Cells::make(ValueClass::Cell, Shape(1, elements.size()), elements));
}

Value Value::cellColumn(const std::vector<Value>& elements) {
    return Value(
        Cells::make(ValueClass::Cell, Shape(elements.size(), 1), elements));
}

Value Value::texts(const std::vector<std::u16string>& rows) {
    Value made = cell(rows.size(), 1);
    auto& cells = static_cast<Cells&>(*made.array_);
    for (std::size_t i = 0; i < rows.size(); ++i)
        cells.elements()[i] = text(rows[i]);
    return made;
}

Value Value::textLists(const std::vector<std::vector<std::u16string>>& lists) {
    Value made = cell(lists.size(), 1);
    auto& cells = static_cast<Cells&>(*made.array_);
    for (std::size_t i = 0; i < lists.size(); ++i)
        cells.elements()[i] = texts(lists[i]);
    return made;
}

// ---- Looking into values ----

const Array& Value::empty() noexcept {
    // Made at the first call: without memory for it, the host ends here.
    static const Value zeroByZero(
        // NOLINTNEXTLINE(bugprone-unhandled-exception-at-new)
        new Numbers(ValueClass::Double, Shape(0, 0), {{}, false}));
    return *zeroByZero.array_;
}

void Value::refuseClass() { throw std::bad_variant_access(); }

void Value::refuseIndex() {
    throw std::out_of_range("There is no such element.");
}

bool Value::isComplex() const noexcept {
    return valueClass() == ValueClass::Double &&
           static_cast<const Numbers&>(shown()).content.isComplex;
}

const std::vector<double>& Value::doubleData() const {
    return as<Numbers>(ValueClass::Double).content.parts;
}

const std::vector<std::uint8_t>& Value::byteData() const {
    return as<Bytes>(ValueClass::Uint8).content;
}

bool Value::truth(std::size_t index) const {
    return elementAt(as<Truths>(ValueClass::Logical).elements(), index) != 0;
}

const std::shared_ptr<Instance>& Value::instance(std::size_t index) const {
    return elementAt(as<Objects>(ValueClass::Object).content, index);
}

const std::vector<Value>* Value::findField(std::string_view name) const {
    const auto& columns = as<Structs>(ValueClass::Struct).content.columns;
    const auto found = std::ranges::find(columns, name, &Column::first);
    return found == columns.end() ? nullptr : &found->second;
}

std::vector<std::string> Value::fieldNames() const {
    std::vector<std::string> names;
    for (const auto& [name, values] :
         as<Structs>(ValueClass::Struct).content.columns)
        names.push_back(name);
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

bool Value::areAlike(const Array& a, const Array& b, ArrayPairs& inner) {
    if (a.valueClass() != b.valueClass() || !(a.shape() == b.shape()))
        return false;
    const auto addPairs = [&inner](std::span<const Value> first,
                                   std::span<const Value> second) {
        for (std::size_t i = 0; i < first.size(); ++i)
            inner.emplace_back(&first[i].shown(), &second[i].shown());
    };
    if (a.valueClass() == ValueClass::Cell) {
        addPairs(static_cast<const Cells&>(a).elements(),
                 static_cast<const Cells&>(b).elements());
        return true;
    }
    if (a.valueClass() != ValueClass::Struct) return a.hasElementsOf(b);
    const auto& columns = static_cast<const Structs&>(a).content.columns;
    const auto& others = static_cast<const Structs&>(b).content.columns;
    if (!std::ranges::equal(columns, others, {}, &Column::first,
                            &Column::first))
        return false;
    for (std::size_t i = 0; i < columns.size(); ++i)
        addPairs(columns[i].second, others[i].second);
    return true;
}

bool operator==(const Value& a, const Value& b) {
    Value::ArrayPairs inner;
    if (!Value::areAlike(a.shown(), b.shown(), inner)) return false;
    while (!inner.empty()) {
        const auto [first, second] = inner.back();
        inner.pop_back();
        if (!Value::areAlike(*first, *second, inner)) return false;
    }
    return true;
}

// ---- Nested values ----

template <class Visit>
void Value::visitElements(Array& array, Visit visit) {
    if (array.valueClass() == ValueClass::Cell) {
        for (Value& element : static_cast<Cells&>(array).elements())
            if (!visit(element)) return;
    } else if (array.valueClass() == ValueClass::Struct) {
        for (auto& [name, values] :
             static_cast<Structs&>(array).content.columns)
            for (Value& value : values)
                if (!visit(value)) return;
    }
}

// Null if the array holds no arrays.
Value* Value::firstElement(Array& array) noexcept {
    Value* first = nullptr;
    visitElements(array, [&first](Value& element) {
        first = &element;
        return false;
    });
    return first;
}

// Destroys an array without references or, if it holds arrays, puts it on the
// list of those that wait for it. The list takes no memory: an array on it
// keeps the next one where it had its first element, which is buried instead.
void Array::bury(Array*& waiting) noexcept {
    Array* dead = this;
    for (;;) {
        Value* const first = Value::firstElement(*dead);
        if (first == nullptr) return dead->destroy();
        Array* const inner = std::exchange(first->array_, waiting);
        waiting = dead;
        if (inner == nullptr || !inner->losesReference()) return;
        dead = inner;
    }
}

void Array::buryNested() const noexcept {
    Array* waiting = nullptr;
    const_cast<Array*>(this)->bury(waiting);
    while (waiting != nullptr) {
        Array* const dead = waiting;
        waiting = std::exchange(Value::firstElement(*dead)->array_, nullptr);
        Value::visitElements(*dead, [&waiting](Value& element) {
            Array* const inner = std::exchange(element.array_, nullptr);
            if (inner != nullptr && inner->losesReference())
                inner->bury(waiting);
            return true;
        });
        dead->destroy();
    }
}

// ---- Changing values ----

// An array that others refer to is left to them.
Array& Value::changeable() {
    if (array_ == nullptr || !array_->isUnique()) *this = clone();
    return *array_;
}

template <class Kind>
Kind& Value::changeableAs(ValueClass valueClass) {
    as<Kind>(valueClass);
    return static_cast<Kind&>(changeable());
}

void Value::setElement(std::size_t index, Value element) {
    elementAt(changeableAs<Cells>(ValueClass::Cell).elements(), index) =
        std::move(element);
}

void Value::setField(std::string_view name, Value value, std::size_t index) {
    const bool isNew = !hasField(name);
    if (index >= numel()) throw std::out_of_range("There is no such element.");
    auto& columns = changeableAs<Structs>(ValueClass::Struct).content.columns;
    if (isNew) columns.emplace_back(name, std::vector<Value>(numel()));
    const auto found = std::ranges::find(columns, name, &Column::first);
    found->second.at(index) = std::move(value);
}

void* Value::ownNumericData() {
    if (valueClass() == ValueClass::Uint8)
        return changeableAs<Bytes>(ValueClass::Uint8).content.data();
    return changeableAs<Numbers>(ValueClass::Double).content.parts.data();
}

// ---- Values as a plug-in sees them ----

HostArray* Value::release() {
    if (array_ != nullptr) return std::exchange(array_, nullptr);
    Value copy = clone();
    return std::exchange(copy.array_, nullptr);
}

Value Value::adopt(HostArray* array) noexcept {
    return Value(static_cast<Array*>(array));
}

Value Value::share(const HostArray* array) noexcept {
    const BorrowedValue borrowed(array);
    return *borrowed;
}

}  // namespace tessel::embedded
