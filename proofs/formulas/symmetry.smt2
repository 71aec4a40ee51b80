; Proves: two reals in either order are the same, and a factor is made for them in either order; and
;   if neither is a NaN, what is above in one order is below in the other.
; Models: compare_impl (compare.h); that a pair of element types and its reverse share a loop
;   (elements_sameQ in talnumericarray_sameq_walk.h).
; for: single, double
; with: real_type any_arithmetic rule two_reals
; fault: (minus y x)) => (minus x y))
; fault: (ite (fp.lt y zero) (fp.neg x) y) => (ite (fp.lt y zero) (fp.neg x) x)
; fault: (ite (fp.lt x zero) below above) => above

(declare-const tol T)
(declare-const factor T)
(declare-const remembered Bool)
; About the operations: NaN in, NaN out.
(assert (=> (or (fp.isNaN x) (fp.isNaN y)) (and (fp.isNaN (minus x y)) (fp.isNaN (minus y x)))))
(define-fun nan_stays ((factor T) (d T) (m T)) Bool
  (and (=> (fp.isNaN d) (and (fp.isNaN (plus d d)) (fp.isNaN (over d factor))))
       (=> (fp.isNaN m) (and (fp.isNaN (times m half)) (fp.isNaN (times m factor))))))
(assert (and (nan_stays factor (diff x y) (larger x y))
             (nan_stays factor (diff y x) (larger y x))))

(define-fun same ((a T) (b T)) Bool (= (compare_impl tol factor remembered a b) the_same))
(define-fun claim_same () Bool (= (same x y) (same y x)))
(define-fun claim_factor () Bool (= (makes_factor tol remembered x y) (makes_factor tol remembered y x)))
(define-fun claim_order () Bool
  (=> (not (or (fp.isNaN x) (fp.isNaN y)))
      (= (compare_impl tol factor remembered x y)
         (bvneg (compare_impl tol factor remembered y x)))))
