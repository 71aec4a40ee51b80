; The real type: singles or doubles.
(define-sort T () (_ FloatingPoint $exponent_bits $significand_bits))
; The number of these bits.
(define-fun real ((b (_ BitVec $width))) T ((_ to_fp $exponent_bits $significand_bits) b))
(define-fun zero () T (_ +zero $exponent_bits $significand_bits))
(define-fun half () T ((_ to_fp $exponent_bits $significand_bits) RNE 0.5))
(define-fun one () T ((_ to_fp $exponent_bits $significand_bits) RNE 1.0))
(define-fun bits () T ((_ to_fp $exponent_bits $significand_bits) RNE $significand_bits.0))
(define-fun finite ((a T)) Bool (not (or (fp.isNaN a) (fp.isInfinite a))))
