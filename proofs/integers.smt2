; Proves: the three-way comparison of two integers is that of the numbers, and the test is certain
;   exactly of equal numbers, for every two widths and signednesses.
; Models: the integer overloads of compare_impl (compare.h), and DoubtsAboutIntegers::add
;   (talnumericarray_sameq_vectors.h).
; for: integers
; with: integer_tests
; fault: (bvor bits (bvand (wide_x x) sign)) => bits
; fault: (not (= x_signed y_signed)) => (= x_signed y_signed)
; fault: (bvxor (wide_x x) (wide_y y)) => (bvand (wide_x x) (wide_y y))
; fault: (bvslt y (_ bv0 $y_width))) #x01 => (bvslt y (_ bv0 $y_width))) #x00
; fault: (bvslt x (_ bv0 $x_width))) => (bvsgt x (_ bv0 $x_width)))
; fault: (bvslt x y) (bvult x y) => (bvult x y) (bvult x y)

(declare-const x X)
(declare-const y Y)
; The numbers, in more digits than any of them needs.
(define-fun number_x () (_ BitVec 72) ((_ $x_extend $x_to_72) x))
(define-fun number_y () (_ BitVec 72) ((_ $y_extend $y_to_72) y))

(define-fun claim_comparison () Bool
  (= (compare_impl x y)
     (ite (= number_x number_y) #x00 (ite (bvslt number_x number_y) #xff #x01))))
(define-fun claim_certainty () Bool (= (certain x y) (= number_x number_y)))
