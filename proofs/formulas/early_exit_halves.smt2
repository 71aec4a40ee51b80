; Proves: half of a magnitude of 1 or more, and twice a difference below 1, are exact.
; Models: `far_apart` in compare_impl (compare.h).
; for: rounded single, rounded double
; with: real_type arithmetic
; fault: (fp.geq m one) => (fp.gt m zero)
; fault: (plus d d) => (plus d one)

(declare-const m T)
(declare-const d T)
(assert (and (fp.geq m one) (not (fp.isInfinite m))))
(assert (and (fp.geq d zero) (fp.lt d one)))
(define-fun claim_half () Bool (= (plus (times m half) (times m half)) m))
(define-fun claim_twice () Bool (= (times (plus d d) half) d))
