// The loops over the pairs of elements, as functions that are chosen at run time: by vectors of
// every instruction set of the build, and one by one. Each has to answer and remember as the plain
// loop over the element test, which is here too.

#pragma once

#include "element_types.h"

#include <cstddef>
#include <string>
#include <vector>

struct InstructionSet {
    std::string name;
    bool supported;
};

// In the order in which the module tries them.
std::vector<InstructionSet> instruction_sets_of_build();

// ---- What a thread remembers

template <typename T>
struct RememberedFactor {
    T tolerance, factor;
};

struct Remembered {
    RememberedFactor<float> of_singles;
    RememberedFactor<double> of_doubles;
};

Remembered remembered();
void remember(const Remembered& factors);

// Those of one tolerance, or of none.
Remembered factors_of(double tol);

// The factor for comparing reals of that many digits.
double factor_of_reals(int digits, const Remembered& factors);

bool same_factors(const Remembered& factors1, const Remembered& factors2);

// ---- The loops of every ordered pair of element types that has one

using Loop = bool (*)(double tol, const void* data1, const void* data2, talint count);

struct LoopOfSets {
    std::string sets;
    Loop loop;
};

inline constexpr const char* without_vectors = "none";

struct Pair {
    const ElementType& type1;
    const ElementType& type2;
    int digits; // of the reals that are compared; 0 for integers
    Loop element_loop;
    std::vector<LoopOfSets> loops;
};

const std::vector<Pair>& pairs_with_loop();

// Calls `check(pair)` for all of them.
template <typename Check>
void for_each_pair_with_a_loop(const Check& check) {
    EXPECT_EQ(pairs_with_loop().size(), 136U);
    for (const Pair& pair : pairs_with_loop()) {
        SCOPED_TRACE("element types " + std::to_string(pair.type1.id) + " and "
                     + std::to_string(pair.type2.id));
        check(pair);
    }
}

std::vector<double> tolerances_of(const Pair& pair);

// Whether all other loops of the pair answer and remember as the element loop does.
bool as_element_loop(const Pair& pair, const Remembered& before, double tol, const void* data1,
                     const void* data2, std::size_t count);

// ---- Arrays

struct Element {
    double real, imaginary;
};

struct Planted {
    const char* name;
    Element element1, element2;
};

// Long enough for every step of the loops: four of the longest vectors of the smallest elements,
// and some elements after them.
inline constexpr std::size_t longest = 300;

std::vector<unsigned char> sevens(const ElementType& type, std::size_t count);

double least_subnormal(const Pair& pair);
