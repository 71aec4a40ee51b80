// The table of element sizes for programs without a runtime that defines one. It is an archive
// member of its own, so that the linker leaves it out where the runtime's table is there.

#include "taldata_array_element_types.h"

// Hidden in this definition alone: how the runtime's own table is exported is the runtime's affair.
#pragma GCC visibility push(hidden)
#include "talnumericarray.h"
#pragma GCC visibility pop

constexpr std::size_t TalNumericArray_typeSizeTable[13] = {0, 1, 1, 2, 2, 4, 4, 8, 8, 4, 8, 8, 16};

namespace {

template <typename... Types>
constexpr bool table_agrees(type_list<Types...> /*types*/) noexcept {
    return (... && (TalNumericArray_typeSizeTable[element_type_id<Types>] == sizeof(Types)));
}

static_assert(table_agrees(element_type_list{}));

} // namespace
