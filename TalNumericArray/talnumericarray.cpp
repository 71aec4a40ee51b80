// The table of element sizes, for programs whose runtime does not define it. It has an archive
// member to itself, so the linker leaves it out if the runtime has a table. It is weak, so it gives
// way even if the linker has to take all members.

#include "taldata_array_element_types.h"

// Only this definition is hidden. Whether the runtime exports its own table is the runtime's
// choice.
#pragma GCC visibility push(hidden)
#include "talnumericarray.h"
#pragma GCC visibility pop

[[gnu::weak]] extern const std::size_t TalNumericArray_typeSizeTable[13] = {0, 1, 1, 2, 2, 4, 4,
                                                                            8, 8, 4, 8, 8, 16};
