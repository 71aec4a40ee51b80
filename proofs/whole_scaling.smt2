; Proves: for whole tolerances, multiplying the difference by the divisor and the rule's last two
;   steps ask the same.
; Stands for: the scaling in compare_impl (compare.h); certain_divisor and `fabs(x - y) * divisor <
;   max` in doubt (talnumericarray_sameq_blocks.h).
; for: single, double
; with: real_type arithmetic rule block_test whole_factor
; fault: (fp.lt (over d factor) m) => (fp.leq (over d factor) m)
; fault: (fp.lt d (times m factor)) => (fp.leq d (times m factor))
; fault: (bvsub (_ bv$twice_bias => (bvsub (_ bv$bias
; fault: (fp.geq m one) (fp.lt d => (fp.lt m one) (fp.lt d

(declare-const d T)
(declare-const m T)
(assert (fp.geq d zero))
(assert (and (fp.gt m zero) (not (fp.isInfinite m))))

(define-fun claim_divisor () Bool (= divisor (certain_divisor true factor)))
(define-fun claim_scaling () Bool
  (= (within factor d m) (fp.lt (times d divisor) m)))
(define-fun claim_no_less_than_before () Bool (fp.geq (times d divisor) d))
