// The comparison of two arrays.

#ifndef TALCMP_COMPARISON_H
#define TALCMP_COMPARISON_H

#include "array_source.h"
#include "places.h"
#include "report.h"
#include "selection.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace talcmp {

struct Question {
    talreal tolerance = 0;       // binary digits
    bool strict_type = false;    // whether arrays of different element types differ
    Selection selection;         // what is compared of each array
    std::size_t differences = 1; // how many places are told at most
    bool report = false;         // whether all pairs are looked at and counted
    bool only_whether = false;   // whether any place will do, in whatever order they are met
    unsigned threads = 0;        // at most; 0 for as many as are worth while
};

enum class Difference { none, shape, type, elements };

// What is told of an array.
struct ArrayFacts {
    std::string name;
    type_t type = 0;
    Shape shape;          // of the whole array
    Shape selected_shape; // of what is compared
    bool fortran_order = false;
};

struct Comparison {
    ArrayFacts array1, array2;
    bool has_elements = true; // whether there was any pair to compare
    Difference difference = Difference::none;
    std::vector<Place> places;    // the first that differ, in row-major order
    std::optional<Report> report; // where asked for and the shapes are the same
};

// Is told how far a comparison is.
class ProgressListener {
  public:
    ProgressListener() = default;
    ProgressListener(const ProgressListener&) = delete;
    ProgressListener& operator=(const ProgressListener&) = delete;
    virtual ~ProgressListener() = default;

    // Before anything is read, with what will be read at most.
    virtual void begin(std::uint64_t total_bytes) = 0;

    // By any thread, with what has been read since the last call.
    virtual void advance(std::uint64_t bytes) = 0;
};

// An array, and what messages call it.
struct NamedArray {
    std::string name;
    std::unique_ptr<ArraySource> source;
};

// Compares what `question` selects of both arrays. The answer is what `TalNumericArray_sameQ` says
// of them in a thread that remembers the factor of the tolerance; but under `strict_type` arrays of
// different types differ even where they have no elements. The answer does not depend on how the
// arrays are stored nor on the number of threads. What comes once is read to its end, whatever has
// been found before, as only there a damaged archive shows. Throws Trouble.
Comparison compare(NamedArray first, NamedArray second, const Question& question,
                   ProgressListener& progress);

} // namespace talcmp

#endif
