; The operations as IEEE 754 has them, rounding to nearest.
(define-fun minus ((a T) (b T)) T (fp.sub RNE a b))
(define-fun plus ((a T) (b T)) T (fp.add RNE a b))
(define-fun times ((a T) (b T)) T (fp.mul RNE a b))
(define-fun over ((a T) (b T)) T (fp.div RNE a b))
