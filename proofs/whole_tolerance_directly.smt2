; Proves: what whole_tolerance.smt2 does, at one go and without its lemmas.
; Stands for: compare_impl (compare.h), and doubt (talnumericarray_sameq_blocks.h) for nearness.
; for: single
; with: real_type arithmetic rule block_test two_reals whole_factor
; fault: (fp.isInfinite x) => (fp.isNaN x)

(declare-const tol T)
(assert (and (fp.geq tol one) (fp.lt tol bits)))

(define-fun claim () Bool
  (= (= (compare_impl tol factor true x y) the_same)
     (or (certain divisor x y) (and (fp.isInfinite x) (= x y)))))
