// The two predicates over numeric arrays. This header is the contract; the rule of comparison is
// written out in `compare.h` (scalars), `talnumericarray_sameq_elements.h` (elements) and
// `talnumericarray_sameq_impl.h` (what is compared as bytes).
//
// Both predicates only read the records and what they point to, and take no reference on them; the
// caller keeps them alive and unchanged for the length of a call. Any number of threads may compare
// the same records at once. Neither predicate allocates, throws, locks, logs or calls the system,
// and each, compiled with optimisation, takes at most 2 KiB of stack, what it calls of the C
// library included. A signal handler may interrupt a comparison anywhere, compare itself, and leave
// it for good; a child may compare after a fork.
//
// errno, the direction of rounding, traps and other modes of floating point stay as they are, and
// no status flag is cleared. The comparison of reals may raise flags: invalid where an element is a
// NaN or an infinity or `tol` is a NaN; overflow by a `tol` too large for a single and by
// elements far apart; underflow by a `tol` or elements of about the least normal number;
// inexact by anything; division by zero never. A program that traps on these has to mask them for
// the call. The answer is that of the rule in the direction of rounding in force; where the
// processor takes subnormal numbers for zero, they count as zero unless bits are compared.
//
// Nothing but what is said below is checked: a null handle, a null `dims` with a rank above 0, a
// null `data` with a count above 0, a `data` that is not aligned for its elements, a negative rank
// or count, or an `nelems` of the first array that is not the product of its dimensions, is
// undefined behaviour.
//
// Both are for use within the library or program that links them in; neither is exported from a
// shared object.

#ifndef TALNUMERICARRAY_COMPARE_H
#define TALNUMERICARRAY_COMPARE_H

#include "taldata_array.h"
#include "type_properties.h"

// Returns 1 when the two arrays have the same rank and dimensions and hold, position by position,
// the same numbers; else 0.
//
// `tol` is the tolerance for reals, a count of binary digits: two nonzero reals of the same sign
// are the same when they differ by less than 2^(tol - bits) times the larger magnitude, `bits`
// being 53 where doubles are compared and 24 where singles are; there `tol` is first rounded to a
// single, so that 23.99999999 counts as 24 and 1e-46 as 0. A whole `tol` is kept exactly, a
// fractional one as exactly as rounding allows. A `tol` of 0 or less, or NaN, asks for
// equality; one of `bits` or more makes any two nonzero reals of the same sign the same. Zero is
// never the same as another number, nor a number the same as one of the other sign. Integers are
// compared exactly.
//
// `compare_different_types` nonzero lets arrays of different element types be compared by value; if
// it is 0, such arrays are not the same. Where either value is a double or a part of a complex of
// doubles, the two are compared as doubles; otherwise, where either is a single, as singles, an
// integer of any width included; two integers are compared as mathematical integers. A complex
// number is compared part by part, and is the same as a real or an integer only if its imaginary
// part is zero.
//
// Two arrays of one real or complex type under a `tol` of zero are compared bit by bit: then +0 and
// -0 are different, and two NaNs of the same bits are the same. Under any other `tol`, and for
// different types, +0 and -0 are the same and a NaN is never the same as anything, but for a `tol`
// of `bits` or more, under which it is the same as every NaN and every positive number.
//
// The last factor 2^(tol - bits) that was needed is remembered, for each real type and thread. That
// shows in an answer only where `tol` lies between `bits` - 1 and `bits`: then two numbers that
// differ by half the larger or more are the same only if this factor is remembered already, be it
// from an earlier pair of the same arrays or from an earlier call. A signal handler that compares
// leaves its own factor.
//
// Two arrays of one shape without elements are the same whatever their types. Otherwise an array
// whose `data_type` is outside 1 to 12 is the same as none.
//
// Only the first array's `nelems` is read. An element behind the first pair that is not the same
// may be read where it lies in one page of 4096 bytes with an element that is not behind it, and
// where the arrays are compared as bytes. Built without vectors, for lack of them or with
// TALNUMERICARRAY_INSTRUCTION_SETS set to `none`, it is read in the latter case alone.
extern "C" [[gnu::visibility("hidden")]] int TalNumericArray_sameQ(talreal tol,
                                                                   int compare_different_types,
                                                                   TalNumericArray na1,
                                                                   TalNumericArray na2) noexcept;

// Returns 1 when the two arrays have the same rank, the same `data_type` (whatever int it is) and
// the same dimensions; else 0. Neither elements nor their number are read.
[[gnu::visibility("hidden")]] int TalNumericArray_equivalentQ(TalNumericArray na1,
                                                              TalNumericArray na2) noexcept;

#endif
