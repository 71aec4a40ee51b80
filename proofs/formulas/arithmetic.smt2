; The operations as IEEE 754 defines them, in one direction of rounding.
(define-fun minus ((a T) (b T)) T (fp.sub $direction a b))
(define-fun plus ((a T) (b T)) T (fp.add $direction a b))
(define-fun times ((a T) (b T)) T (fp.mul $direction a b))
(define-fun over ((a T) (b T)) T (fp.div $direction a b))
(define-fun minus_product ((a T) (b T) (c T)) T (fp.fma $direction (fp.neg b) c a))
