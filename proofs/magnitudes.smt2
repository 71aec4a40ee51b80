; Proves: the block test takes the same difference and larger magnitude as the rule; where the rule
;   takes none, the difference is not below the magnitude.
; Stands for: `diff` and `max` in compare_impl (compare.h), and in doubt
;   (talnumericarray_sameq_blocks.h).
; for: single, double
; with: real_type arithmetic rule block_test two_reals
; fault: (fp.neg y) => y
; fault: (fp.gt larger least) => (fp.lt larger least)
; fault: (ite (fp.lt y x) (minus x y) => (ite (fp.lt x y) (minus x y)

(define-fun claim_magnitude () Bool
  (=> of_one_sign (= (larger x y) (magnitude x y))))
(define-fun claim_difference () Bool
  (=> (and of_one_sign (not (fp.eq x y))) (= (diff x y) (difference x y))))
(define-fun claim_no_other_pair_is_near () Bool
  (=> (not (or of_one_sign (fp.eq x y))) (not (fp.lt (difference x y) (magnitude x y)))))
