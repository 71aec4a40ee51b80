// The table of element sizes for programs without a runtime that defines one. It is an archive
// member of its own, so that the linker leaves it out where the runtime's table is there, and weak,
// so that it gives way even where the linker is told to take all members.

#include "taldata_array_element_types.h"

// Hidden in this definition alone: how the runtime's own table is exported is the runtime's affair.
#pragma GCC visibility push(hidden)
#include "talnumericarray.h"
#pragma GCC visibility pop

[[gnu::weak]] extern const std::size_t TalNumericArray_typeSizeTable[13] = {0, 1, 1, 2, 2, 4, 4,
                                                                            8, 8, 4, 8, 8, 16};
