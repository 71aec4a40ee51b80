; Proves: on the table of inputs the formulas for reals have the values that the code has.
; Stands for: compare_impl (compare.h), certain_divisor and doubt
;   (talnumericarray_sameq_blocks.h).
; for: single, double
; with: real_type arithmetic rule block_test
; fault: (fp.lt d (times m factor)) => (fp.leq d (times m factor))
; fault: (fp.lt (over d factor) m) => (fp.leq (over d factor) m)
; fault: (fp.leq m (plus d d)) => (fp.lt m (plus d d))
; fault: (fp.geq d (times m half)) => (fp.gt d (times m half))
; fault: (fp.eq d m) s => (fp.lt d m) s
; fault: (fp.geq tol bits) => (fp.gt tol bits)
; fault: (fp.leq tol zero) => (fp.lt tol zero)
; fault: (= (fp.lt x zero) (fp.lt y zero)) => (= x y)
; fault: (fp.lt (times (difference x y) divisor) => (fp.leq (times (difference x y) divisor)
; fault: larger least))) => larger zero)))
; fault: (times inverse slack) => inverse
; fault: (bvshl imaginary => (bvlshr imaginary

(define-fun claim () Bool (and
$table))
