; Proves: for whole tolerances up to `bits` - 1, a pair that is far apart is not within the factor.
; Stands for: `far_apart` in compare_impl (compare.h).
; for: single, double
; with: real_type arithmetic rule whole_factor
; fault: (times m half) => (times m (times half half))
; fault: (fp.leq m (plus d d)) => (fp.leq m (plus d (plus d d)))
; fault: bv$half_exponent => bv$bias

(declare-const d T)
(declare-const m T)
(assert (fp.geq d zero))
(assert (and (fp.gt m zero) (not (fp.isInfinite m))))

(define-fun claim () Bool (=> (far_apart d m) (not (within factor d m))))
