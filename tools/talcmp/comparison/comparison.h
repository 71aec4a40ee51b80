// The comparison of two arrays, and all that it finds.

#pragma once

#include "array_source.h"
#include "box_supply.h"
#include "findings.h"
#include "map_filler.h"
#include "progress_listener.h"
#include "question.h"
#include "verdict.h"

#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace talcmp {

enum class Difference { none, shape, type, elements };

// What is reported about an array.
struct ArrayFacts {
    std::string name;
    const ElementType* type = nullptr; // as which elements are compared
    std::string stored_type;           // the name of the type in the file
    Shape shape;                       // of the whole array
    Shape selected_shape;              // of what is compared
    bool fortran_order = false;
};

// A place in both arrays, and what to say about the elements there.
struct Place {
    Shape index; // in the first array
    Element element1 = {};
    Element element2 = {};
    Verdict verdict;
};

// For all pairs together.
struct Report {
    Totals totals;
    std::optional<Place> worst_place; // the first that differs in the most digits, if any does
    int all_digits = 0;               // of the type of real that is compared

    // The smallest whole tolerance, from 0, under which the arrays are the same; nothing if there
    // is none, or only one of all digits, which says nothing about the arrays.
    std::optional<int> smallest_tolerance = 0;
};

struct Comparison {
    ArrayFacts array1, array2;
    talreal tolerance = 0;    // in binary digits, for the types of the two
    bool has_elements = true; // whether there was any pair of elements
    bool all_ignored = false; // whether there were some, and the mask left all of them out
    Difference difference = Difference::none;
    std::vector<Place> places;    // the first that differ, in row-major order
    std::optional<Report> report; // if asked for and the shapes are the same
    DifferenceMaps maps;          // those of the question, if there is a report of any pairs
};

// An array, and what messages call it.
struct NamedArray {
    std::string name;
    std::unique_ptr<ArraySource> source;
};

// Compares what `question` selects of both arrays. The answer is that of `TalNumericArray_sameQ`
// for them in a thread that remembers the factor of the tolerance; but under `strict_type` arrays
// of different types differ even if they have no elements. The answer depends neither on how the
// arrays are stored nor on the number of threads. What can be read only once is read to its end,
// whatever was found before, as only the end shows that an archive is damaged. Throws Trouble.
//
// `mask`, if it has a source, is an array of booleans of the shape of the first array: where it is
// true, nothing is compared.
//
// Several processes that open the same arrays may share `supply`, and compare a part each. What
// cannot be divided among them is compared by the one that leads. Only there is the result whole.
Comparison compare(NamedArray first, NamedArray second, NamedArray mask, const Question& question,
                   BoxSupply& supply, ProgressListener& progress);

} // namespace talcmp
