; Proves: for whole tolerances with a remembered factor, the block test is certain exactly of the
;   pairs that are the same, but for two infinities, of which it is in doubt.
; Stands for: compare_impl (compare.h), and doubt (talnumericarray_sameq_blocks.h) for nearness.
; for: single, double
; with: real_type any_arithmetic rule block_test two_reals nan_stays_nan whole_factor
; fault: (fp.isInfinite x) => (fp.isNaN x)
; fault: (fp.eq d m) s => (fp.lt d m) s
; fault: (fp.isZero x) (ite => (fp.isNaN x) (ite

; What magnitudes.smt2 and whole_scaling.smt2 prove of these two reals.
(assert (=> of_one_sign (= (larger x y) (magnitude x y))))
(assert (=> (and of_one_sign (not (fp.eq x y))) (= (diff x y) (difference x y))))
(assert (=> (not (or of_one_sign (fp.eq x y)))
            (not (fp.lt (difference x y) (magnitude x y)))))
(assert (=> (not (fp.isInfinite (magnitude x y)))
            (= (within factor (difference x y) (magnitude x y))
               (fp.lt (times (difference x y) divisor) (magnitude x y)))))
(assert (=> (fp.geq (difference x y) zero)
            (fp.geq (times (difference x y) divisor) (difference x y))))
(assert (nan_stays factor (diff x y) (larger x y)))
; Of subtraction and multiplication: equal numbers and infinities.
(assert (=> (fp.eq x y) (ite (fp.isInfinite x) (fp.isNaN (minus x y)) (fp.isZero (minus x y)))))
(assert (=> (and (not (fp.eq x y)) (or (fp.isInfinite x) (fp.isInfinite y)))
            (or (fp.isNaN (minus x y)) (fp.isInfinite (minus x y)))))
(assert (=> (fp.isZero (difference x y)) (fp.isZero (times (difference x y) divisor))))
(assert (=> (fp.isNaN (difference x y)) (fp.isNaN (times (difference x y) divisor))))

(declare-const tol T)
(assert (and (fp.geq tol one) (fp.lt tol bits)))

(define-fun claim () Bool
  (= (= (compare_impl tol factor true x y) the_same)
     (or (certain divisor x y) (and (fp.isInfinite x) (= x y)))))
