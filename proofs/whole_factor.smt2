; The factor of any whole tolerance from 1 to `bits` - 1, a power of two, and the divisor to it.
(declare-const exponent (_ BitVec $exponent_bits))
(assert (bvuge exponent (_ bv$least_factor_exponent $exponent_bits)))
(assert (bvule exponent (_ bv$half_exponent $exponent_bits)))
(define-fun factor () T (fp #b0 exponent #b$zero_significand))
(define-fun divisor () T (fp #b0 (bvsub (_ bv$twice_bias $exponent_bits) exponent) #b$zero_significand))
