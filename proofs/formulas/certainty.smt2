; Whether two reals are certainly the same under a divisor (talnumericarray_sameq_certainty.h); the
; product is `fused` with the subtraction, or rounded before it.
(define-fun difference ((x T) (y T)) T (fp.abs (minus x y)))
(define-fun left_over ((fused Bool) (divisor T) (d T) (m T)) T
  (ite fused (minus_product m divisor d) (minus m (times divisor d))))
(define-fun passes ((fused Bool) (divisor T) (d T) (m T)) Bool
  (fp.geq (left_over fused divisor d m) d))
(define-fun certain ((fused Bool) (divisor T) (x T) (y T)) Bool
  (passes fused divisor (difference x y) (fp.abs y)))

(define-fun slack () T
  (fp.add RNE one ((_ to_fp $exponent_bits $significand_bits) RNE $eight_epsilon)))
(define-fun certain_divisor ((factor T)) T (plus (times (over one factor) slack) one))
