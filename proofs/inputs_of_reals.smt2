; Proves: on the table of inputs the formulas for reals have the values that the code has.
; Models: compare_impl (compare.h), certain_divisor and certainly_same_reals
;   (talnumericarray_sameq_certainty.h), and DoubtsAboutReals::add (talnumericarray_sameq_vectors.h).
; for: rounded single, rounded double
; with: real_type arithmetic rule certainty
; fault: (fp.lt d (times m factor)) => (fp.leq d (times m factor))
; fault: (fp.lt (over d factor) m) => (fp.leq (over d factor) m)
; fault: (fp.leq m (plus d d)) => (fp.lt m (plus d d))
; fault: (fp.geq d (times m half)) => (fp.gt d (times m half))
; fault: (fp.eq d m) s => (fp.lt d m) s
; fault: (fp.geq tol bits) => (fp.gt tol bits)
; fault: (fp.leq tol zero) => (fp.lt tol zero)
; fault: (= (fp.lt x zero) (fp.lt y zero)) => (= x y)
; fault: (fp.geq (left_over fused divisor d m) d) => (fp.gt (left_over fused divisor d m) d)
; fault: (fp.abs y))) => (fp.abs x)))
; fault: (times (over one factor) slack) => (over one factor)

(define-fun claim () Bool (and
$table))
