; The operations in one direction of rounding, where subnormal results are flushed to zero. A result
; may be subnormal before it is rounded and the least normal number after that, and processors differ
; in which of these counts. So such a product or quotient may be flushed or not, as each likes. A sum
; or difference this small is exact. The sign of the zero is never asked for.
(define-fun least_normal () T
  (real (bvshl (_ bv1 $width) (bvsub (_ bv$significand_bits $width) (_ bv1 $width)))))
(define-fun flushed ((result T)) T (ite (fp.isSubnormal result) zero result))
(declare-fun product_is_flushed (T T) Bool)
(declare-fun quotient_is_flushed (T T) Bool)
(declare-fun fused_is_flushed (T T T) Bool)
(define-fun flushed_at_limit ((at_limit Bool) (result T)) T
  (ite (and at_limit (fp.eq (fp.abs result) least_normal)) zero (flushed result)))
(define-fun minus ((a T) (b T)) T (flushed (fp.sub $direction a b)))
(define-fun plus ((a T) (b T)) T (flushed (fp.add $direction a b)))
(define-fun times ((a T) (b T)) T
  (flushed_at_limit (product_is_flushed a b) (fp.mul $direction a b)))
(define-fun over ((a T) (b T)) T
  (flushed_at_limit (quotient_is_flushed a b) (fp.div $direction a b)))
(define-fun minus_product ((a T) (b T) (c T)) T
  (flushed_at_limit (fused_is_flushed a b c) (fp.fma $direction (fp.neg b) c a)))
