"""Holds what compilers make of code.cpp, and the terms that are made of it, against each other.

Each function has a table of hard inputs. Every build has to give the same answers for all of it, in
each direction of rounding, and the terms of each module the same as these for a part of it.

`check` returns what is wrong, as lines of text, and how many answers were compared.
"""

import collections
import concurrent.futures
import functools
import itertools
import re

import numpy as np

import compiled
import evaluate
import terms as t
import translate

BUILDS = (("g++", "-O2"), ("clang++", "-O2"), ("clang++", "-O1"))

# ---- Hard numbers, as bits in arrays of NumPy


def real_numbers(dtype):
    limits = np.finfo(dtype)
    one = dtype.type(1)
    near_one = [np.nextafter(one, dtype.type(0)), one, np.nextafter(one, dtype.type(2))]
    least = [limits.smallest_subnormal, np.nextafter(limits.tiny, dtype.type(0)), limits.tiny]
    found = [0, *least, *near_one, 1.25, 5, 2**24 + 1, 2**53 + 1, 2**63, limits.max, np.inf]
    found = np.array(found, dtype)
    nans = np.array([1 << 22 | 0xff << 23, 1 << 31 | 1 << 22 | 0xff << 23, 0xff << 23 | 0x12345,
                     1 << 31 | 0xff << 23 | 1], np.uint32)
    if dtype.itemsize == 8:
        nans = np.array([0x7ff8 << 48, 0xfff8 << 48, 0x7ff0 << 48 | 0x12345, 0xfff0 << 48 | 1],
                        np.uint64)
    return np.concatenate([found, -found, nans.view(dtype)])


def integers(dtype):
    limits = np.iinfo(dtype)
    found = {0, 1, -1, 5, 1 << 63, (1 << 63) + 1025, (1 << 54) + 6}
    for width in (8, 16, 32, 64):
        found |= {(1 << width) - 1, (1 << (width - 1)) - 1, 1 << (width - 1), -(1 << (width - 1))}
    found |= {sign * ((1 << k) + 1) for sign in (1, -1) for k in (24, 53)}
    return np.array(sorted(n for n in found if limits.min <= n <= limits.max), dtype)


def numbers(type_):
    return real_numbers(type_.dtype) if type_.is_real else integers(type_.dtype)


# ---- Bounds: tolerances with what is remembered, and divisors

Bound = collections.namedtuple("Bound", "tol lasttol factor divisor")


@functools.lru_cache
def bounds(dtype):
    """Tolerances in doubles; the rest is of this type. First those that have a factor."""
    digits = np.finfo(dtype).nmant + 1
    found = []
    for tol in (10.5, digits - 0.5, 1.0, 7.0):
        factor = dtype.type(2.0 ** (tol - digits))
        divisor = 1 / factor * (1 + 8 * np.finfo(dtype).eps) + 1
        found.append(Bound(tol, dtype.type(tol), factor, dtype.type(divisor)))
    some = dtype.type(0.25)
    others = [0.25, 10.5, digits - 0.5, 1.0, 7.0, -1.0, 0.0, digits, digits + 1, np.inf, np.nan,
              1e-46, digits - 1e-8, np.nextafter(digits, 0), 5e-324]
    for k, tol in enumerate(others):
        # What is remembered need not be what the code would make of the tolerance.
        found.append(Bound(tol, dtype.type(np.nan if k % 5 == 4 else 0.75), some,
                           dtype.type((1, 2.5, np.inf, 3)[k % 4])))
    found.append(Bound(0.5, dtype.type(0.5), dtype.type(0.3), dtype.type(1 << 20)))
    return found


FACTORS = 4
# From one of these to the same tolerance without its factor.
FORGOTTEN = 5


def at_limits(values, bound, dtype):
    """Pairs for which a small difference decides, as reals of the type of comparison."""
    found = []
    for x in values:
        limits = [x - x * bound.factor, x / (1 - bound.factor), x / 2, x + x / (bound.divisor + 1),
                  x + x / bound.divisor]
        for y in limits:
            found += [(x, z) for z in (np.nextafter(y, dtype.type(0)), y,
                                       np.nextafter(y, dtype.type(np.inf)))]
    return found + [(y, x) for x, y in found] + [(-y, -x) for x, y in found[::2]]


# ---- Pairs of hard numbers: arrays of bits `x` and `y`, the nearest first, and their bounds


def converted(values, type_):
    """Those of the values, of any kind, that the type can hold."""
    limits = None if type_.is_real else np.iinfo(type_.dtype)
    for value in values:
        if limits is None:
            yield type_.dtype.type(value)
        elif value == value and abs(value) != np.inf and limits.min <= int(value) <= limits.max:
            yield type_.dtype.type(int(value))
        else:
            yield None


def near_pairs(x_type, y_type, real):
    """Numbers beside what comes next to them in the other type, and those at limits."""
    found = []
    for x in numbers(x_type).tolist():
        if y_type.is_real:
            y = y_type.dtype.type(x)
            near = [y, *(np.nextafter(y, y_type.dtype.type(to)) for to in (-np.inf, np.inf))]
        elif x != x or abs(x) == np.inf:
            continue
        else:
            bits = int(x) & ((1 << y_type.width) - 1)
            near = [int(x), int(x) - 1, int(x) + 1, bits, t.signed(bits, y_type.width)]
        found += [(None, x, y) for y in near]
    if real.kind == "f":
        limits = np.finfo(real)
        values = np.array([1, 1.25, 5, 100, 2**24 + 1, 7e30, limits.max, limits.tiny, 1e-39,
                           limits.smallest_subnormal], real)
        for k, bound in enumerate(bounds(real)[:FACTORS]):
            found += [(k, x, y) for x, y in at_limits(values, bound, real)]
    return found


@functools.lru_cache
def pairs(x_name, y_name):
    """Arrays of parts of both types and of places of bounds, -1 for any; and how many are near."""
    x_type, y_type = compiled.Type(x_name), compiled.Type(y_name)
    real = np.promote_types(x_type.dtype, y_type.dtype) if x_type.is_real and y_type.is_real else \
        x_type.dtype if x_type.is_real else y_type.dtype
    rows = {}
    with np.errstate(all="ignore"):
        for bound, x, y in near_pairs(x_type, y_type, real):
            (x,), (y,) = converted([x], x_type), converted([y], y_type)
            if x is not None and y is not None:
                rows[(-1 if bound is None else bound, x.tobytes(), y.tobytes())] = None
    near = len(rows)
    for x, y in itertools.product(numbers(x_type), numbers(y_type)):
        rows[(-1, x.tobytes(), y.tobytes())] = None
    places, xs, ys = zip(*rows)
    return (np.frombuffer(b"".join(xs), x_type.bits), np.frombuffer(b"".join(ys), y_type.bits),
            np.array(places), near)


# ---- Elements: arrays with a column for each part


def bits_of(value, type_):
    return np.array(value, type_.dtype).view(type_.bits)


def with_parts(type_, real, imaginary):
    return np.stack([real, imaginary], axis=1) if type_.parts == 2 else real[:, None]


@functools.lru_cache
def elements(x_name, y_name):
    """As `pairs`, of the parts of elements."""
    x_type, y_type = compiled.Type(x_name), compiled.Type(y_name)
    x, y, places, near = pairs(x_name, y_name)
    kinds = {x_type.parts, y_type.parts}
    zeros_x, zeros_y = (np.zeros(len(x), type_.bits) for type_ in (x_type, y_type))
    if kinds == {1}:
        return x[:, None], y[:, None], places, near
    if kinds == {2}:
        # The hard part is the real one, the imaginary one, or that beside two numbers that differ
        # so little that their test makes a factor, which it leaves to the other.
        ones_x, ones_y = zeros_x + bits_of(1, x_type), zeros_y + bits_of(1, y_type)
        near_one = np.where(np.arange(len(x)) % 3 == 2, ones_y - ones_y.dtype.type(1), ones_y)
        is_real = np.arange(len(x)) % 3 == 0
        return (with_parts(x_type, np.where(is_real, x, ones_x), np.where(is_real, ones_x, x)),
                with_parts(y_type, np.where(is_real, y, near_one), np.where(is_real, ones_y, y)),
                places, near)
    # One imaginary part, mostly zero. The hard ones stand beside equal real parts.
    complex_type = x_type if x_type.parts == 2 else y_type
    imaginary = real_numbers(complex_type.dtype).view(complex_type.bits)
    many = len(imaginary)
    reals = [np.concatenate([np.repeat(bits_of(7, type_), many), array])
             for type_, array in ((x_type, x), (y_type, y))]
    imaginary = np.concatenate([imaginary, np.zeros(len(x), complex_type.bits)])
    return (with_parts(x_type, reals[0], imaginary), with_parts(y_type, reals[1], imaginary),
            np.concatenate([np.repeat(-1, many), places]), near + many)


# ---- The table of a function

# Modes of the processor that take subnormal numbers for zero. Of what is proved, only the divisor
# asks for them, and it is made of other numbers.
FTZ, DAZ = 0x8000, 0x0040


def bound_arrays(signature, places):
    """The inputs that the bounds give; a row at any bound takes the next one."""
    real = signature.real if signature.real.kind == "f" else np.dtype(np.float64)
    known = bounds(real)
    count = len(known)
    chosen = np.where(places < 0, np.arange(len(places)) % count, places)
    found = {}
    with np.errstate(all="ignore"):
        if signature.bound == "tol":
            tolerances = np.array([bound.tol for bound in known])
            found["tol"] = tolerances.astype(signature.bound_type.dtype)
        elif signature.bound == "divisor":
            found["divisor"] = np.array([bound.divisor for bound in known], real)
    if signature.remembers:
        found["lasttol"] = np.array([bound.lasttol for bound in known], real)
        found["factor"] = np.array([bound.factor for bound in known], real)
    return {name: array.view(f"u{array.itemsize}")[chosen] for name, array in found.items()}


def table(signature):
    """The inputs of a function, and the number of those rows that have to be evaluated."""
    if signature.kind == "element_type":
        ids = [*range(-3, 20), 256 + 5, 1 << 20 | 3, -(1 << 31), (1 << 31) - 1]
        return {"x": np.array(ids, np.int32).view(np.uint32)[:, None]}, len(ids)
    if signature.x is None:
        places = np.arange(len(bounds(signature.real)))
        modes = np.array([0, FTZ, DAZ, FTZ | DAZ], np.uint32)
        found = bound_arrays(signature, np.tile(places, len(modes)))
        return {**found, "modes": np.repeat(modes, len(places))}, len(places) * len(modes)
    x, y, places, near = elements(signature.x.name, signature.y.name)
    if signature.kind == "compare_reals":
        count = len(bounds(signature.real))
        x, y = (np.repeat(array, count, axis=0) for array in (x, y))
        places, near = np.tile(np.arange(count), len(places)), len(x)
    elif signature.remembers:
        # Near ones with the factor remembered and not, and all at any bound.
        x, y = (np.concatenate([array[:near], array[:near], array]) for array in (x, y))
        own = places[:near]
        places = np.concatenate([own, np.where(own < 0, own, own + FORGOTTEN),
                                 np.repeat(-1, len(places))])
        near *= 2
    if signature.kind == "block":
        x, y, places = in_blocks(signature, x, y, places)
    return {**bound_arrays(signature, places), "x": x, "y": y}, near


def in_blocks(signature, x, y, places):
    """Each hard element in one place of a block, and then several."""
    count = signature.elements
    rows = np.resize(np.arange(len(x)), max(len(x), count))
    several = np.arange(0, len(x), max(1, len(x) // 24))
    all_rows = np.concatenate([rows, several, [0]])
    where = (np.arange(len(rows)) * 5 + len(signature.name)) % count
    alone = base_block(signature)
    blocks = []
    for base, hard in zip(alone, (x, y)):
        block = np.tile(base, (len(all_rows), 1, 1))
        block[np.arange(len(rows)), where] = hard[rows]
        for k, row in enumerate(several):
            step = (1, 2, 7, count - 1)[k % 4]
            for place in range(k % count, count, max(step, 1)):
                block[len(rows) + k, place] = hard[(row + place) % len(hard)]
        blocks.append(np.concatenate([block.reshape(len(all_rows), -1),
                                      np.tile(base.reshape(-1), (alone[1].size, 1))]))
    # Then one part after the other is certainly different.
    parts = np.arange(alone[1].size)
    blocks[1][len(all_rows) + parts, parts] = np.where(
        alone[1].reshape(-1) == 0, bits_of(1, signature.y), 0)
    return *blocks, np.concatenate([places[all_rows], np.repeat(-1, len(parts))])


def base_block(signature):
    """Elements that are certainly the same, small and different from each other."""
    values = 1 + np.arange(signature.elements) % 100
    return [with_parts(type_, values.astype(type_.dtype).view(type_.bits),
                       np.zeros(len(values), type_.bits)) for type_ in (signature.x, signature.y)]


# ---- The terms of a function

CACHE = "_ZZN4nesk22factor_cache_of_threadI{}EERNS_12factor_cacheIT_EEvE5cache"
# After one factor was remembered: the first slot is in use, and none is being written. The next one
# adds as much.
STATE = 8


def new_factor(path, tol):
    """Stands for the function that makes a factor and remembers it."""
    made = t.Term("new_factor", [tol], tol.sort)
    size = t.width_of(tol.sort) // 8
    cells = path.memory[CACHE.format("f" if size == 4 else "d")].cells
    cells[0] = t.of_bits("bvadd", cells[0], t.constant(STATE, 32))
    cells[size], cells[2 * size] = t.bits_of(tol), t.bits_of(made)
    return made


def cache_memory(real):
    size = real.itemsize
    cells = {0: t.variable("state", t.bits(32))}
    for k in range(4):
        cells[size + 2 * k * size] = t.variable(f"lasttol{k}", t.bits(8 * size))
        cells[size + (2 * k + 1) * size] = t.variable(f"factor{k}", t.bits(8 * size))
    return translate.Memory("cache", cells)


def memory(signature):
    found = {CACHE.format(letter): cache_memory(np.dtype(dtype))
             for letter, dtype in (("f", np.float32), ("d", np.float64))}
    for name in ("x", "y"):
        type_ = getattr(signature, name)
        if type_ is not None:
            count = signature.elements * type_.parts
            found[name] = translate.array_memory(name, type_.width, count)
    return found


def real_variable(name, type_):
    return t.from_bits(t.variable(name, t.bits(type_.width)))


def arguments(signature):
    found = [real_variable(signature.bound, signature.bound_type)] if signature.bound else []
    for name in ("x", "y"):
        type_ = getattr(signature, name)
        if type_ is None:
            continue
        if signature.kind == "compare_reals":
            found.append(real_variable(name, type_))
        elif signature.kind in ("compare_integers", "element_type"):
            found.append(t.variable(name, t.bits(type_.width)))
        else:
            found.append(translate.Pointer(name, t.constant(0, 64)))
    return found


def result_of(module, symbol, signature):
    """What a function gives, as a term."""
    translation = translate.Translation(module, {"new_factor": new_factor})
    return translation.outcome(symbol, arguments(signature), memory(signature))["result"]


# ---- Evaluation

CONTROL_WORDS = {"RNE": 0x1f80, "RTN": 0x3f80, "RTP": 0x5f80, "RTZ": 0x7f80}


def column(name, inputs, rows, direction, width):
    """The values of a variable in these rows."""
    name = re.sub(r"_read_\d+$", "", name)
    if name == "control_word":
        return (inputs["modes"][rows] | CONTROL_WORDS[direction]).tolist()
    fixed = STATE if name == "state" else None
    if fixed is None and re.match(r"(lasttol|factor)[123]$", name):
        fixed = 0
    if fixed is None and re.match(r"any\d+$", name):
        fixed = 0x5a5a5a5a5a5a5a5a & ((1 << width) - 1)
    if fixed is not None:
        return [fixed] * len(rows)
    if name in ("lasttol0", "factor0"):
        name = name[:-1]
    kind, place = re.match(r"([a-z]+)(\d*)$", name).groups()
    array = inputs[kind][rows]
    return (array[:, int(place or 0)] if array.ndim == 2 else array).tolist()


class Evaluations:
    """Evaluates results for a part of their tables, each row in one direction."""

    # Of the rows that are not near, one of so many is evaluated.
    PART = {"block": 9, "same": 4}
    NEAR_PART = {"block": 3, "same": 2}

    def __init__(self, code):
        self.code = code
        self.found = {direction: evaluate.Evaluation(direction, {
            "new_factor": functools.partial(self.factor_function, direction)})
            for direction in evaluate.DIRECTIONS}
        self.count = 0

    def factor_function(self, direction, term):
        """Asks the code, as the power of two with a fraction is that of the C library."""
        name = "factor_of<float>" if term.sort == t.SINGLE else "factor_of<double>"
        return lambda tol: self.code.call(name, direction, tol=tol)

    def rows_of(self, signature, count, near):
        part, near_part = self.PART.get(signature.kind, 1), self.NEAR_PART.get(signature.kind, 1)
        shift = len(signature.name)
        swept = signature.elements * signature.y.parts if signature.kind == "block" else 0
        return np.concatenate([np.arange(shift % near_part, near, near_part),
                               np.arange(near + shift % part, count - swept, part),
                               np.arange(count - swept, count)])

    def differing(self, signature, result, inputs, near, answers):
        """The rows where the answers are not what the term has for a value."""
        count = len(next(iter(inputs.values())))
        rows = self.rows_of(signature, count, near)
        found = []
        for k, (direction, evaluation) in enumerate(self.found.items()):
            here = rows[k::4] if signature.kind != "compare_reals" else rows
            values = evaluation.columns([result], lambda variable: column(
                variable.arguments[0], inputs, here, direction, t.width_of(variable.sort)),
                len(here))[0]
            values = canonical(np.array(values, np.uint64), result.sort)
            expected = canonical(answers[direction][here].astype(np.uint64), result.sort)
            self.count += len(here)
            found += [(direction, row, int(value), int(answer)) for row, value, answer in zip(
                here[values != expected], values[values != expected], expected[values != expected])]
        return found


def canonical(array, sort):
    """NaNs are alike."""
    if sort == t.BOOL or sort[0] != "real":
        return array
    of = evaluate.FORMATS[sort]
    return np.where(array & np.uint64(of.sign - 1) > of.infinity, np.uint64(of.nan), array)


# ---- Reports


def literal(bits, type_):
    """As C++ has it."""
    value = np.array(bits, type_.bits).view(type_.dtype)[()]
    if not type_.is_real:
        return str(value)
    if value != value:
        return f"the NaN {int(bits):#x}"
    return float(value).hex() + ("F" if type_.bytes == 4 else "")


def row_text(signature, inputs, row):
    real = compiled.Type(compiled.NAMES_OF_REALS.get(signature.real, "double"))
    found = []
    for name, array in inputs.items():
        if name == "modes":
            found.append(f"modes = {array[row]:#x}")
            continue
        if array.ndim == 1:
            type_ = signature.bound_type if name == "tol" else real
            found.append(f"{name} = {literal(array[row], type_)}")
            continue
        type_ = getattr(signature, name)
        usual = [None] * array.shape[1]
        if signature.kind == "block":
            usual = base_block(signature)["xy".index(name)].reshape(-1)
        found += [f"{name}[{place}] = {literal(bits, type_)}"
                  for place, bits in enumerate(array[row]) if bits != usual[place]]
    return ", ".join(found)


def report(signature, inputs, first, rows):
    direction, row, value1, value2 = rows[0]
    return (f"{signature.name}: {first} {value1:#x} and not {value2:#x} in {direction} for "
            f"{row_text(signature, inputs, row)} ({len(rows)} rows)")


# ---- The checks


def check_builds(signature, inputs, codes):
    """The answers of the first build by direction, and how others differ."""
    answers = {}
    differing = collections.defaultdict(list)
    gives_real = signature.kind in ("divisor_of", "factor_of")
    sort = t.real_sort(8 * signature.real.itemsize) if gives_real else t.BOOL
    for direction in evaluate.DIRECTIONS:
        first, *others = [canonical(code.answers(signature, inputs, direction), sort)
                          for code in codes]
        answers[direction] = first
        for code, other in zip(codes[1:], others):
            differing[code.label] += [(direction, row, int(other[row]), int(first[row]))
                                      for row in np.flatnonzero(other != first)]
    return answers, [report(signature, inputs, f"{label} gives", rows)
                     for label, rows in differing.items() if rows]


def check_terms(module, code, signature, inputs, near, answers, evaluations, done):
    try:
        result = result_of(module, code.symbols[signature.name], signature)
    except translate.Unknown as unknown:
        return [f"{signature.name}: {unknown}"]
    if result in done:
        return []
    done.add(result)
    differing = evaluations.differing(signature, result, inputs, near, answers)
    return [report(signature, inputs, "its term is", differing)] if differing else []


def all_codes(builds=BUILDS, included=()):
    with concurrent.futures.ThreadPoolExecutor() as pool:
        return list(pool.map(lambda build: compiled.Code(*build, included), builds))


def check(modules, codes=None, names=None):
    """`modules` are translate.Modules of code.cpp at different levels."""
    codes = codes or all_codes()
    evaluations = Evaluations(codes[0])
    wrong, count = [], 0
    for name in names or codes[0].names:
        signature = compiled.Signature(name)
        inputs, near = table(signature)
        answers, found = check_builds(signature, inputs, codes)
        wrong += found
        count += len(answers) * len(answers["RNE"]) * (len(codes) - 1)
        done = set()
        for module in modules if signature.kind != "factor_of" else ():
            wrong += check_terms(module, codes[0], signature, inputs, near, answers, evaluations,
                                 done)
    return wrong, count + evaluations.count


if __name__ == "__main__":
    compiled.end(*check([translate.Module(compiled.representation([level], "code.cpp"))
                         for level in ("-O1", "-O2")]))
