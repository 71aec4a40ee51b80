; Proves: for tolerances up to `bits` - 1 the answer is the same whether the factor is remembered or
;   made anew.
; Models: compare_impl (compare.h).
; for: single, double
; with: real_type any_arithmetic rule two_reals
; fault: (far_apart d m)) s => (far_apart d m)) the_same
; fault: (and (not remembered) (far_apart d m)) s => (not remembered) s
; fault: (far_apart (diff x y) (larger x y)) => (fp.isNaN x)

; What the other two files about the early exit prove of these two reals.
(declare-const factor T)
(assert (=> (far_apart (diff x y) (larger x y))
            (not (within factor (diff x y) (larger x y)))))
(declare-const tol T)

(define-fun claim () Bool
  (= (compare_impl tol factor false x y) (compare_impl tol factor true x y)))
