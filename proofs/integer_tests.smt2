; The comparison and the test for equality of two integers of given widths and signednesses.
(define-sort X () (_ BitVec $x_width))
(define-sort Y () (_ BitVec $y_width))
(define-fun x_signed () Bool $x_signed)
(define-fun y_signed () Bool $y_signed)
; Converted to the width of the wider one: the digits put in front are signs or zeros.
(define-fun wide_x ((x X)) (_ BitVec $width) ((_ $x_extend $x_to_width) x))
(define-fun wide_y ((y Y)) (_ BitVec $width) ((_ $y_extend $y_to_width) y))

; The integer overloads of `compare_impl` in compare.h. -1, 0 and 1 are written as bytes.
(define-fun compare_equal_types ((x (_ BitVec $width)) (y (_ BitVec $width))) (_ BitVec 8)
  (ite (= x y) #x00
  (ite (ite (and x_signed y_signed) (bvslt x y) (bvult x y)) #xff #x01)))
(define-fun compare_impl ((x X) (y Y)) (_ BitVec 8)
  (ite (and (not x_signed) y_signed (bvslt y (_ bv0 $y_width))) #x01
  (ite (and x_signed (not y_signed) (bvslt x (_ bv0 $x_width))) #xff
    (compare_equal_types (wide_x x) (wide_y y)))))

; The bits that DoubtsAboutIntegers::add in talnumericarray_sameq_vectors.h gathers.
(define-fun sign () (_ BitVec $width) (bvshl (_ bv1 $width) (_ bv$sign_position $width)))
(define-fun doubt ((x X) (y Y)) (_ BitVec $width)
  (let ((bits (bvxor (wide_x x) (wide_y y))))
    (ite (and (not (= x_signed y_signed)) $unsigned_is_widest)
      (bvor bits (bvand (wide_x x) sign))
      bits)))
(define-fun certain ((x X) (y Y)) Bool (= (doubt x y) (_ bv0 $width)))
