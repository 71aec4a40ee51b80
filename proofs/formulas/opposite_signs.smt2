; Proves: a number is never the same as one of the other sign, nor zero as anything but zero, under
;   any tolerance, factor and arithmetic.
; Models: the steps of compare_impl (compare.h) before the tolerance matters.
; for: single, double
; with: real_type any_arithmetic rule two_reals
; fault: (ite (fp.isZero x) => (ite (fp.isNaN x)
; fault: (ite (fp.isZero y) => (ite (fp.isNaN y)
; fault: (not (= (fp.lt x zero) (fp.lt y zero))) (ite => (= (fp.lt x zero) (fp.lt y zero)) (ite

(declare-const tol T)
(declare-const factor T)
(declare-const remembered Bool)
(define-fun same () Bool (= (compare_impl tol factor remembered x y) the_same))
(define-fun claim_signs () Bool
  (=> (or (and (fp.lt x zero) (fp.gt y zero)) (and (fp.gt x zero) (fp.lt y zero))) (not same)))
(define-fun claim_zero () Bool (=> (not (= (fp.isZero x) (fp.isZero y))) (not same)))
