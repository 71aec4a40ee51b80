; Proves: a pair that is far apart is not within any factor up to 1/2, with exact results; as
;   rounding.smt2 says, rounding keeps the order.
; Models: `far_apart` in compare_impl (compare.h).
; for: any
; with:
; fault: (<= f 0.5) => (< f 0.6)
; fault: (>= d (* m 0.5)) => (>= d (* m 0.25))

(declare-const f Real)
(declare-const d Real)
(declare-const m Real)
(assert (and (> f 0.0) (<= f 0.5) (>= d 0.0) (> m 0.0)))
(define-fun claim_large () Bool (=> (>= d (* m 0.5)) (and (<= (* m f) (* m 0.5)) (>= d (* m f)))))
(declare-const quotient Real)
(assert (= (* quotient f) d))
(define-fun claim_small () Bool (=> (<= m (+ d d)) (>= quotient m)))
