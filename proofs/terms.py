"""Terms of SMT-LIB: made from code, simplified as they are made, and printed for a solver.

A sort is "Bool", ("bits", width) or ("real", exponent bits, significand bits). A boolean is an integer
of one bit in LLVM and a Bool here. The operations have their names in SMT-LIB, except

    from_bits      the real of these bits
    bits_of        bits of a real: for a NaN some bits of a NaN
    umax           the greater of two unsigned integers
    scaled         a product with a power of two above 1
    rounded ops    minus, plus, times, over, fused (a * b + c, rounded once), and the conversions
                   real_of_signed, real_of_unsigned and real_of_real, in the direction in force
"""

import functools

BOOL = "Bool"


def bits(width):
    return ("bits", width)


SINGLE = ("real", 8, 24)
DOUBLE = ("real", 11, 53)


def width_of(sort):
    return 1 if sort == BOOL else sort[1] if sort[0] == "bits" else sort[1] + sort[2]


class Term:
    """One of a kind: equal terms are the same object."""

    __slots__ = ("op", "arguments", "sort", "number")
    made = {}

    def __new__(cls, op, arguments, sort):
        key = (op, tuple(id(a) if isinstance(a, Term) else a for a in arguments), sort)
        term = cls.made.get(key)
        if term is None:
            term = cls.made[key] = super().__new__(cls)
            term.op, term.arguments, term.sort = op, tuple(arguments), sort
            term.number = len(cls.made)
        return term


def by_lanes(operation, *values):
    """The operation on terms, or on each lane of lists of them."""
    if isinstance(values[0], list):
        return [operation(*lanes) for lanes in zip(*values)]
    return operation(*values)


# ---- Leaves


def constant(value, width):
    return Term("constant", [value & ((1 << width) - 1)], bits(width))


def boolean(value):
    return Term("boolean", [bool(value)], BOOL)


TRUE = boolean(True)
FALSE = boolean(False)


def variable(name, sort):
    return Term("variable", [name], sort)


def is_constant(term):
    return term.op in ("constant", "boolean")


def value_of(term):
    return term.arguments[0]


def signed(value, width):
    return value - (1 << width) if value >> (width - 1) else value


# ---- Booleans


def negation(a):
    if is_constant(a):
        return boolean(not value_of(a))
    return a.arguments[0] if a.op == "not" else Term("not", [a], BOOL)


def conjunction(*arguments):
    found = {}
    for a in arguments:
        for part in a.arguments if a.op == "and" else [a]:
            if part is FALSE or negation(part) in found:
                return FALSE
            if part is not TRUE:
                found[part] = None
    if len(found) < 2:
        return next(iter(found), TRUE)
    return Term("and", sorted(found, key=lambda part: part.number), BOOL)


def disjunction(*arguments):
    return negation(conjunction(*map(negation, arguments)))


def choice(condition, a, b):
    if condition is TRUE or a is b:
        return a
    if condition is FALSE:
        return b
    if condition.op == "not":
        return choice(condition.arguments[0], b, a)
    if a.sort == BOOL:
        if is_constant(a):
            return (disjunction if a is TRUE else conjunction)(
                condition if a is TRUE else negation(condition), b)
        if is_constant(b):
            return (conjunction if b is FALSE else disjunction)(
                condition if b is FALSE else negation(condition), a)
    return Term("ite", [condition, a, b], a.sort)


# ---- Bits

OF_BITS = {
    "bvadd": lambda a, b, w: a + b,
    "bvsub": lambda a, b, w: a - b,
    "bvmul": lambda a, b, w: a * b,
    "bvand": lambda a, b, w: a & b,
    "bvor": lambda a, b, w: a | b,
    "bvxor": lambda a, b, w: a ^ b,
    "bvshl": lambda a, b, w: a << b if b < w else 0,
    "bvlshr": lambda a, b, w: a >> b if b < w else 0,
    "bvashr": lambda a, b, w: signed(a, w) >> min(b, w - 1),
    "umax": lambda a, b, w: max(a, b),
}
COMPARISONS = {
    "=": lambda a, b, w: a == b,
    "bvult": lambda a, b, w: a < b,
    "bvule": lambda a, b, w: a <= b,
    "bvslt": lambda a, b, w: signed(a, w) < signed(b, w),
    "bvsle": lambda a, b, w: signed(a, w) <= signed(b, w),
}


def is_choice_of_constants(term):
    return term.op == "ite" and is_constant(term.arguments[1]) and is_constant(term.arguments[2])


def is_choice_with_constant(term):
    return term.op == "ite" and (is_constant(term.arguments[1]) or is_constant(term.arguments[2]))


def through_choice(operation, a, *others):
    """The operation on both branches of `a`, a choice, beside constants."""
    condition, yes, no = a.arguments
    return choice(condition, operation(yes, *others), operation(no, *others))


def of_bits(op, a, b):
    width = a.sort[1]
    if is_constant(a) and is_constant(b):
        return constant(OF_BITS[op](value_of(a), value_of(b), width), width)
    if op in ("bvand", "bvor", "bvxor", "bvadd") and is_constant(a):
        a, b = b, a
    everything = (1 << width) - 1
    if is_constant(b):
        if value_of(b) == 0:
            return b if op in ("bvand", "bvmul") else a
        if value_of(b) == everything and op in ("bvand", "bvor"):
            return a if op == "bvand" else b
        if is_choice_of_constants(a):
            return through_choice(functools.partial(of_bits, op), a, b)
        if op in ("bvshl", "bvlshr") and value_of(b) < width:
            by = value_of(b)
            kept = extract(a, width - 1 - by, 0) if op == "bvshl" else extract(a, width - 1, by)
            parts = [kept, constant(0, by)] if op == "bvshl" else [constant(0, by), kept]
            return concat(*parts)
        if op == "bvand" and (value_of(b) & (value_of(b) + 1)) == 0:
            ones = value_of(b).bit_length()
            return concat(constant(0, width - ones), extract(a, ones - 1, 0))
    for mask, other in ((a, b), (b, a)):
        if op == "bvand" and is_choice_of_constants(mask):
            condition, yes, no = mask.arguments
            if {value_of(yes), value_of(no)} == {0, everything}:
                return choice(condition, of_bits(op, yes, other), of_bits(op, no, other))
    if a is b and op in ("bvxor", "bvsub"):
        return constant(0, width)
    return a if a is b and op in ("bvand", "bvor") else Term(op, [a, b], a.sort)


def compared(op, a, b):
    if a.sort == BOOL:
        return negation(choice(a, negation(b), b))
    if is_constant(a) and is_constant(b):
        return boolean(COMPARISONS[op](value_of(a), value_of(b), a.sort[1]))
    if a is b:
        return boolean(op in ("=", "bvule", "bvsle"))
    if is_constant(b) and is_choice_with_constant(a):
        return through_choice(functools.partial(compared, op), a, b)
    if is_constant(a) and is_choice_with_constant(b):
        return through_choice(lambda y, x: compared(op, x, y), b, a)
    if op == "=" and a.op == "bvor" and is_constant(b) and value_of(b) == 0:
        return conjunction(*(compared("=", part, b) for part in a.arguments))
    if op == "=" and a.op == "bvand" and is_constant(b) and value_of(b) + 1 == 1 << b.sort[1]:
        return conjunction(*(compared("=", part, b) for part in a.arguments))
    if op in ("bvult", "bvule") and b.op == "umax" and is_constant(a):
        return disjunction(*(compared(op, a, part) for part in b.arguments))
    if op in ("bvult", "bvule") and a.op == "umax" and is_constant(b):
        return conjunction(*(compared(op, part, b) for part in a.arguments))
    if op == "=" and a.op == "concat":
        return equal_parts(a, b)
    if op == "=" and b.op == "concat":
        return equal_parts(b, a)
    return Term(op, [a, b], BOOL)


def equal_parts(joined, other):
    found = []
    high = joined.sort[1]
    for part in joined.arguments:
        low = high - part.sort[1]
        found.append(compared("=", part, extract(other, high - 1, low)))
        high = low
    return conjunction(*found)


def concat(*parts):
    """The first part is the highest."""
    found = []
    for part in parts:
        for piece in part.arguments if part.op == "concat" else [part]:
            last = found[-1] if found else None
            if piece.sort[1] == 0:
                continue
            if last is not None and is_constant(last) and is_constant(piece):
                width = piece.sort[1]
                found[-1] = constant(value_of(last) << width | value_of(piece),
                                     last.sort[1] + width)
            elif last is not None and are_neighbours(last, piece):
                found[-1] = extract(last.arguments[0], last.arguments[1], piece.arguments[2])
            else:
                found.append(piece)
    if len(found) == 1:
        return found[0]
    return Term("concat", found, bits(sum(part.sort[1] for part in found)))


def are_neighbours(upper, lower):
    return (upper.op == lower.op == "extract" and upper.arguments[0] is lower.arguments[0]
            and upper.arguments[2] == lower.arguments[1] + 1)


def extract(a, high, low):
    width = high - low + 1
    if width == a.sort[1]:
        return a
    if width <= 0:
        return constant(0, 0)
    if is_constant(a):
        return constant(value_of(a) >> low, width)
    if a.op == "extract":
        return extract(a.arguments[0], a.arguments[2] + high, a.arguments[2] + low)
    if a.op == "concat":
        return extract_of_parts(a.arguments, high, low)
    if a.op in ("sign_extend", "zero_extend") and high < a.arguments[0].sort[1]:
        return extract(a.arguments[0], high, low)
    if a.op in ("bvand", "bvor", "bvxor"):
        return of_bits(a.op, *(extract(part, high, low) for part in a.arguments))
    if is_choice_with_constant(a):
        return through_choice(extract, a, high, low)
    return Term("extract", [a, high, low], bits(width))


def extract_of_parts(parts, high, low):
    found = []
    end = 0
    for part in reversed(parts):
        begin, end = end, end + part.sort[1]
        if begin <= high and low < end:
            found.insert(0, extract(part, min(high, end - 1) - begin, max(low, begin) - begin))
    return concat(*found)


def extended(op, a, width):
    by = width - width_of(a.sort)
    if a.sort == BOOL:
        return choice(a, constant(-1 if op == "sign_extend" else 1, width), constant(0, width))
    if op == "zero_extend" or (a.op == "concat" and is_constant(a.arguments[0])
                               and not value_of(a.arguments[0]) >> (a.arguments[0].sort[1] - 1)):
        return concat(constant(0, by), a)
    if is_constant(a):
        return constant(signed(value_of(a), a.sort[1]), width)
    if is_choice_of_constants(a):
        return through_choice(functools.partial(extended, op), a, width)
    return Term(op, [a], bits(width))


def truncated(a, width):
    if width == 1:
        return compared("=", extract(a, 0, 0), constant(1, 1))
    return extract(a, width - 1, 0)


def bit(condition):
    return choice(condition, constant(1, 1), constant(0, 1))


# ---- Reals


def real_sort(width):
    return {32: SINGLE, 64: DOUBLE}[width]


def from_bits(a):
    width = a.sort[1]
    sign = 1 << (width - 1)
    if a.op == "bits_of":
        return a.arguments[0]
    if a.op == "ite" and not is_choice_of_constants(a):
        condition, yes, no = a.arguments
        return choice(condition, from_bits(yes), from_bits(no))
    if a.op == "bvand" and is_constant(a.arguments[1]) and value_of(a.arguments[1]) == sign - 1:
        return magnitude(from_bits(a.arguments[0]))
    if a.op == "bvxor" and is_constant(a.arguments[1]) and value_of(a.arguments[1]) == sign:
        return negative(from_bits(a.arguments[0]))
    if a.op == "concat" and len(a.arguments) == 2 and a.arguments[0] is constant(0, 1):
        rest = a.arguments[1]
        if rest.op == "extract" and rest.arguments[0].sort[1] == width and rest.arguments[2] == 0:
            return magnitude(from_bits(rest.arguments[0]))
    return Term("from_bits", [a], real_sort(width))


def bits_of(a):
    if a.op == "from_bits":
        return a.arguments[0]
    return Term("bits_of", [a], bits(width_of(a.sort)))


def magnitude(a):
    if a.op == "fp.abs":
        return a
    return Term("fp.abs", [a.arguments[0] if a.op == "fp.neg" else a], a.sort)


def negative(a):
    if a.op == "fp.neg":
        return a.arguments[0]
    if a.op == "from_bits" and is_constant(a.arguments[0]):
        width = width_of(a.sort)
        return from_bits(constant(value_of(a.arguments[0]) ^ (1 << (width - 1)), width))
    return Term("fp.neg", [a], a.sort)


def rounded(op, *arguments):
    """minus, plus, times, over or fused."""
    if op == "plus" and arguments[1].op == "from_bits" and is_constant(arguments[1].arguments[0]) \
            and value_of(arguments[1].arguments[0]) >> (width_of(arguments[1].sort) - 1):
        return Term("minus", [arguments[0], negative(arguments[1])], arguments[0].sort)
    if op in ("times", "over"):
        number, factor = arguments
        if is_one(factor):
            return number
        if factor.op == "ite" and any(is_one(branch) for branch in factor.arguments[1:]):
            condition, yes, no = factor.arguments
            return choice(condition, rounded(op, number, yes), rounded(op, number, no))
    if op == "times" and is_power_above_one(arguments[1]):
        return Term("scaled", arguments, arguments[0].sort)
    return Term(op, arguments, arguments[0].sort)


def is_one(a):
    return (a.op == "from_bits" and is_constant(a.arguments[0])
            and value_of(a.arguments[0]) == ((1 << (a.sort[1] - 1)) - 1) << (a.sort[2] - 1))


def is_power_above_one(a):
    """Whether this is a constant power of two above 1."""
    if a.op != "from_bits" or not is_constant(a.arguments[0]):
        return False
    bias = (1 << (a.sort[1] - 1)) - 1
    exponent, rest = divmod(value_of(a.arguments[0]), 1 << (a.sort[2] - 1))
    return rest == 0 and bias < exponent <= 2 * bias


def converted(op, a, sort):
    return Term(op, [a], sort)


def signed_of_real(a, width):
    """The integer that is nearest towards zero."""
    return Term("fp.to_sbv", [a], bits(width))


def compared_reals(op, a, b):
    """fp.eq, fp.lt or fp.leq."""
    return Term(op, [a, b], BOOL)


def is_nan(a):
    return Term("fp.isNaN", [a], BOOL)


# ---- Printing

def sort_text(sort):
    if sort == BOOL:
        return BOOL
    if sort[0] == "bits":
        return f"(_ BitVec {sort[1]})"
    return f"(_ FloatingPoint {sort[1]} {sort[2]})"


def all_terms(roots):
    """Every term that these are made of, arguments before what is made of them."""
    found = {}
    waiting = [(root, False) for root in reversed(roots)]
    while waiting:
        term, is_done = waiting.pop()
        if term in found:
            continue
        if is_done:
            found[term] = None
            continue
        waiting.append((term, True))
        waiting += [(a, False) for a in term.arguments if isinstance(a, Term)]
    return list(found)


class Printer:
    """Writes the definitions of terms, each once; `name` then stands for a term."""

    def __init__(self, direction, swaps=False):
        self.direction = direction
        # Whether to say that the factors of a product, and the terms of a sum, may be swapped.
        self.swaps = swaps
        self.names = {}
        self.lines = []

    def name(self, term):
        for part in all_terms([term]):
            if part not in self.names:
                self.names[part] = self.defined(part)
        return self.names[term]

    def defined(self, term):
        if term.op == "variable":
            self.lines.append(f"(declare-const {term.arguments[0]} {sort_text(term.sort)})")
            return term.arguments[0]
        if is_constant(term):
            return self.text(term)
        name = f"t{len(self.names)}"
        if term.op == "bits_of":
            # Any bits of this real will do, so the claims hold for all of them.
            real = Term("from_bits", [variable(name, term.sort)], term.arguments[0].sort)
            self.lines.append(f"(declare-const {name} {sort_text(term.sort)})")
            self.names[real.arguments[0]] = name
            self.lines.append(f"(assert (= {self.text(real)} {self.names[term.arguments[0]]}))")
        else:
            self.lines.append(f"(define-fun {name} () {sort_text(term.sort)} {self.text(term)})")
            if self.swaps and term.op in ("times", "plus"):
                first, second = (self.names[a] for a in term.arguments)
                self.lines.append(f"(assert (= {name} ({term.op} {second} {first})))")
        return name

    def text(self, term):
        op, sort = term.op, term.sort
        names = [self.names[a] for a in term.arguments if isinstance(a, Term)]
        if op == "constant":
            return f"(_ bv{value_of(term)} {sort[1]})"
        if op == "boolean":
            return str(value_of(term)).lower()
        if op == "extract":
            return f"((_ extract {term.arguments[1]} {term.arguments[2]}) {names[0]})"
        if op in ("sign_extend", "zero_extend"):
            return f"((_ {op} {sort[1] - term.arguments[0].sort[1]}) {names[0]})"
        if sort[0] == "real" and op in ("from_bits", "real_of_signed", "real_of_unsigned",
                                        "real_of_real"):
            to = f"{'to_fp_unsigned' if op == 'real_of_unsigned' else 'to_fp'} {sort[1]} {sort[2]}"
            direction = "" if op == "from_bits" else f"{self.direction} "
            return f"((_ {to}) {direction}{names[0]})"
        if op == "fp.to_sbv":
            return f"((_ fp.to_sbv {sort[1]}) RTZ {names[0]})"
        if op == "umax":
            return f"(ite (bvult {names[0]} {names[1]}) {names[1]} {names[0]})"
        if op == "scaled":
            return f"(fp.mul {self.direction} {' '.join(names)})"
        if op == "fused":
            return self.fused(term)
        return f"({op} {' '.join(names)})"

    def fused(self, term):
        """One factor negated is a subtraction of the product."""
        a, b, c = term.arguments
        if (a.op == "fp.neg") == (b.op == "fp.neg"):
            return f"(fp.fma {self.direction} {self.names[a]} {self.names[b]} {self.names[c]})"
        positive = [part.arguments[0] if part.op == "fp.neg" else part for part in (a, b)]
        return f"(minus_product {self.names[c]} {self.names[positive[0]]} {self.names[positive[1]]})"
