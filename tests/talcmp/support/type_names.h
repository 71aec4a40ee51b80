// Tests of several element types, named after these.

#ifndef TALNUMERICARRAY_TESTS_TYPE_NAMES_H
#define TALNUMERICARRAY_TESTS_TYPE_NAMES_H

#include "element_type.h"

#include <string>

struct TypeNames {
    template <typename T>
    static std::string GetName(int /*index*/) {
        return talcmp::element_type(element_type_id<T>).name;
    }
};

#endif
