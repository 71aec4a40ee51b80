; Of the operations on two reals: NaN in, NaN out.
(assert (=> (or (fp.isNaN x) (fp.isNaN y)) (and (fp.isNaN (minus x y)) (fp.isNaN (minus y x)))))
(define-fun nan_stays ((factor T) (d T) (m T)) Bool
  (and (=> (fp.isNaN d) (and (fp.isNaN (plus d d)) (fp.isNaN (over d factor))))
       (=> (fp.isNaN m) (and (fp.isNaN (times m half)) (fp.isNaN (times m factor))))))
