; The block test for two reals: `doubt` and `certain_divisor` in talnumericarray_sameq_blocks.h.
(define-fun difference ((x T) (y T)) T (fp.abs (minus x y)))
(define-fun magnitude ((x T) (y T)) T
  (let ((larger (ite (fp.gt (fp.abs x) (fp.abs y)) (fp.abs x) (fp.abs y))))
    (ite (fp.gt larger least) larger least)))
(define-fun certain ((divisor T) (x T) (y T)) Bool
  (fp.lt (times (difference x y) divisor) (magnitude x y)))

(define-fun slack () T
  (plus one ((_ to_fp $exponent_bits $significand_bits) RNE $four_epsilon)))
(define-fun certain_divisor ((whole Bool) (factor T)) T
  (let ((inverse (over one factor))) (ite whole inverse (times inverse slack))))

(define-fun imaginary_doubt ((imaginary (_ BitVec $width))) (_ BitVec $width)
  (bvshl imaginary (_ bv1 $width)))
