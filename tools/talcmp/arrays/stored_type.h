// How the elements of an array are stored in a file, and the element type as which they are
// compared.

#pragma once

#include "element_type.h"

#include <cstddef>
#include <optional>
#include <string>

namespace talcmp {

// Booleans become the integers 0 and 1, and half precision becomes single precision, which has each
// of its values; all other elements are compared as the type they are stored as.
struct StoredType {
    std::string name;                  // NumPy's: "bool", "float16", or that of the element type
    const ElementType* type = nullptr; // as which elements are compared
    std::size_t size = 0;              // bytes of a stored element
    bool bytes_swapped = false; // whether stored elements are not in this machine's byte order
    void (*widen)(void*, std::size_t) = nullptr; // see `decode`; null if nothing has to be done
};

// The type of elements of `size` bytes; `kind` is the letter of .npy: b, i, u, f or c. Nothing if
// there is no such type.
std::optional<StoredType> stored_type(char kind, std::size_t size, bool bytes_swapped);

// Where `count` stored elements have to be put in `elements`, which has room for as many elements
// of the type they are compared as: at its end.
void* room_for_stored(const StoredType& type, void* elements, std::size_t count);

// Turns `count` stored elements that were put there into elements to be compared.
void decode(const StoredType& type, void* elements, std::size_t count);

} // namespace talcmp
