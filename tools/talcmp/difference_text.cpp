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

std::string value_text(ArraySource& source, const std::uint64_t position) {
    return element_type(source.element_type()).text(source.elements(position, 1));
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
           + "]: " + value_text(first, difference.position) + " and "
           + value_text(second, difference.position);
}

} // namespace talcmp
