; Proves: for any factor, if the difference times the divisor is below the magnitude, the pair is
;   within the factor.
; Models: certain_divisor (talnumericarray_sameq_certainty.h), and the scaling in compare_impl
;   (compare.h).
; for: single, double
; with:
; fault: (* 8.0 e) => (* 2.0 e)
; fault: (+ product f) => product
; fault: (+ 1.0 (* 4.0 e)) => (+ 1.0 e)
; fault: (>= divisor (+ 1.0 f)) => (>= divisor 1.0)
; fault: (<= f 1.0) => (<= f 2.0)
; fault: (< (* divisor d) (* m f)) => (< d (* m f))

; The factor, at least 2^-bits as for any tolerance above zero, and the epsilon of the type:
; rounding changes a result by less than epsilon times that result, unless it is subnormal.
(declare-const f Real)
(define-fun e () Real $epsilon)
(assert (and (> f 0.0) (<= f 1.0)))

; Each times the factor: the factor's inverse, that inverse times 1 + 8 epsilon, and the divisor,
; all rounded.
(declare-const inverse Real)
(declare-const product Real)
(declare-const divisor Real)
(define-fun divisor_is_rounded () Bool
  (and (>= inverse (- 1.0 e))
       (>= product (* (- 1.0 e) (+ 1.0 (* 8.0 e)) inverse))
       (>= divisor (* (- 1.0 e) (+ product f)))))
(define-fun divisor_is_more () Bool
  (and (>= divisor (+ 1.0 (* 4.0 e))) (>= divisor (+ 1.0 f))))
(define-fun claim_divisor () Bool (=> divisor_is_rounded divisor_is_more))

; The exact difference, and those of the test and of the rule: the test subtracts in the order of
; the arguments and the rule from the larger, which some directions round differently. A subnormal
; difference is exact.
(declare-const exact Real)
(declare-const d Real)
(declare-const diff Real)
(assert (and (> exact 0.0) (>= d (* (- 1.0 e) exact)) (<= 0.0 diff (* (+ 1.0 e) exact))))

; A magnitude of 1 or more is multiplied by the factor.
(declare-const m Real)
(declare-const scaled_m Real)
(define-fun claim_large () Bool
  (=> (and divisor_is_more (< (* divisor d) (* m f)) (>= scaled_m (* (- 1.0 e) m f)))
      (< diff scaled_m)))

; Below 1 the difference is divided by the factor. This is the rounded quotient times the factor: if
; the quotient is subnormal, so that the difference is exact, its error is less than the least
; number above zero.
(declare-const quotient Real)
(declare-const least Real)
(define-fun quotient_is_rounded () Bool
  (or (<= quotient (* (+ 1.0 e) diff))
      (and (= d diff) (>= diff least) (<= quotient (+ diff (* least f))))))
(define-fun claim_small () Bool
  (=> (and divisor_is_more (< (* divisor d) (* m f)) quotient_is_rounded)
      (< quotient (* m f))))

; Either way the difference is below the magnitude itself.
(define-fun claim_below_magnitude () Bool
  (=> (> m 0.0) (and (<= (* m f) m) (<= (* diff f) diff))))
