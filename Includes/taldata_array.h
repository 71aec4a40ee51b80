// The array record that the parts of the runtime share.

#ifndef TALDATA_ARRAY_H
#define TALDATA_ARRAY_H

#include "taldata_array_types.h"
#include "type_properties.h"

#include <cstddef>

// A dense n-dimensional array. Whoever makes a record keeps these invariants; no reader checks
// them:
//   rank >= 0, and `dims` points to `rank` dimensions;
//   nelems >= 0 is the product of the dimensions (1 for rank 0);
//   `data` points to `nelems` elements of the type that `data_type` names, without gaps and aligned
//   for that type.
struct st_TalDataArray {
    talreal prec;                // a precision that the runtime keeps with the array
    talint* dims;                // the dimensions, `rank` of them
    talint rank;                 // number of dimensions
    type_t tensor_property_type; // a property code of the runtime
    UBIT32 flags;                // bit flags of the runtime
    type_t data_type;            // a `TalNumericArrayTypeId`; any other int names no known type
    talint nelems;               // number of elements in `data`
    void* data;                  // the elements, in row-major order
    UBIT64 refcount;             // the runtime's reference count
};

// Tensors and numeric arrays are the same record.
using TalTensor = st_TalDataArray*;
using TalNumericArray = st_TalDataArray*;

// Separately built parts of the runtime pass records to each other, so the layout is fixed. The
// offsets of the first seven fields depend only on the width of a pointer.
static_assert(offsetof(st_TalDataArray, prec) == 0);
static_assert(offsetof(st_TalDataArray, dims) == 8);
static_assert(offsetof(st_TalDataArray, rank) == 8 + sizeof(void*));
static_assert(offsetof(st_TalDataArray, tensor_property_type) == 12 + sizeof(void*));
static_assert(offsetof(st_TalDataArray, flags) == 16 + sizeof(void*));
static_assert(offsetof(st_TalDataArray, data_type) == 20 + sizeof(void*));
static_assert(offsetof(st_TalDataArray, nelems) == 24 + sizeof(void*));
static_assert(sizeof(void*) != 8
                  || (offsetof(st_TalDataArray, data) == 40
                      && offsetof(st_TalDataArray, refcount) == 48
                      && sizeof(st_TalDataArray) == 56),
              "64-bit layout");
static_assert(sizeof(void*) != 4 || alignof(UBIT64) != 8
                  || (offsetof(st_TalDataArray, data) == 32
                      && offsetof(st_TalDataArray, refcount) == 40
                      && sizeof(st_TalDataArray) == 48),
              "32-bit ARM layout, and that of every 32-bit machine that aligns 64 bits to 8 bytes");

#endif
