// Which instruction sets the build has, and which of them this processor supports.

#include "support/loops.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <iostream>
#include <iterator>

namespace {

TEST(InstructionSets, AreListedBestFirst) {
    const char* const best_first[] = {"AVX-512", "AVX-512 in plain code", "AVX2", "baseline",
                                      without_vectors};
    const auto* expected = std::begin(best_first);
    int supported = 0;
    for (const InstructionSet& set : instruction_sets_of_build()) {
        std::cout << "vectors of " << set.name << ": "
                  << (set.supported ? "tested here" : "NOT TESTED, not supported here")
                  << std::endl;
        RecordProperty(set.name, set.supported ? "tested" : "NOT TESTED");
        expected = std::find(expected, std::end(best_first), set.name);
        ASSERT_NE(expected, std::end(best_first)) << set.name << " is not expected here";
        ++expected;
        supported += set.supported ? 1 : 0;
    }
    if (supported == 0) {
        GTEST_SKIP() << "NOT TESTED: this processor supports no set of this build";
    }
}

// Skipped where a set is not supported, which CTest reports after all tests.
TEST(InstructionSets, AreAllTested) {
    std::string untested;
    for (const InstructionSet& set : instruction_sets_of_build()) {
        untested += set.supported ? "" : " " + set.name;
    }
    if (!untested.empty()) {
        GTEST_SKIP() << "NOT TESTED:" << untested;
    }
}

} // namespace
