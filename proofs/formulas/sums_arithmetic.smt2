; Sums and differences as IEEE 754 defines them; about the other operations only what a proof assumes
; is known.
(define-fun minus ((a T) (b T)) T (fp.sub $direction a b))
(define-fun plus ((a T) (b T)) T (fp.add $direction a b))
(declare-fun times (T T) T)
(declare-fun over (T T) T)
(declare-fun minus_product (T T T) T)
