; How the dispatch finds the element type of an id: the chain of equalities that
; `with_element_type` in talnumericarray_sameq_impl.h is written as, and the range test that
; compilers make of it.
(define-sort Id () (_ BitVec 32))
(define-fun in_chain ((id Id)) Bool
  (or (= id (_ bv1 32)) (= id (_ bv2 32)) (= id (_ bv3 32)) (= id (_ bv4 32)) (= id (_ bv5 32))
      (= id (_ bv6 32)) (= id (_ bv7 32)) (= id (_ bv8 32)) (= id (_ bv9 32)) (= id (_ bv10 32))
      (= id (_ bv11 32)) (= id (_ bv12 32))))
(define-fun in_range ((id Id)) Bool (bvule (bvsub id (_ bv1 32)) (_ bv11 32)))
