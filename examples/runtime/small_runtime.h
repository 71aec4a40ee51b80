// What the small runtime offers: one function, the only one that its shared object exports.

#ifndef SMALL_RUNTIME_H
#define SMALL_RUNTIME_H

#include "taldata_array.h"
#include "type_properties.h"

#include <cstddef>

// Returns how many bytes it takes to keep the elements of `arriving` beside those of `stored`: 0 if
// the two arrays have the same element type and shape and hold the same numbers under `tolerance`,
// so that they can share their elements; else the size of the elements of `arriving`. An array
// without a type yet (`UNINITIALIZED_TYPE`) gets room for elements of the widest type. `tolerance`
// counts binary digits, as in `talnumericarray_compare.h`. Any number of threads may ask at once.
extern "C" [[gnu::visibility("default")]] std::size_t
small_runtime_bytes_to_store(talreal tolerance, TalNumericArray stored,
                             TalNumericArray arriving) noexcept;

#endif
