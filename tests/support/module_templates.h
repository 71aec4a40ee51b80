// The module's templates, for tests that instantiate them: with AVX512_IN_PLAIN_CODE the loops for
// AVX-512 in plain code are the only instruction set.

#pragma once

#if defined(AVX512_IN_PLAIN_CODE)
#    include "avx512_in_plain_code.h"
#endif

#include "talnumericarray_sameq_impl.h"
