; Proves: shifting the sign out of an imaginary part leaves zero exactly if it is a zero.
; Stands for: the imaginary part in doubt (talnumericarray_sameq_blocks.h), and `idata == 0` in
;   sameQ_test (talnumericarray_sameq_elements.h).
; for: single, double
; with: real_type arithmetic block_test
; fault: (bvshl imaginary (_ bv1 $width)) => imaginary

(declare-const imaginary (_ BitVec $width))
(define-fun claim () Bool
  (= (= (imaginary_doubt imaginary) (_ bv0 $width))
     (fp.eq (real imaginary) zero)))
