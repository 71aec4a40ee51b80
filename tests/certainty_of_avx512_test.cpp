// `certainty_test` of the loops for AVX-512 alone, on any processor with AVX2.

#include "support/avx512_in_plain_code.h"

#include "certainty_test.cpp" // NOLINT(bugprone-suspicious-include): the same tests
