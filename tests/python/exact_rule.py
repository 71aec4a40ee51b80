"""What a comparison has to find, written down naively and in exact arithmetic.

Nothing here is shared with the library, and nothing is fast. Numbers are Python's integers and
fractions; an answer that hangs on how the library rounds a fractional tolerance is `IN_DOUBT`.
"""

import decimal
import itertools
import math
from fractions import Fraction
from typing import NamedTuple, Optional, Tuple

import numpy as np

NEVER = 54  # stands for the digits of a pair that is the same under no tolerance
MOST_DIGITS = 53


class InDoubt(Exception):
    """The pair is so near the limit of a fractional tolerance that rounding decides."""


# ---- Types

def compared_type(dtype):
    """The element type as which the library compares a type that NumPy has."""
    native = np.dtype(dtype).newbyteorder("=")
    return {"?": np.dtype("u1"), "e": np.dtype("f4")}.get(native.char, native)


def is_integer(dtype):
    return dtype.kind in "iu"


def all_digits(type1, type2):
    """The binary digits of the reals that are compared; 53 for two integers, too."""
    both_integers = is_integer(type1) and is_integer(type2)
    return 53 if both_integers or {type1.char, type2.char} & set("dD") else 24


# ---- Elements

class Element(NamedTuple):
    parts: Tuple  # real and imaginary, as an int or a float each
    bits: Optional[Tuple]  # of both parts; None for integers


def bits_of_half(bits):
    """The bits of the single with the value of a half; a NaN keeps its significand."""
    sign, magnitude = (bits & 0x8000) << 16, bits & 0x7FFF
    if magnitude >= 0x7C00:
        return sign | 0x7F800000 | (magnitude & 0x3FF) << 13
    value = np.array([magnitude], "u2").view("f2").astype("f4")
    return sign | int(value.view("u4")[0])


def elements_of(array):
    """All elements in row-major order."""
    native = np.ascontiguousarray(array).reshape(-1)
    native = native.astype(native.dtype.newbyteorder("="))
    kind = native.dtype.kind
    if kind in "biu":
        return [Element((int(value), 0), None) for value in native]
    if native.dtype.char == "e":
        singles = [bits_of_half(int(bits)) for bits in native.view("u2")]
        native = np.array(singles, "u4").view("f4")
    part = native.dtype if kind == "f" else native.real.dtype
    reals = native.view(part).reshape(-1, 1 if kind == "f" else 2)
    bits = reals.view(f"u{part.itemsize}").tolist()
    with np.errstate(invalid="ignore"):
        values = reals.astype("f8").tolist()
    if kind == "f":
        return [Element((one[0], 0.0), (own[0], 0)) for one, own in zip(values, bits)]
    return [Element(tuple(both), tuple(own)) for both, own in zip(values, bits)]


def is_nan(part):
    return isinstance(part, float) and math.isnan(part)


def is_infinite(part):
    return isinstance(part, float) and math.isinf(part)


# ---- One pair

class Sameness(NamedTuple):
    at_zero: bool
    from_one: int  # the smallest whole tolerance from 1 on

    @property
    def digits(self):
        return 0 if self.at_zero else self.from_one


def rounded(integer, digits):
    """An integer to the nearest number with so many digits, to an even one if two are."""
    excess = abs(integer).bit_length() - digits
    if excess <= 0:
        return integer
    return round(Fraction(integer, 2**excess)) * 2**excess


def as_compared(part, digits):
    return rounded(part, digits) if isinstance(part, int) else part


def digits_of_part(x, y, digits):
    if is_nan(x) or is_nan(y):
        return NEVER if (x == 0 or y == 0 or x < 0 or y < 0) else digits
    if x == y:
        return 1
    if x == 0 or y == 0 or (x < 0) != (y < 0):
        return NEVER
    if is_infinite(x) or is_infinite(y):
        return digits
    x, y = abs(Fraction(x)), abs(Fraction(y))
    needed = 1
    while needed < digits and not abs(x - y) < max(x, y) * Fraction(2)**(needed - digits):
        needed += 1
    return needed


def sameness_of(one, other, type1, type2):
    if is_integer(type1) and is_integer(type2):
        equal = one.parts == other.parts
        return Sameness(equal, 1 if equal else NEVER)
    digits = all_digits(type1, type2)
    pairs = [(as_compared(x, digits), as_compared(y, digits))
             for x, y in zip(one.parts, other.parts)]
    same_bits = one.bits == other.bits if type1 == type2 else all(x == y for x, y in pairs)
    return Sameness(same_bits, max(digits_of_part(x, y, digits) for x, y in pairs))


def is_below_limit(x, y, digits, tolerance):
    """Whether two numbers of one sign differ by less than a fractional tolerance allows."""
    x, y = abs(Fraction(x)), abs(Fraction(y))
    larger = max(x, y)
    with decimal.localcontext() as context:
        context.prec = 60
        power = Fraction(decimal.Decimal(2)**(decimal.Decimal(tolerance) - digits))
    smallest = Fraction(2)**(-1074 if digits == 53 else -149)
    margin = 5 * Fraction(2)**-digits + smallest / larger
    limit = power * larger
    if abs(abs(x - y) - limit) <= margin * limit:
        raise InDoubt
    return abs(x - y) < limit


def is_same_under(tolerance, one, other, type1, type2):
    found = sameness_of(one, other, type1, type2)
    if is_integer(type1) and is_integer(type2):
        return found.at_zero
    if tolerance == 0:
        return found.at_zero
    digits = all_digits(type1, type2)
    pairs = [(as_compared(x, digits), as_compared(y, digits))
             for x, y in zip(one.parts, other.parts)]
    if digits == 24:
        with np.errstate(over="ignore", under="ignore"):
            tolerance = float(np.float32(tolerance))
    if tolerance <= 0:
        return all(x == y for x, y in pairs)
    if tolerance >= digits or tolerance == int(tolerance):
        return found.from_one <= min(tolerance, digits)
    return all(digits_of_part(x, y, digits) < digits + 1 and not is_nan(x) and not is_nan(y)
               and (x == y or not (is_infinite(x) or is_infinite(y))
                    and is_below_limit(x, y, digits, tolerance))
               for x, y in pairs)


def is_allowed(x, y, absolute, equal_nan):
    if is_nan(x) or is_nan(y):
        return equal_nan and is_nan(x) and is_nan(y)
    if absolute is None or is_infinite(x) or is_infinite(y):
        return False
    return abs(Fraction(x) - Fraction(y)) <= Fraction(absolute)


def without_allowed(one, other, absolute, equal_nan):
    """The pair that is compared: parts that are allowed to differ are zeros."""
    allowed = [is_allowed(x, y, absolute, equal_nan) for x, y in zip(one.parts, other.parts)]

    def cleared(element):
        parts = tuple(type(part)(0) if clear else part
                      for part, clear in zip(element.parts, allowed))
        bits = element.bits and tuple(0 if clear else own
                                      for own, clear in zip(element.bits, allowed))
        return Element(parts, bits)

    return cleared(one), cleared(other)


# ---- What is said of a pair

def number_text(value, single=False):
    """In the fewest digits that read back as the same value, and as few characters."""
    if isinstance(value, int):
        return str(value)
    if math.isinf(value):
        return "inf" if value > 0 else "-inf"
    sign = "-" if math.copysign(1, value) < 0 else ""
    if value == 0:
        return sign + "0"
    shortest = np.format_float_scientific((np.float32 if single else np.float64)(abs(value)),
                                          unique=True, trim="-")
    mantissa, exponent = shortest.split("e")
    exponent, figures = int(exponent), mantissa.replace(".", "")
    scientific = f"{mantissa}e{'-' if exponent < 0 else '+'}{abs(exponent):02}"
    if exponent < 0:
        fixed = "0." + "0" * (-exponent - 1) + figures
    elif len(figures) <= exponent + 1:
        fixed = str(int(abs(value)))
    else:
        fixed = figures[:exponent + 1] + "." + figures[exponent + 1:]
    return sign + min(fixed, scientific, key=len)


def value_text(element, dtype, as_doubles):
    def part_text(part, bits):
        if is_nan(part):
            return f"nan({bits:#x})"
        return number_text(part, dtype.char in "fF" and not as_doubles)

    if dtype.kind != "c":
        return part_text(element.parts[0], element.bits and element.bits[0])
    real, imaginary = map(part_text, element.parts, element.bits)
    return real + ("" if imaginary.startswith("-") else "+") + imaginary + "j"


def reason_of_parts(x, y):
    if is_nan(x) or is_nan(y):
        return "two NaNs" if is_nan(x) and is_nan(y) else "a NaN"
    if (x == 0) != (y == 0):
        return "zero is the same only as zero"
    return "opposite signs" if (x < 0) != (y < 0) else "no digit in common"


def reason_of(one, other, type1, type2, found):
    digits = all_digits(type1, type2)
    if found.at_zero and found.from_one > 1:
        return "NaNs of the same bits are the same under tol=0"
    if found.from_one < digits:
        return f"the same from tol={found.from_one} on"
    if is_integer(type1) and is_integer(type2):
        return "different integers"
    if "c" not in (type1.kind, type2.kind):
        return reason_of_parts(one.parts[0], other.parts[0])
    x, y = (as_compared(element.parts[0], digits) for element in (one, other))
    if digits_of_part(x, y, digits) >= digits:
        return "real parts: " + reason_of_parts(one.parts[0], other.parts[0])
    return "imaginary parts: " + reason_of_parts(one.parts[1], other.parts[1])


# ---- Whole arrays

def indices_of(shape, slices):
    """For each axis, the indices that are selected, in ascending order, or one index."""
    if slices is None:
        items = ()
    else:
        items = slices if isinstance(slices, tuple) else (slices,)
    missing = len(shape) - sum(item is not Ellipsis for item in items)
    if Ellipsis not in items:
        items += (Ellipsis,)
    position = items.index(Ellipsis)
    items = items[:position] + (slice(None),) * missing + items[position + 1:]
    return [sorted(range(extent)[item]) if isinstance(item, slice) else range(extent)[item]
            for extent, item in zip(shape, items)]


class Selected(NamedTuple):
    shape: Tuple
    indices: list  # in row-major order


def selected_of(shape, slices, squeeze):
    axes = indices_of(shape, slices)
    selected = tuple(len(axis) for axis in axes if isinstance(axis, list))
    if squeeze:
        selected = tuple(extent for extent in selected if extent != 1)
    ranges = [axis if isinstance(axis, list) else [axis] for axis in axes]
    return Selected(selected, list(itertools.product(*ranges)))


def is_fortran(array):
    return bool(array.flags.f_contiguous and not array.flags.c_contiguous)


def array_facts(name, array, selected):
    native = array.dtype.newbyteorder("=")
    return (name, compared_type(native).name, native.name, array.shape, selected.shape,
            is_fortran(array))


def value_counts(elements):
    return tuple(sum(any(test(part) for part in element.parts) for element in elements)
                 for test in (is_nan, is_infinite,
                              lambda part: isinstance(part, float) and part == 0
                              and math.copysign(1, part) < 0))


def to_double(fraction):
    try:
        return float(fraction)
    except OverflowError:
        return math.inf


def largest_differences(pairs):
    absolute = relative = 0.0
    for one, other in pairs:
        for x, y in zip(one.parts, other.parts):
            if is_nan(x) or is_nan(y) or x == y:
                continue
            if is_infinite(x) or is_infinite(y):
                return math.inf, math.inf
            difference = to_double(abs(Fraction(x) - Fraction(y)))
            absolute = max(absolute, difference)
            relative = max(relative, difference / max(abs(float(x)), abs(float(y))))
    return absolute, relative


def shape_text(shape):
    return str(tuple(shape))


class Place(NamedTuple):
    index: Tuple
    first: object
    second: object
    first_text: str
    second_text: str
    digits: Optional[int]
    reason: str

    @property
    def text(self):
        return (f"[{', '.join(map(str, self.index))}]: {self.first_text} and {self.second_text} "
                f"({self.reason})")


def python_value(element, dtype):
    return complex(*element.parts) if dtype.kind == "c" else element.parts[0]


def comparison_of(first, second, *, tol=0, relative=None, absolute=None, equal_nan=False,
                  strict_type=False, squeeze=False, slices=None, ignore=None, max_places=1,
                  names=("first", "second")):
    """All fields of the comparison of two arrays, by their names; None stands for the default."""
    type1, type2 = compared_type(first.dtype), compared_type(second.dtype)
    digits = all_digits(type1, type2)
    selected1 = selected_of(first.shape, slices, squeeze)
    selected2 = selected_of(second.shape, slices, squeeze)
    fields = {
        "difference": None,
        "first": array_facts(names[0], first, selected1),
        "second": array_facts(names[1], second, selected2),
        "tolerance": float(tol) if relative is None else digits + math.log2(relative),
        "places": (), "pairs": 0, "ignored": 0, "differing": 0, "worst": None,
        "largest_absolute_difference": 0.0, "largest_relative_difference": 0.0,
        "smallest_tolerance": None, "why_no_tolerance": None,
        "first_values": (0, 0, 0), "second_values": (0, 0, 0), "histogram": (),
    }
    if selected1.shape != selected2.shape:
        fields["difference"] = "shape"
        fields["why_no_tolerance"] = \
            f"shape {shape_text(selected1.shape)} and {shape_text(selected2.shape)}"
        return fields
    if strict_type and fields["first"][2] != fields["second"][2]:
        fields["difference"] = "type"
    take_elements(fields, first, second, selected1, selected2, ignore, absolute, bool(equal_nan),
                  max_places)
    return fields


def take_elements(fields, first, second, selected1, selected2, ignore, absolute, equal_nan,
                  max_places):
    type1, type2 = compared_type(first.dtype), compared_type(second.dtype)
    digits = all_digits(type1, type2)
    all1, all2 = elements_of(first), elements_of(second)
    numbers1, numbers2 = (np.arange(array.size).reshape(array.shape) for array in (first, second))
    pairs, found, places, differing = [], [], [], 0
    for index1, index2 in zip(selected1.indices, selected2.indices):
        if ignore is not None and ignore[index1]:
            fields["ignored"] += 1
            continue
        one, other = all1[numbers1[index1]], all2[numbers2[index2]]
        asked = without_allowed(one, other, absolute, equal_nan)
        sameness = sameness_of(*asked, type1, type2)
        pairs.append((one, other))
        found.append(sameness)
        place = Place(index1, python_value(one, type1), python_value(other, type2),
                      value_text(one, type1, type1 != type2),
                      value_text(other, type2, type1 != type2),
                      None if sameness.digits == NEVER else sameness.digits,
                      reason_of(*asked, type1, type2, sameness))
        if not is_same_under(fields["tolerance"], *asked, type1, type2):
            differing += 1
            places.append(place)
        worst_so_far = fields["worst"]
        if sameness.digits > (0 if worst_so_far is None else worst_so_far[0]):
            fields["worst"] = (sameness.digits, place)
    fields["worst"] = fields["worst"] and fields["worst"][1]
    fields.update(places=tuple(places[:max_places]), pairs=len(pairs), differing=differing,
                  first_values=value_counts([one for one, _ in pairs]),
                  second_values=value_counts([other for _, other in pairs]))
    fields["largest_absolute_difference"], fields["largest_relative_difference"] = \
        largest_differences(pairs)
    if differing and fields["difference"] is None:
        fields["difference"] = "elements"
    counts = [sameness.digits for sameness in found]
    fields["histogram"] = tuple((None if each == NEVER else each, counts.count(each))
                                for each in sorted(set(counts)))
    needed = max((sameness.from_one for sameness in found), default=1)
    if all(sameness.at_zero for sameness in found):
        fields["smallest_tolerance"] = 0
    elif needed < digits:
        fields["smallest_tolerance"] = needed
    elif max(counts) >= digits:
        fields["why_no_tolerance"] = fields["worst"].text
    else:
        fields["why_no_tolerance"] = "pairs of NaNs are the same under the tolerance 0 only"


# ---- The report

def line(name, value):
    return f"  {name:<22}{value}"


def facts_text(facts):
    _, kind, stored, shape, selected, fortran = facts
    return (stored + ("" if stored == kind else f" as {kind}") + f" {shape_text(shape)}"
            + ("" if selected == shape else f", of it {shape_text(selected)}")
            + (", Fortran order" if fortran else ""))


def difference_text(difference):
    return "infinite" if math.isinf(difference) else f"at most {number_text(difference)}"


def smallest_tolerance_text(fields):
    if fields["smallest_tolerance"] is not None:
        return f"tol={fields['smallest_tolerance']}"
    digits = all_digits(np.dtype(fields["first"][1]), np.dtype(fields["second"][1]))
    never = fields["histogram"][-1][0] is None
    return "none" + ("" if never else f" below all {digits} digits") \
        + f"; {fields['why_no_tolerance']}"


def digits_text(digits):
    return "more than all" if digits is None else str(digits)


def bars(histogram):
    most = max(pairs for _, pairs in histogram)
    width = len(str(most))
    room = 80 - 18 - width
    return [f"  {digits_text(digits):>13} {pairs:>{width}} "
            + "#" * max(1, int(pairs / most * room)) for digits, pairs in histogram]


def first_lines(fields):
    names = f"{fields['first'][0]} and {fields['second'][0]}"
    if fields["difference"] == "shape":
        return [f"{names} differ: {fields['why_no_tolerance']}"]
    if fields["difference"] == "type":
        return [f"{names} differ: type {fields['first'][2]} and {fields['second'][2]}"]
    if fields["difference"] == "elements":
        return [f"{names} differ: {place.text}" for place in fields["places"]]
    remark = "" if fields["pairs"] else \
        " (all pairs ignored)" if fields["ignored"] else " (no elements)"
    return [f"{names} are the same{remark}"]


def text_of(fields, relative=None, absolute=None, equal_nan=False, **_):
    """The report on a comparison with these fields."""
    lines = first_lines(fields)
    tolerance = number_text(fields["tolerance"]) + " binary digits"
    tolerance += "" if relative is None else f" (a relative error of {number_text(relative)})"
    tolerance += "" if absolute is None else \
        f", or an absolute error of {number_text(float(absolute))}"
    tolerance += "; NaNs are equal" if equal_nan else ""
    lines += [line("first array", facts_text(fields["first"])),
              line("second array", facts_text(fields["second"])), line("tolerance", tolerance)]
    if fields["difference"] == "shape":
        return "\n".join(lines)
    pairs = fields["pairs"]
    lines.append(line("pairs", pairs))
    if fields["ignored"]:
        lines.append(line("ignored", fields["ignored"]))
    if not pairs:
        return "\n".join(lines)
    share = f"{100 * float(fields['differing']) / float(pairs):.3g}"
    lines.append(line("differing", f"{fields['differing']} ({share} %)"))
    if fields["places"]:
        lines.append(line("first place", fields["places"][0].text))
    if fields["worst"]:
        lines.append(line("worst place", fields["worst"].text))
    lines.append(line("largest difference",
                      digits_text(fields["histogram"][-1][0]) + " binary digits"))
    lines.append(line("absolute difference",
                      difference_text(fields["largest_absolute_difference"])))
    lines.append(line("relative difference",
                      difference_text(fields["largest_relative_difference"])))
    lines.append(line("smallest tolerance", smallest_tolerance_text(fields)))
    for name, first, second in zip(("NaNs", "infinities", "negative zeros"),
                                   fields["first_values"], fields["second_values"]):
        lines.append(line(name, f"{first} and {second}"))
    return "\n".join(lines + ["  digits that differ, number of pairs"] + bars(fields["histogram"]))
