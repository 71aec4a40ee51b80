; Proves: for any factor, a difference that is below the magnitude when it has been multiplied by the
;   divisor is within the factor.
; Stands for: certain_divisor and `fabs(x - y) * divisor < max` (talnumericarray_sameq_blocks.h), and
;   the scaling in compare_impl (compare.h).
; for: single, double
; with:
; fault: (* 8.0 u) => (* 6.0 u)
; fault: (>= m_scaled (* (- 1.0 u) m f)) => (>= m_scaled (* (- 1.0 u u) m f (- 1.0 u) (- 1.0 u) (- 1.0 u) (- 1.0 u) (- 1.0 u)))
; fault: (> (* divisor f) 1.0) => (> (* divisor f) 0.5)

(define-fun u () Real $unit_roundoff)
(declare-const f Real)
(assert (and (> f 0.0) (< f 1.0)))
; 1/f, and that times 1 + 4 epsilon, each rounded as rounding.smt2 says.
(declare-const inverse Real)
(declare-const divisor Real)
(define-fun inverse_is_rounded () Bool (<= (- u) (- (* inverse f) 1.0) u))
(define-fun divisor_is_rounded () Bool
  (>= divisor (* (- 1.0 u) inverse (+ 1.0 (* 8.0 u)))))
(define-fun divisor_is_more () Bool (>= (* divisor f) (+ 1.0 (* 5.0 u))))
(define-fun claim_divisor_is_more () Bool
  (=> (and inverse_is_rounded divisor_is_rounded) divisor_is_more))

(declare-const d Real)
(declare-const m Real)
(assert (and (>= d 0.0) (> m 0.0)))
(define-fun below () Bool (< (* d divisor) m))

; A magnitude of 1 or more is multiplied by the factor.
(declare-const a Real)
(define-fun claim_times_factor () Bool (=> (< a m) (< (* a f) (* m f))))
(declare-const g Real)
(define-fun claim_slack () Bool
  (=> (>= g (+ 1.0 (* 5.0 u))) (>= (* d g (- 1.0 u)) d)))
(declare-const m_scaled Real)
(define-fun claim_large () Bool
  (=> (and (< (* d divisor f) (* m f))
           (>= (* d divisor f (- 1.0 u)) d)
           (>= m_scaled (* (- 1.0 u) m f)))
      (< d m_scaled)))

; Below 1 the difference is divided by it; that keeps the order, and so does rounding.
(declare-const quotient Real)
(define-fun claim_small () Bool
  (=> (and (> (* divisor f) 1.0) (= (* quotient f) d)) (<= quotient (* d divisor))))
(define-fun claim_no_less_than_before () Bool
  (=> (> (* divisor f) 1.0) (and (> divisor 1.0) (>= (* d divisor) d))))
