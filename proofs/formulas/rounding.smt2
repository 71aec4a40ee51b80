; Proves: what the other proofs use about rounding, in any direction: it keeps the order, it does
;   not bring an exact result past a number, and its error is less than the spacing of the numbers
;   there.
; Models: every operation of compare.h and talnumericarray_sameq_certainty.h, as IEEE 754 defines
;   them: of the type's numbers on the side that the direction allows, the result is one nearest to
;   the exact result.
; for: directions
; with:
; fault: (=> (= v w) (= rounded_v rounded_w)) => true
; fault: (=> (on_side z w) => (=> (not (on_side z w))
; fault: (<= (- q p) spacing) => (<= (- q p) (* 2.1 spacing))

(define-fun distance ((a Real) (b Real)) Real (ite (< a b) (- b a) (- a b)))
(define-fun on_side ((z Real) (w Real)) Bool
  (ite (= $direction RTP) (>= z w)
  (ite (= $direction RTN) (<= z w)
  (ite (= $direction RTZ) (ite (< w 0.0) (>= z w) (<= z w))
    true))))
; `rounded` is what `w` is rounded to, as far as the number `z` shows.
(define-fun rounds ((w Real) (rounded Real) (z Real)) Bool
  (and (on_side rounded w)
       (=> (on_side z w) (<= (distance rounded w) (distance z w)))))

; Two exact results, and what they are rounded to.
(declare-const v Real)
(declare-const rounded_v Real)
(declare-const w Real)
(declare-const rounded_w Real)
(assert (=> (= v w) (= rounded_v rounded_w)))
(assert (and (rounds v rounded_v rounded_w) (rounds w rounded_w rounded_v)))
; Zero is a number, and this is any other.
(declare-const z Real)
(assert (and (rounds v rounded_v 0.0) (rounds w rounded_w 0.0) (rounds w rounded_w z)))
; Two numbers with w between them.
(declare-const p Real)
(declare-const q Real)
(declare-const spacing Real)
(assert (and (<= p w q) (> spacing 0.0) (<= (- q p) spacing)))
(assert (and (rounds w rounded_w p) (rounds w rounded_w q)))

(define-fun claim_order () Bool (=> (<= v w) (<= rounded_v rounded_w)))
(define-fun claim_below_a_number () Bool (=> (< rounded_w z) (< w z)))
(define-fun claim_above_a_number () Bool (=> (> rounded_w z) (> w z)))
(define-fun claim_less_than_spacing () Bool (< (distance rounded_w w) spacing))
