"""The values of terms for given values of their variables.

Everything is an integer: bits as they are, a boolean as 0 or 1, and a real as its bits. Arithmetic
on reals is done exactly on integers and rounded once, in one of the directions RNE, RTP, RTN and
RTZ. A NaN that comes out of anything is the same quiet one, whatever came in.

This has nothing in common with the code or the solver, so that agreement means something. `wrong`
holds it against the processor.
"""

import ctypes
import functools
import itertools

import compiled
import terms as t

DIRECTIONS = ("RNE", "RTP", "RTN", "RTZ")

# ---- Reals as significand * 2^exponent


class Format:
    """What follows from the two widths of a sort of reals."""

    def __init__(self, sort):
        _, exponent_bits, self.digits = sort
        self.width = exponent_bits + self.digits
        self.sign = 1 << (self.width - 1)
        self.least_exponent = 3 - (1 << (exponent_bits - 1)) - self.digits
        self.infinity = ((1 << exponent_bits) - 1) << (self.digits - 1)
        self.nan = self.infinity | 1 << (self.digits - 2)

    def is_nan(self, bits):
        return bits & ~self.sign > self.infinity

    def is_infinite(self, bits):
        return bits & ~self.sign == self.infinity

    def is_zero(self, bits):
        return bits & ~self.sign == 0

    def is_negative(self, bits):
        return bits & self.sign != 0

    def exact(self, bits):
        """A finite real as a pair of integers: significand, with the sign, and exponent."""
        magnitude = bits & ~self.sign
        steps = max(magnitude >> (self.digits - 1), 1) - 1
        significand = magnitude - (steps << (self.digits - 1))
        return -significand if bits & self.sign else significand, self.least_exponent + steps

    def signed_infinity(self, is_negative):
        return self.infinity | (self.sign if is_negative else 0)

    def signed_zero(self, is_negative):
        return self.sign if is_negative else 0


FORMATS = {sort: Format(sort) for sort in (t.SINGLE, t.DOUBLE)}


def rounded(to, direction, significand, exponent):
    """The bits of the real next to a number other than zero."""
    is_negative = significand < 0
    magnitude = abs(significand)
    unit = max(magnitude.bit_length() + exponent - to.digits, to.least_exponent)
    if exponent >= unit:
        kept, rest, half = magnitude << (exponent - unit), 0, 1
    else:
        kept = magnitude >> (unit - exponent)
        rest = magnitude - (kept << (unit - exponent))
        half = 1 << (unit - exponent - 1)
    if direction == "RNE":
        is_up = rest > half or (rest == half and kept % 2 == 1)
    else:
        is_up = rest != 0 and direction == ("RTN" if is_negative else "RTP")
    # A significand that has become too long by one digit adds one to the exponent.
    bits = ((unit - to.least_exponent) << (to.digits - 1)) + kept + is_up
    if bits >= to.infinity:
        is_beyond = direction in ("RNE", "RTN" if is_negative else "RTP")
        bits = to.infinity if is_beyond else to.infinity - 1
    return bits | (to.sign if is_negative else 0)


def rounded_sum(to, direction, first, second, are_negative):
    """Of two exact numbers, of which zeros have signs too."""
    exponent = min(first[1], second[1])
    total = (first[0] << (first[1] - exponent)) + (second[0] << (second[1] - exponent))
    if total != 0:
        return rounded(to, direction, total, exponent)
    # What cancels is a zero without a sign of its own.
    return to.signed_zero(are_negative[0] if are_negative[0] == are_negative[1]
                          else direction == "RTN")


# ---- Arithmetic


def plus(to, direction, a, b):
    if to.is_nan(a) or to.is_nan(b):
        return to.nan
    if to.is_infinite(a):
        return to.nan if to.is_infinite(b) and a != b else a
    if to.is_infinite(b):
        return b
    return rounded_sum(to, direction, to.exact(a), to.exact(b),
                       (to.is_negative(a), to.is_negative(b)))


def minus(to, direction, a, b):
    return to.nan if to.is_nan(b) else plus(to, direction, a, b ^ to.sign)


def is_undefined_product(to, a, b):
    return (to.is_nan(a) or to.is_nan(b) or (to.is_infinite(a) and to.is_zero(b))
            or (to.is_zero(a) and to.is_infinite(b)))


def exact_product(to, a, b):
    (first, first_exponent), (second, second_exponent) = to.exact(a), to.exact(b)
    return first * second, first_exponent + second_exponent


def times(to, direction, a, b):
    is_negative = to.is_negative(a) != to.is_negative(b)
    if is_undefined_product(to, a, b):
        return to.nan
    if to.is_infinite(a) or to.is_infinite(b):
        return to.signed_infinity(is_negative)
    if to.is_zero(a) or to.is_zero(b):
        return to.signed_zero(is_negative)
    return rounded(to, direction, *exact_product(to, a, b))


def over(to, direction, a, b):
    is_negative = to.is_negative(a) != to.is_negative(b)
    if to.is_nan(a) or to.is_nan(b) or (to.is_infinite(a) and to.is_infinite(b)) \
            or (to.is_zero(a) and to.is_zero(b)):
        return to.nan
    if to.is_infinite(a) or to.is_zero(b):
        return to.signed_infinity(is_negative)
    if to.is_zero(a) or to.is_infinite(b):
        return to.signed_zero(is_negative)
    (dividend, dividend_exponent), (divisor, divisor_exponent) = to.exact(a), to.exact(b)
    # More digits than any direction looks at, and one that says whether others follow.
    shift = to.digits + 3 + abs(divisor).bit_length()
    quotient, rest = divmod(abs(dividend) << shift, abs(divisor))
    quotient = 2 * quotient + (rest != 0)
    return rounded(to, direction, -quotient if is_negative else quotient,
                   dividend_exponent - divisor_exponent - shift - 1)


def fused(to, direction, a, b, c):
    is_negative = to.is_negative(a) != to.is_negative(b)
    if is_undefined_product(to, a, b) or to.is_nan(c):
        return to.nan
    if to.is_infinite(a) or to.is_infinite(b):
        product = to.signed_infinity(is_negative)
        return to.nan if to.is_infinite(c) and c != product else product
    if to.is_infinite(c):
        return c
    return rounded_sum(to, direction, exact_product(to, a, b), to.exact(c),
                       (is_negative, to.is_negative(c)))


def real_of_integer(to, direction, value):
    return rounded(to, direction, value, 0) if value else 0


def real_of_real(of, to, direction, a):
    if of.is_nan(a):
        return to.nan
    if of.is_infinite(a):
        return to.signed_infinity(of.is_negative(a))
    if of.is_zero(a):
        return to.signed_zero(of.is_negative(a))
    return rounded(to, direction, *of.exact(a))


# ---- Without rounding


def order(of, bits):
    """An integer that is ordered as the real is; zeros are equal."""
    return -(bits ^ of.sign) if bits & of.sign else bits


def equal(of, a, b):
    return not (of.is_nan(a) or of.is_nan(b)) and order(of, a) == order(of, b)


def less(of, a, b):
    return not (of.is_nan(a) or of.is_nan(b)) and order(of, a) < order(of, b)


def less_or_equal(of, a, b):
    return not (of.is_nan(a) or of.is_nan(b)) and order(of, a) <= order(of, b)


def magnitude(of, a):
    return of.nan if of.is_nan(a) else a & ~of.sign


def negative(of, a):
    return of.nan if of.is_nan(a) else a ^ of.sign


def of_bits(of, a):
    return of.nan if of.is_nan(a) else a


# ---- Terms

ARITHMETIC = {"plus": plus, "minus": minus, "times": times, "scaled": times, "over": over,
              "fused": fused}
REAL_FUNCTIONS = {"fp.abs": magnitude, "fp.neg": negative, "from_bits": of_bits}
REAL_COMPARISONS = {"fp.eq": equal, "fp.lt": less, "fp.leq": less_or_equal}


def joined(widths, *parts):
    value = 0
    for width, part in zip(widths, parts):
        value = value << width | part
    return value


def operation(term, direction):
    """The function that a term applies to the values of its arguments."""
    op = term.op
    of = term.arguments[0].sort
    everything = (1 << t.width_of(term.sort)) - 1
    if op in ARITHMETIC:
        return functools.partial(ARITHMETIC[op], FORMATS[term.sort], direction)
    if op in REAL_FUNCTIONS:
        return functools.partial(REAL_FUNCTIONS[op], FORMATS[term.sort])
    if op == "real_of_real":
        return functools.partial(real_of_real, FORMATS[of], FORMATS[term.sort], direction)
    if op == "real_of_unsigned":
        return functools.partial(real_of_integer, FORMATS[term.sort], direction)
    if op == "real_of_signed":
        return lambda a: real_of_integer(FORMATS[term.sort], direction, t.signed(a, of[1]))
    if of != t.BOOL and of[0] == "real":
        if op in REAL_COMPARISONS:
            return functools.partial(REAL_COMPARISONS[op], FORMATS[of])
        return {"fp.isNaN": FORMATS[of].is_nan, "bits_of": lambda a: a}[op]
    if op in t.OF_BITS:
        return lambda a, b: t.OF_BITS[op](a, b, of[1]) & everything
    if op in t.COMPARISONS:
        return lambda a, b: t.COMPARISONS[op](a, b, of[1])
    if op == "extract":
        return lambda a: a >> term.arguments[2] & everything
    if op == "sign_extend":
        return lambda a: t.signed(a, of[1]) & everything
    if op == "concat":
        return functools.partial(joined, [part.sort[1] for part in term.arguments])
    return {
        "not": lambda a: not a,
        "and": lambda *values: all(values),
        "or": lambda *values: any(values),
        "ite": lambda condition, yes, no: yes if condition else no,
    }[op]


class Known(dict):
    """The values of a function where it was asked for: few occur in a table, many times."""

    def __init__(self, function):
        super().__init__()
        self.function = function

    def __missing__(self, arguments):
        value = self[arguments] = int(self.function(*arguments))
        return value


class Evaluation:
    """The values of terms in one direction.

    `functions` makes the functions of terms with other operations, by their names.
    """

    def __init__(self, direction, functions=None):
        self.direction = direction
        self.functions = functions or {}
        self.known = {}

    def function_of(self, term):
        made = self.functions.get(term.op)
        return made(term) if made else operation(term, self.direction)

    def applied(self, term, columns):
        of = (a.sort if isinstance(a, t.Term) else a for a in term.arguments)
        key = (term.op, term.sort, *of)
        if key not in self.known:
            self.known[key] = Known(self.function_of(term))
        return list(map(self.known[key].__getitem__, zip(*columns)))

    def columns(self, roots, variables, rows):
        """For each root the list of its values; `variables` gives such a list for a variable."""
        found = {}
        for term in t.all_terms(roots):
            if term.op == "variable":
                found[term] = variables(term)
            elif t.is_constant(term):
                found[term] = [int(t.value_of(term))] * rows
            else:
                found[term] = self.applied(
                    term, [found[a] for a in term.arguments if isinstance(a, t.Term)])
        return [found[root] for root in roots]


def value(term, direction, **variables):
    """The value of one term; the variables are given by name."""
    return Evaluation(direction).columns(
        [term], lambda variable: [variables[variable.arguments[0]]], 1)[0][0]


# ---- Against the processor


def hard_reals(sort):
    """The bits of reals at which results change their kind."""
    of = FORMATS[sort]
    one = -of.least_exponent - of.digits + 2 << (of.digits - 1)
    found = [0, 1, 2, of.infinity // 2 & ~((1 << (of.digits - 1)) - 1), one - 1, one, one + 1,
             one + (1 << (of.digits - 2)), one + (1 << (of.digits - 1)), one + 0x234567,
             (1 << (of.digits - 1)) - 1, 1 << (of.digits - 1), (1 << (of.digits - 1)) + 1,
             of.infinity - 1, of.infinity - 2, of.infinity, of.nan, of.infinity + 1]
    return [bits | sign for bits in found for sign in (0, of.sign)]


def hard_integers(width):
    found = {0, 1, -1, 5, -7}
    for k in (7, 8, 15, 16, 24, 25, 31, 32, 53, 54, 62, 63, 64):
        found |= {(1 << k) + d for d in (-1, 0, 1)} | {-(1 << k) + d for d in (-1, 0, 1)}
    found |= {(1 << 24) + 3, (1 << 25) + 6, (1 << 54) + 6, (1 << 63) + (1 << 39), (1 << 63) + 1025}
    return sorted({number & ((1 << width) - 1) for number in found})


def cases():
    """Each function of processor.cpp, the term that it is, and a table of its arguments."""
    names = {t.SINGLE: "float", t.DOUBLE: "double"}
    for sort, name in names.items():
        a, b, c = (t.from_bits(t.variable(v, t.bits(t.width_of(sort)))) for v in "abc")
        reals = hard_reals(sort)
        for op in ("plus", "minus", "times", "over"):
            yield f"{op}_{name}", t.Term(op, [a, b], sort), list(itertools.product(reals, repeat=2))
        some = reals[::3]
        yield f"fused_{name}", t.Term("fused", [a, b, c], sort), list(
            itertools.product(reals, some, some))
        other = t.DOUBLE if sort == t.SINGLE else t.SINGLE
        near = [bits + d & 0xffffffffffffffff for single in hard_reals(t.SINGLE)
                for bits in [real_of_real(FORMATS[t.SINGLE], FORMATS[t.DOUBLE], "RNE", single)]
                for d in (-1, 0, 1, 1 << 28, (1 << 28) + 1, 3 << 28)]
        yield f"{names[other]}_of_{name}", t.converted("real_of_real", a, other), [
            (bits,) for bits in (reals if sort == t.SINGLE else reals + near)]
        for width in (32, 64):
            for is_signed in (True, False):
                op = "real_of_signed" if is_signed else "real_of_unsigned"
                integer = t.variable("a", t.bits(width))
                yield (f"{name}_of_{'int' if is_signed else 'uint'}{width}",
                       t.converted(op, integer, sort), [(bits,) for bits in hard_integers(width)])


def wrong():
    """How evaluation differs from the processor, and how many values were compared."""
    library = compiled.shared_library("g++", ["-O1", "-frounding-math"], "processor.cpp")
    found, count = [], 0
    for direction in DIRECTIONS:
        evaluation = Evaluation(direction)
        for name, term, rows in cases():
            columns = dict(zip("abc", zip(*rows)))
            mine = evaluation.columns([term], lambda v: columns[v.arguments[0]], len(rows))[0]
            theirs = processor_values(library, name, direction, rows, t.width_of(term.sort))
            for row, value1, value2 in zip(rows, mine, theirs):
                count += 1
                of = FORMATS[term.sort]
                if value1 != value2 and not (of.is_nan(value1) and of.is_nan(value2)):
                    values = ", ".join(f"{bits:#x}" for bits in row)
                    found.append(f"{name}({values}) {direction} is {value1:#x} here and {value2:#x}"
                                 " on the processor")
    return found, count


def processor_values(library, name, direction, rows, width):
    """The results are widened to 64 bits, and so are the arguments."""
    arguments = (ctypes.c_uint64 * (3 * len(rows)))(
        *(bits for row in rows for bits in (*row, 0, 0, 0)[:3]))
    results = (ctypes.c_uint64 * len(rows))()
    with compiled.rounding(direction):
        getattr(library, name)(arguments, results, ctypes.c_size_t(len(rows)))
    return [bits & ((1 << width) - 1) for bits in results]


if __name__ == "__main__":
    compiled.end(*wrong())
