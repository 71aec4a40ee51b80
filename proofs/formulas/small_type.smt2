; Proves: what nearness.smt2 proves, in one step and without its lemmas, for reals of six digits.
; Models: compare_impl (compare.h), certain_divisor and certainly_same_reals
;   (talnumericarray_sameq_certainty.h), and DoubtsAboutReals::add (talnumericarray_sameq_vectors.h).
; for: rounded small
; with: real_type arithmetic rule certainty two_reals
; fault: (plus (times (over one factor) slack) one) => (times (over one factor) slack)
; fault: (plus (times (over one factor) slack) one) => (over one factor)

(declare-const factor T)
(define-fun least_factor () T ((_ to_fp $exponent_bits $significand_bits) RNE $half_epsilon))
(assert (and (fp.geq factor least_factor) (fp.leq factor one)))

(define-fun same_if_certain ((fused Bool)) Bool
  (=> (certain fused (certain_divisor factor) x y)
      (= (compare_impl one factor true x y) the_same)))
(define-fun claim_rounded () Bool (same_if_certain false))
(define-fun claim_fused () Bool (same_if_certain true))
