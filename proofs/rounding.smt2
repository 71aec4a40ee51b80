; Proves: what the proofs about any factor use of rounding: it keeps the order, it does not bring an
;   exact result below a number that it was not below, and it is off by half a unit at most.
; Stands for: every multiplication and division of compare.h and talnumericarray_sameq_blocks.h, as
;   IEEE 754 defines them: of the numbers of the type, the result is one nearest to the exact one.
; for: single, double
; with:
; fault: (=> (= v w) (= rounded_v rounded_w)) => true
; fault: (<= (distance p w) (/ spacing 2.0)) => (<= (distance p w) spacing)
; fault: (assert (<= (distance rounded_w w) (distance z w))) =>

(define-fun distance ((a Real) (b Real)) Real (ite (< a b) (- b a) (- a b)))
; Two exact results, and what they are rounded to.
(declare-const v Real)
(declare-const rounded_v Real)
(declare-const w Real)
(declare-const rounded_w Real)
(assert (=> (= v w) (= rounded_v rounded_w)))
(assert (<= (distance rounded_w w) (distance rounded_v w)))
(assert (<= (distance rounded_v v) (distance rounded_w v)))
; Any number of the type.
(declare-const z Real)
(assert (<= (distance rounded_w w) (distance z w)))
; Numbers lie at most that far from each other around w, which is no subnormal.
(declare-const spacing Real)
(assert (and (> spacing 0.0) (<= (* $half_of_two_to_digits spacing) (distance w 0.0))))
(declare-const p Real)
(assert (<= (distance p w) (/ spacing 2.0)))
(assert (<= (distance rounded_w w) (distance p w)))

(define-fun claim_order () Bool (=> (<= v w) (<= rounded_v rounded_w)))
(define-fun claim_below_a_number () Bool (=> (< rounded_w z) (< w z)))
(define-fun claim_half_a_unit () Bool
  (<= (distance rounded_w w) (* $unit_roundoff (distance w 0.0))))
