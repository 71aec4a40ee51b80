// Two predicates over numeric arrays. `TalNumericArray_sameQ` compares two arrays element by
// element under a tolerance; `TalNumericArray_equivalentQ` compares only their rank, type and
// dimensions.
//
// This header is the contract. The rule of comparison is written out in `compare.h` (scalars), in
// `talnumericarray_sameq_elements.h` (elements) and in `talnumericarray_sameq_impl.h` (which arrays
// are compared as bytes).
//
// For both functions:
//
// - They only read the records and what the records point to, and take no reference. The caller
//   keeps all of this alive and unchanged during a call. Any number of threads may compare the same
//   records at once.
// - They do not allocate, throw, lock, log or make system calls. Compiled with optimisation, they
//   take at most 2 KiB of stack, including what they call in the C library.
// - A signal handler may interrupt a call anywhere, call either function, and leave the interrupted
//   call for good. A child process may call them after a fork.
// - They are for the library or program that links them in. A shared object does not export them.
// - They check only what is stated below. A null handle, a negative rank, and a null `dims` with a
//   rank above 0 are undefined behaviour.

#ifndef TALNUMERICARRAY_COMPARE_H
#define TALNUMERICARRAY_COMPARE_H

#include "taldata_array.h"
#include "type_properties.h"

// Returns 1 when the two arrays have the same rank and dimensions and hold, position by position,
// the same numbers; else 0.
//
// `tol` is the tolerance for reals, in binary digits. Two nonzero reals of the same sign are the
// same when they differ by less than 2^(tol - bits) times the larger magnitude. Here `bits` is 53
// where doubles are compared and 24 where singles are; for singles `tol` is first rounded to a
// single, so that 23.99999999 counts as 24 and 1e-46 as 0. A whole `tol` is applied exactly, a
// fractional one as exactly as rounding allows. A `tol` of 0 or less, or NaN, asks for equality. A
// `tol` of `bits` or more makes any two nonzero reals of the same sign the same. Zero is never the
// same as another number, and numbers of opposite signs are never the same. Integers are compared
// exactly.
//
// `compare_different_types` nonzero compares arrays of different element types by value; if it is
// 0, such arrays are not the same. If either value is a double or part of a complex of doubles, the
// two are compared as doubles; otherwise, if either is a single, as singles, including integers of
// any width; two integers are compared as mathematical integers. A complex number is compared part
// by part. It is the same as a real or an integer only if its imaginary part is zero.
//
// Two arrays of one real or complex type are compared bit by bit under a `tol` of zero: +0 and -0
// are then different, and two NaNs of the same bits are the same. Under any other `tol`, and for
// different types, +0 and -0 are the same. A NaN is then the same as nothing, except that under a
// `tol` of `bits` or more it is the same as every NaN and every positive number.
//
// Two arrays of the same shape without elements are the same whatever their types. Otherwise an
// array whose `data_type` is not one of 1 to 12 is the same as no array.
//
// Each thread remembers, for each real type, the last factor 2^(tol - bits) that it needed. This
// affects answers only if `tol` is between `bits` - 1 and `bits`. Then two numbers that differ by
// half the larger or more are the same only if the factor is remembered already, from an earlier
// pair of the same arrays or from an earlier call. A signal handler that compares leaves its own
// factor.
//
// Undefined behaviour besides that above: a null `data` with a count above 0, a `data` that is not
// aligned for its elements, a negative count, and an `nelems` of the first array that is not the
// product of its dimensions. The second array's `nelems` is not read.
//
// An element after the first differing pair may be read in two cases: if it shares a page of 4096
// bytes with an element in or before that pair, or if the arrays are compared as bytes. In a build
// without vectors, because there are none or because TALNUMERICARRAY_INSTRUCTION_SETS is `none`,
// only the second case remains.
//
// errno, the rounding direction, traps and other floating-point modes stay as they are, and no
// status flag is cleared. Comparing reals may raise flags: invalid if an element is a NaN or an
// infinity or `tol` is a NaN; overflow if `tol` is too large for a single or elements are far
// apart; underflow if `tol` or an element is about as small as the least normal number, or smaller;
// inexact with any values; division by zero never. A program that traps on these has to mask them
// for the call. The answer is that of the rule in the current rounding direction. Where the
// processor takes subnormal numbers for zero, they count as zero unless bits are compared.
extern "C" [[gnu::visibility("hidden")]] int TalNumericArray_sameQ(talreal tol,
                                                                   int compare_different_types,
                                                                   TalNumericArray na1,
                                                                   TalNumericArray na2) noexcept;

// Returns 1 when the two arrays have the same rank, the same `data_type` (whatever int it is) and
// the same dimensions; else 0. Neither the elements nor their number is read.
[[gnu::visibility("hidden")]] int TalNumericArray_equivalentQ(TalNumericArray na1,
                                                              TalNumericArray na2) noexcept;

#endif
