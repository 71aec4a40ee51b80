; The rule for two reals: the steps of `compare_impl` in compare.h. -1, 0 and 1 are written as bytes.
(define-sort Verdict () (_ BitVec 8))
(define-fun the_same () Verdict #x00)
(define-fun above () Verdict #x01)
(define-fun below () Verdict #xff)

(define-fun diff ((x T) (y T)) T (ite (fp.lt y x) (minus x y) (minus y x)))
(define-fun larger ((x T) (y T)) T
  (ite (fp.lt y x)
    (ite (fp.lt x zero) (fp.neg y) x)
    (ite (fp.lt y zero) (fp.neg x) y)))
(define-fun far_apart ((d T) (m T)) Bool
  (ite (fp.geq m one) (fp.geq d (times m half)) (fp.leq m (plus d d))))
(define-fun within ((factor T) (d T) (m T)) Bool
  (ite (fp.geq m one) (fp.lt d (times m factor)) (fp.lt (over d factor) m)))

; The steps with a tolerance above zero and below `bits`. `remembered` is whether the factor is.
(define-fun by_factor ((factor T) (remembered Bool) (x T) (y T)) Verdict
  (let ((s (ite (fp.lt y x) above below)) (d (diff x y)) (m (larger x y)))
    (ite (fp.eq d m) s
    (ite (and (not remembered) (far_apart d m)) s
    (ite (within factor d m) the_same s)))))

(define-fun compare_impl ((tol T) (factor T) (remembered Bool) (x T) (y T)) Verdict
  (ite (fp.eq x y) the_same
  (ite (fp.isZero x) (ite (fp.lt y zero) above below)
  (ite (fp.isZero y) (ite (fp.lt x zero) below above)
  (ite (not (= (fp.lt x zero) (fp.lt y zero))) (ite (fp.lt x zero) below above)
  (ite (fp.leq tol zero) (ite (fp.lt y x) above below)
  (ite (fp.geq tol bits) the_same
    (by_factor factor remembered x y))))))))

; Whether a factor is made for this pair.
(define-fun makes_factor ((tol T) (remembered Bool) (x T) (y T)) Bool
  (and (not (fp.eq x y)) (not (fp.isZero x)) (not (fp.isZero y))
       (= (fp.lt x zero) (fp.lt y zero)) (not (fp.leq tol zero)) (not (fp.geq tol bits))
       (not (fp.eq (diff x y) (larger x y))) (not remembered)
       (not (far_apart (diff x y) (larger x y)))))
