; Proves: on the table of inputs the chain of equalities has the values that the dispatch has.
; Models: with_element_type (talnumericarray_sameq_impl.h).
; for: any
; with: type_ids
; fault: (= id (_ bv7 32)) => (= id (_ bv13 32))

(define-fun claim () Bool (and
$table))
