// Shapes and indices in messages.

#pragma once

#include "array_source.h"

#include <string>

namespace talcmp {

// "1, 2, 3"
inline std::string joined(const Shape& numbers) {
    std::string text;
    for (const std::uint64_t number : numbers) {
        text += (text.empty() ? "" : ", ") + std::to_string(number);
    }
    return text;
}

// As NumPy writes a shape: "()", "(3,)", "(2, 3)".
inline std::string shape_text(const Shape& shape) {
    return "(" + joined(shape) + (shape.size() == 1 ? ",)" : ")");
}

} // namespace talcmp
