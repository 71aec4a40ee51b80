// The element type ids of an array.

#ifndef TALDATA_ARRAY_TYPES_H
#define TALDATA_ARRAY_TYPES_H

// Ids 1 to 8 are the integer types, 9 and 10 the real types, 11 and 12 the complex types.
enum TalNumericArrayTypeId : unsigned int {
    UNINITIALIZED_TYPE = 0,
    BIT8_TYPE = 1,
    UBIT8_TYPE = 2,
    BIT16_TYPE = 3,
    UBIT16_TYPE = 4,
    BIT32_TYPE = 5,
    UBIT32_TYPE = 6,
    BIT64_TYPE = 7,
    UBIT64_TYPE = 8,
    REAL32_TYPE = 9,
    REAL64_TYPE = 10,
    COMPLEX_REAL32_TYPE = 11,
    COMPLEX_REAL64_TYPE = 12
};

#endif
