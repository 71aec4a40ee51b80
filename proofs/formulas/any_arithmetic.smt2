; Operations about which only what a proof assumes is known.
(declare-fun minus (T T) T)
(declare-fun plus (T T) T)
(declare-fun times (T T) T)
(declare-fun over (T T) T)
; a - b * c, rounded once.
(declare-fun minus_product (T T T) T)
