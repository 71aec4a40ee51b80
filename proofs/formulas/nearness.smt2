; Proves: under a tolerance above zero with a remembered factor, and under one of all digits, the
;   test is certain only of pairs that are the same; equal numbers are the same under any tolerance;
;   and beside a real, an imaginary part passes exactly if it is a zero.
; Models: compare_impl (compare.h), certainly_same_reals (talnumericarray_sameq_certainty.h),
;   and DoubtsAboutReals::add and the zeros beside imaginary parts (talnumericarray_sameq_vectors.h).
; for: single, double
; with: real_type any_arithmetic rule certainty two_reals
; fault: (fp.geq (left_over => (fp.leq (left_over
; fault: (fp.geq tol bits) => (fp.gt tol bits)
; fault: (fp.eq d m) s => (fp.leq d m) s
; fault: (ite (fp.eq x y) the_same => (ite (= x y) the_same
; fault: (=> (fp.isZero x) => (=> (fp.isZero y)

(declare-const tol T)
(declare-const factor T)
(declare-const remembered Bool)
(declare-const fused Bool)
(declare-const divisor T)
(define-fun certainly () Bool (certain fused divisor x y))
(define-fun d () T (difference x y))

; What doubtful_pairs.smt2 proves about these two reals.
(assert (=> (not (and (finite x) (finite y))) (not (finite d))))
(assert (=> (not (finite d)) (not certainly)))
(assert (=> (and (finite x) (fp.eq x y)) certainly))
(assert (=> (and (finite x) (finite y) (not (fp.eq x y))) (fp.gt d zero)))
(assert (=> (and (finite x) (finite y) (not of_one_sign) (not (fp.eq x y)))
            (fp.geq d (fp.abs y))))
; What rounding.smt2 proves about results: if m - p, rounded, is above zero, so is the exact m - p;
; and if p, rounded, is below m, so is the exact p. Hence in either form the exact product is below
; the magnitude, and so is the difference, as the divisor is at least 1.
(declare-const product_is_below Bool)
(assert (=> (fp.gt (left_over fused divisor d (fp.abs y)) zero) product_is_below))
(assert (=> product_is_below (fp.lt d (fp.abs y))))
; And what scaling.smt2 proves from this.
(assert (=> (and product_is_below of_one_sign (fp.lt tol bits))
            (and (within factor (diff x y) (larger x y)) (fp.lt (diff x y) (larger x y)))))

(define-fun same () Bool (= (compare_impl tol factor remembered x y) the_same))
(define-fun claim_nearness () Bool
  (=> (and certainly (fp.gt tol zero) (or remembered (fp.geq tol bits))) same))
(define-fun claim_equality () Bool (=> (fp.eq x y) same))
(define-fun claim_imaginary_part () Bool
  (=> (fp.isZero x) (and (= certainly (fp.isZero y)) (= (fp.eq x y) (fp.isZero y)))))

; Where the processor takes subnormal operands for zero, x and y are zeros and normal numbers. If
; their difference is subnormal, they are of one sign, and the test and the rule see it as zero; the
; rule finds them the same. Otherwise the difference is normal, and so are the product, which is no
; less, the magnitude times the factor, and the quotient; and if what is left over is not normal, it
; is below the difference. Where results are flushed but operands are not, the test must not be
; used: two subnormals of different signs, or one beside a zero, have the difference zero and would
; pass.
