; Proves: on the table of inputs the formulas for integers have the values that the code has.
; Models: the integer overloads of compare_impl (compare.h), and DoubtsAboutIntegers::add
;   (talnumericarray_sameq_vectors.h).
; for: integers
; with: integer_tests
; fault: (bvor bits (bvand (wide_x x) sign)) => bits
; fault: (bvslt x y) (bvult x y) => (bvult x y) (bvult x y)
; fault: (= x y) #x00 => (= x y) #x01

(define-fun claim () Bool (and
$table))
