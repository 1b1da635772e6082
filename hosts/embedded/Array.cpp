#include "hosts/embedded/Array.hpp"

#include <stdexcept>

namespace tessel::embedded {

namespace {

std::size_t product(std::size_t a, std::size_t b) {
    if (b != 0 && a > std::numeric_limits<std::size_t>::max() / b)
        throw std::length_error("The dimensions are too large.");
    return a * b;
}

std::unique_ptr<const Dimensions> listUnlessTwo(const Dimensions& dimensions) {
    if (dimensions.size() == 2) return nullptr;
    return std::make_unique<const Dimensions>(dimensions);
}

}  // namespace

std::size_t elementCount(const Dimensions& dimensions) {
    std::size_t count = 1;
    for (const std::size_t extent : dimensions) count = product(count, extent);
    return count;
}

Shape::Shape(std::size_t rows, std::size_t columns)
    : count_(product(rows, columns)), rows_(rows), columns_(columns) {}

Shape::Shape(const Dimensions& dimensions)
    : count_(elementCount(dimensions)),
      rows_(dimensions.size() == 2 ? dimensions[0] : 0),
      columns_(dimensions.size() == 2 ? dimensions[1] : 0),
      others_(listUnlessTwo(dimensions)) {}

Shape::Shape(const Shape& other)
    : count_(other.count_),
      rows_(other.rows_),
      columns_(other.columns_),
      others_(other.others_ ? std::make_unique<const Dimensions>(*other.others_)
                            : nullptr) {}

Dimensions Shape::dimensions() const {
    return others_ ? *others_ : Dimensions{rows_, columns_};
}

bool operator==(const Shape& a, const Shape& b) noexcept {
    if (!a.others_ && !b.others_)
        return a.rows_ == b.rows_ && a.columns_ == b.columns_;
    return a.others_ && b.others_ && *a.others_ == *b.others_;
}

}  // namespace tessel::embedded
