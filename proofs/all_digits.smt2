; Proves: where every digit is tolerated, the block test with the divisor 1 is certain only of pairs
;   that are the same.
; Stands for: `tol >= bits` in compare_impl (compare.h) and in certain_divisor
;   (talnumericarray_sameq_blocks.h).
; for: single, double
; with: real_type arithmetic rule block_test two_reals
; fault: (fp.lt (times (difference x y) divisor) => (fp.leq (times (difference x y) divisor)
; fault: (ite (fp.eq x y) the_same => (ite (= x y) the_same

(declare-const tol T)
(assert (fp.geq tol bits))
(define-fun claim () Bool
  (=> (certain one x y) (= (compare_impl tol one true x y) the_same)))
