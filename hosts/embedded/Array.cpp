#include "hosts/embedded/Array.hpp"

#include <stdexcept>

namespace tessel::embedded {

namespace {

std::unique_ptr<const Dimensions> listUnlessTwo(const Dimensions& dimensions) {
    if (dimensions.size() == 2) return nullptr;
    return std::make_unique<const Dimensions>(dimensions);
}

}  // namespace

std::size_t elementCount(const Dimensions& dimensions) {
    std::size_t count = 1;
    for (const std::size_t extent : dimensions)
        count = Shape::product(count, extent);
    return count;
}

void Shape::refuse() {
    throw std::length_error("The dimensions are too large.");
}

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
