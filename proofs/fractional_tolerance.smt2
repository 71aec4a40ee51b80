; Proves: for any remembered factor, the block test is certain only of pairs that are the same.
; Stands for: compare_impl (compare.h), and doubt (talnumericarray_sameq_blocks.h) for nearness.
; for: single, double
; with: real_type any_arithmetic rule block_test two_reals
; fault: (ite (fp.eq x y) the_same => (ite (= x y) the_same
; fault: (fp.lt (times (difference x y) divisor) (magnitude x y))) => (fp.leq (times (difference x y) divisor) (magnitude x y)))

; What magnitudes.smt2 proves of these two reals.
(assert (=> of_one_sign (= (larger x y) (magnitude x y))))
(assert (=> (and of_one_sign (not (fp.eq x y))) (= (diff x y) (difference x y))))
(assert (=> (not (or of_one_sign (fp.eq x y)))
            (not (fp.lt (difference x y) (magnitude x y)))))
; What rounding.smt2 and fractional_scaling.smt2 prove of their difference.
(declare-const factor T)
(declare-const divisor T)
(assert (=> (and (not (fp.isInfinite (magnitude x y)))
                 (fp.lt (times (difference x y) divisor) (magnitude x y)))
            (within factor (difference x y) (magnitude x y))))
(assert (=> (fp.geq (difference x y) zero)
            (fp.geq (times (difference x y) divisor) (difference x y))))
; Of subtraction and multiplication.
(assert (=> (and (not (fp.eq x y)) (or (fp.isInfinite x) (fp.isInfinite y)))
            (or (fp.isNaN (minus x y)) (fp.isInfinite (minus x y)))))
(assert (=> (fp.isNaN (difference x y)) (fp.isNaN (times (difference x y) divisor))))

(declare-const tol T)
(assert (and (fp.gt tol zero) (fp.lt tol bits)))

(define-fun claim () Bool
  (=> (certain divisor x y) (= (compare_impl tol factor true x y) the_same)))
