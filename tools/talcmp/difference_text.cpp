#include "difference_text.h"

#include "element_type.h"

#include <cstddef>

namespace talcmp {
namespace {

std::string joined(const Shape& numbers) {
    std::string text;
    for (const std::uint64_t number : numbers) {
        text += (text.empty() ? "" : ", ") + std::to_string(number);
    }
    return text;
}

// As NumPy writes a shape: (), (3,), (2, 3).
std::string shape_text(const Shape& shape) {
    return "(" + joined(shape) + (shape.size() == 1 ? ",)" : ")");
}

// The index of the element at `position` in row-major order; as many numbers as the array has
// dimensions.
Shape index_of(std::uint64_t position, const Shape& shape) {
    Shape index(shape.size());
    for (std::size_t i = shape.size(); i-- > 0;) {
        index[i] = position % shape[i];
        position /= shape[i];
    }
    return index;
}

// Where the types differ a single is written as a double, or 0.1 in singles and 0.1 in doubles
// would look alike.
std::string value_text(ArraySource& source, const ArraySource& other,
                       const std::uint64_t position) {
    const bool as_doubles = source.element_type() != other.element_type();
    return element_type(source.element_type()).text(source.elements(position, 1), as_doubles);
}

} // namespace

std::string difference_text(const Difference& difference, ArraySource& first, ArraySource& second) {
    switch (difference.kind) {
    case Difference::Kind::shape:
        return "shape " + shape_text(first.shape()) + " and " + shape_text(second.shape());
    case Difference::Kind::type:
        return "type " + element_type(first.element_type()).name + " and "
               + element_type(second.element_type()).name;
    case Difference::Kind::element:
        break;
    }
    return "[" + joined(index_of(difference.position, first.shape()))
           + "]: " + value_text(first, second, difference.position) + " and "
           + value_text(second, first, difference.position);
}

} // namespace talcmp
