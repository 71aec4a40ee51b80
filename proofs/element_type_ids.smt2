; Proves: one unsigned comparison of id - 1 with 11 accepts exactly the ids from 1 to 12, so no
;   negative ones, and so does a chain of equalities.
; Models: with_element_type (talnumericarray_sameq_impl.h).
; for: any
; with: type_ids
; fault: (_ bv11 32)) => (_ bv12 32))
; fault: (bvsub id (_ bv1 32)) => id
; fault: (= id (_ bv7 32)) => (= id (_ bv13 32))

(declare-const id Id)
(define-fun known () Bool (and (bvsge id (_ bv1 32)) (bvsle id (_ bv12 32))))
(define-fun claim_range () Bool (= (in_range id) known))
(define-fun claim_chain () Bool (= (in_chain id) known))
