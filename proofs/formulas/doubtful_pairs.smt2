; Proves: what nearness.smt2 uses about the difference of two reals, and about the test where that
;   difference is zero, infinite or NaN.
; Models: certainly_same_reals (talnumericarray_sameq_certainty.h), and DoubtsAboutReals::add for
;   nearness (talnumericarray_sameq_vectors.h).
; for: rounded single, rounded double
; with: real_type arithmetic certainty two_reals
; fault: (= (fp.lt x zero) (fp.lt y zero)) => (fp.lt x zero)
; fault: (fp.geq (left_over fused divisor d m) d) => (fp.gt (left_over fused divisor d m) d)
; fault: (fp.geq (left_over fused divisor d m) d) => (not (fp.lt (left_over fused divisor d m) d))

(define-fun claim_not_finite () Bool
  (=> (not (and (finite x) (finite y))) (not (finite (difference x y)))))
(define-fun claim_equal () Bool (=> (and (finite x) (fp.eq x y)) (= (difference x y) zero)))
(define-fun claim_not_equal () Bool
  (=> (and (finite x) (finite y) (not (fp.eq x y))) (fp.gt (difference x y) zero)))
(define-fun claim_not_of_one_sign () Bool
  (=> (and (finite x) (finite y) (not of_one_sign) (not (fp.eq x y)))
      (fp.geq (difference x y) (fp.abs y))))

(declare-const divisor T)
(assert (and (fp.geq divisor one) (finite divisor)))
(define-fun passes_of_no_difference ((fused Bool)) Bool
  (=> (finite y) (passes fused divisor zero (fp.abs y))))
(define-fun claim_no_difference () Bool
  (and (passes_of_no_difference false) (passes_of_no_difference true)))
(declare-const d T)
(define-fun doubt_of_no_number ((fused Bool)) Bool
  (=> (not (finite d)) (not (passes fused divisor (fp.abs d) (fp.abs y)))))
(define-fun claim_no_number () Bool
  (and (doubt_of_no_number false) (doubt_of_no_number true)))
