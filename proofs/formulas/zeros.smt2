; Proves: the difference of two reals, without its sign, is the same whatever sign a zero has.
; Models: the conversions of integers (talnumericarray_sameq_vectors.h), which may give a zero of the
;   other sign than a scalar conversion.
; for: rounded single, rounded double
; with: real_type arithmetic certainty two_reals
; fault: (fp.eq x other) => (fp.leq x other)
; fault: (fp.abs (minus x y)) => (minus x y)

(declare-const other T)
(define-fun claim_first () Bool (=> (fp.eq x other) (= (difference x y) (difference other y))))
