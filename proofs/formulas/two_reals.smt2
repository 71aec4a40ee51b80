(declare-const x T)
(declare-const y T)
; Pairs that the factor decides: two nonzero numbers of one sign.
(define-fun of_one_sign () Bool
  (and (not (fp.isZero x)) (not (fp.isZero y)) (not (fp.isNaN x)) (not (fp.isNaN y))
       (= (fp.lt x zero) (fp.lt y zero))))
