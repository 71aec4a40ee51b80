// Tests of several element types, named after these.

#pragma once

#include "element_type.h"

#include <string>

struct TypeNames {
    template <typename T>
    static std::string GetName(int /*index*/) {
        return talcmp::element_type(element_type_id<T>).name;
    }
};
