; Proves: what small_type.smt2 proves, for processors that treat subnormal numbers as zero, whether
;   operands or results: for reals of six digits.
; Models: compare_impl (compare.h), certain_divisor and certainly_same_reals
;   (talnumericarray_sameq_certainty.h), and DoubtsAboutReals::add (talnumericarray_sameq_vectors.h).
; for: rounded small
; with: real_type flushed_arithmetic rule certainty two_reals
; fault: (plus (times (over one factor) slack) one) => (over one factor)
; fault: (fp.geq (left_over => (fp.leq (left_over
; fault: (assert (not (fp.isSubnormal y))) => (assert true)

(declare-const factor T)
(define-fun least_factor () T ((_ to_fp $exponent_bits $significand_bits) RNE $half_epsilon))
(assert (and (fp.geq factor least_factor) (fp.leq factor one) (not (fp.isSubnormal factor))))

; Subnormal operands are taken for zero. So it makes no difference where only operands are: every
; result here is an operand of the next step.
(assert (not (fp.isSubnormal x)))
(assert (not (fp.isSubnormal y)))

(define-fun same_if_certain ((fused Bool)) Bool
  (=> (certain fused (certain_divisor factor) x y)
      (= (compare_impl one factor true x y) the_same)))
(define-fun claim_rounded () Bool (same_if_certain false))
(define-fun claim_fused () Bool (same_if_certain true))
