#!/usr/bin/env python3
"""Compares files that NumPy writes, and checks talcmp's answers by NumPy's and by a rule that is
written here in exact arithmetic.

Draws a new seed in every run and prints it; the environment variable TALNUMERICARRAY_SEED sets it,
and TALNUMERICARRAY_ROUNDS how often each kind of array is drawn.
"""

import collections
import fractions
import glob
import itertools
import math
import os
import random
import subprocess
import sys
import zipfile

import numpy as np

from support.talcmp_command import (EMULATED, Folder, document_of, read_bytes, run, run_tests, some,
                                    summary)

SEED = int(os.environ.get("TALNUMERICARRAY_SEED", random.randrange(2**32)))
TYPES = [np.dtype(name) for name in
         "i1 u1 i2 u2 i4 u4 i8 u8 f4 f8 c8 c16".split()]
NEVER = 54  # digits of a pair that is the same under no tolerance
# Emulation is slow.
ROUNDS = int(os.environ.get("TALNUMERICARRAY_ROUNDS", 1 if EMULATED else 2))
print(f"seed {SEED}", file=sys.stderr)


# ---- The rule, for one pair

def compared_type(x, y):
    """The type of real in which numbers or arrays are compared; None for two integers."""
    if x.dtype.kind in "iu" and y.dtype.kind in "iu":
        return None
    return np.float64 if {x.dtype.char, y.dtype.char} & set("dD") else np.float32


def all_digits(real):
    """The binary digits of a type of real."""
    return np.finfo(real).nmant + 1


def parts(x, y):
    """The pairs of the real and of the imaginary parts; a real has the imaginary part 0."""
    real = compared_type(x, y)
    return [(real(x.real), real(y.real)), (real(x.imag), real(y.imag))]


def part_digits(x, y):
    """The smallest whole tolerance from 1 on under which two reals of one type are the same."""
    bits = all_digits(type(x))
    if x == y:
        return 1
    if x == 0 or y == 0 or (x < 0) != (y < 0):
        return NEVER
    if not (np.isfinite(x) and np.isfinite(y)):
        return bits
    with np.errstate(over="ignore"):
        difference = abs(x - y)
    larger = max(abs(x), abs(y))
    if difference == larger:
        return bits
    quotient = fractions.Fraction(float(difference)) / fractions.Fraction(float(larger))
    digits = 1
    while not quotient < fractions.Fraction(2) ** (digits - bits):
        digits += 1
    return digits


def smallest_tolerance(x, y):
    if compared_type(x, y) is None:
        return 1 if int(x) == int(y) else NEVER
    return max(part_digits(one, other) for one, other in parts(x, y))


def equal_by_value(x, y):
    if compared_type(x, y) is None:
        return int(x) == int(y)
    return all(one == other for one, other in parts(x, y))


def digits_of(x, y):
    same = x.tobytes() == y.tobytes() if x.dtype == y.dtype else equal_by_value(x, y)
    return 0 if same else smallest_tolerance(x, y)


def same_under(tolerance, x, y):
    """Whether a pair with a real is the same under a tolerance, which is not 0 and may be a
    fraction."""
    if tolerance < 0:
        return equal_by_value(x, y)
    smallest = smallest_tolerance(x, y)
    if smallest == NEVER or tolerance <= smallest - 1 or tolerance >= smallest:
        return smallest != NEVER and smallest <= tolerance
    factor = 2.0 ** (tolerance - all_digits(compared_type(x, y)))
    pairs = [(float(one), float(other)) for one, other in parts(x, y)]
    return all(one == other or abs(one - other) < max(abs(one), abs(other)) * factor
               for one, other in pairs)


# ---- Arrays

def largest_differences(pairs):
    """The largest absolute and relative differences of parts; NaNs have none."""
    absolute = relative = 0.0
    for x, y in pairs:
        for one, other in ((x.real, y.real), (x.imag, y.imag)):
            one, other = one.item(), other.item()
            if math.isnan(one) or math.isnan(other) or one == other:
                continue
            if math.isinf(one) or math.isinf(other):
                return np.inf, np.inf
            exact = abs(fractions.Fraction(one) - fractions.Fraction(other))
            try:
                difference = float(exact)
            except OverflowError:
                return np.inf, np.inf
            absolute = max(absolute, difference)
            relative = max(relative, difference / max(abs(float(one)), abs(float(other))))
    return absolute, relative


def random_values(rng, dtype, shape):
    if dtype.kind in "iu":
        info = np.iinfo(dtype)
        return rng.integers(info.min, info.max, size=shape, dtype=dtype, endpoint=True)
    values = np.zeros(shape, dtype=dtype)
    special = np.array([0.0, -0.0, np.nan, np.inf, -np.inf, 1, -1, 2, 0.5])
    for part in (values.real, values.imag)[:2 if dtype.kind == "c" else 1]:
        part[...] = rng.standard_normal(shape) * 2.0 ** rng.integers(-40, 40, size=shape)
        part[...] = np.where(rng.random(shape) < 0.1, rng.choice(special, size=shape), part)
    return values


def near_values(rng, values):
    """Values of the same type, most of them equal or a few digits away."""
    other = values.copy()
    if values.dtype.kind in "iu":
        changed = rng.random(values.shape) < 0.1
        other[changed] ^= values.dtype.type(1)
        return other
    with np.errstate(all="ignore"):
        noise = 1 + rng.standard_normal(values.shape) * 2.0 ** rng.integers(-60, 0,
                                                                            size=values.shape)
        near = np.asarray(values * noise, dtype=values.dtype)
    changed = rng.random(values.shape) < 0.5
    other[changed] = near[changed]
    opposite = rng.random(values.shape) < 0.02
    other[opposite] = -other[opposite]
    return other


def stored(rng, values):
    """The same array in another order or byte order."""
    order = rng.choice(["C", "F"])
    swapped = values.dtype.newbyteorder() if rng.random() < 0.3 else values.dtype
    return np.array(values, dtype=swapped, order=order)


def is_negative_zero(values):
    return (values == 0) & np.signbit(values)


def count_special(values):
    """As talcmp counts them: a complex number is one if either part is."""
    return {name: int(np.sum(test(values.real) | test(values.imag)))
            for name, test in (("nans", np.isnan), ("infinities", np.isinf),
                               ("negative_zeros", is_negative_zero))}


SHAPES = [(), (1,), (7,), (0,), (3, 0, 2), (2, 3), (5, 1, 4), (2, 3, 4, 5), (40, 30), (1, 1000)]


def note_of(arguments):
    """What is said of a tolerance that may be meant as an error."""
    for argument in map(str, arguments):
        text = argument[len("--tol="):] if argument.startswith("--tol=") else "0"
        if 0 < float(text) < 1:
            return (f"talcmp: note: --tol {text} means {text} binary digits; a relative error is "
                    f"--relative {text}\n")
    return ""


class NumpyFiles(Folder):
    def setUp(self):
        super().setUp()
        self.rng = np.random.default_rng(SEED)

    def only_comparison(self, *arguments):
        status, output, errors = run("--json", *arguments)
        document = document_of(output)
        self.assertEqual((document["exit_status"], errors), (status, note_of(arguments)))
        self.assertEqual(len(document["comparisons"]), 1)
        return document["comparisons"][0]


# ---- One file and another

class EveryTypeAndShape(NumpyFiles):
    def check(self, ours, theirs, options=(), slices=Ellipsis, types=None):
        """`types` are those that the arrays are stored as, if not as they are."""
        type1, type2 = types or (ours.dtype, theirs.dtype)
        a = self.save("a.npy", stored(self.rng, ours.astype(type1)))
        b = self.save("b.npy", stored(self.rng, theirs.astype(type2)))
        found = self.only_comparison("-n", 10000, *options, a, b)
        indices = [list(index) for index in np.ndindex(ours.shape)]
        places = np.arange(ours.size).reshape(ours.shape)
        # In row-major order, whatever the sign of the steps is.
        chosen_places = np.sort(np.ravel(places[slices]))
        chosen = [indices[place] for place in chosen_places]
        part1, part2 = np.ravel(ours)[chosen_places], np.ravel(theirs)[chosen_places]
        pairs = list(zip(part1, part2))
        digits = [digits_of(x, y) for x, y in pairs]
        printed = [None if digit == NEVER else digit for digit in digits]
        expected = [place for place in zip(chosen, printed) if place[1] != 0]
        self.assertEqual([(place["index"], place["digits"]) for place in found["differences"]],
                         expected)
        self.assertEqual([found[side]["stored_type"] for side in ("first", "second")],
                         [np.dtype(each).name for each in (type1, type2)])
        report = found["report"]
        self.assertEqual(report["pairs"], len(digits))
        largest = largest_differences(pairs)
        self.assertEqual(float(report["largest_absolute_difference"]), largest[0])
        self.assertEqual(float(report["largest_relative_difference"]), largest[1])
        self.assertEqual(report["differing"], len(expected))
        self.assertEqual({bar["digits"]: bar["pairs"] for bar in report["histogram"]},
                         collections.Counter(printed))
        smallest = max(smallest_tolerance(x, y) for x, y in pairs) if expected else 0
        real = compared_type(ours, theirs)
        none = smallest >= (all_digits(real) if real else NEVER)
        self.assertEqual(report["smallest_tolerance"], None if none else smallest)
        self.assertEqual(report["why_no_tolerance"] is None, not none)
        if expected:
            worst = chosen[digits.index(max(digits))]
            self.assertEqual(report["worst"]["index"], worst)
        self.assertEqual(report["first_values"], count_special(part1))
        self.assertEqual(report["second_values"], count_special(part2))

    def test_one_type(self):
        for dtype, shape in some(self.rng, itertools.product(TYPES, SHAPES * ROUNDS)):
            with self.subTest(dtype=dtype, shape=shape, seed=SEED):
                values = random_values(self.rng, dtype, shape)
                self.check(values, near_values(self.rng, values))

    def test_two_types(self):
        for type1, type2 in some(self.rng, itertools.product(TYPES, TYPES)):
            with self.subTest(type1=type1, type2=type2, seed=SEED):
                with np.errstate(all="ignore"):
                    ours = (np.arange(-3, 60).astype(type1) if type1.kind in "iu"
                            else random_values(self.rng, type1, (63,)))
                    theirs = (ours.real if type2.kind != "c" else ours).astype(type2)
                self.check(ours, near_values(self.rng, theirs))

    def test_tolerances(self):
        for type1, type2 in ("f8", "f8"), ("f4", "f4"), ("c16", "c8"), ("f8", "f4"), ("i4", "f4"):
            type1, type2 = np.dtype(type1), np.dtype(type2)
            with np.errstate(all="ignore"):
                ours = random_values(self.rng, type1, (500,))
                theirs = near_values(self.rng, ours.astype(type2))
            a, b = self.save("a.npy", ours), self.save("b.npy", theirs)
            for tolerance in (-1, 1e-300, 0.5, 1, 2.5, 10, 20.75, 23.5, 24, 30.25, 52.5, 53, 1e300):
                with self.subTest(types=(type1, type2), tolerance=tolerance, seed=SEED):
                    expected = [[i] for i, (x, y) in enumerate(zip(ours, theirs))
                                if not same_under(tolerance, x, y)]
                    options = (f"--tol={tolerance}", "-n", 1000)
                    found = self.only_comparison(*options, a, b)
                    self.assertEqual([place["index"] for place in found["differences"]], expected)
                    self.assertEqual(found["report"]["differing"], len(expected))
                    status, output, _ = run(*options, a, b)
                    self.assertEqual((status, len(output.splitlines())),
                                     (1 if expected else 0, len(expected)))

    def test_booleans_and_halves(self):
        booleans = self.rng.random(1000) < 0.5
        halves = np.arange(0x10000, dtype="u2").view("f2")
        with np.errstate(invalid="ignore"):
            # Of signalling NaNs, NumPy's conversion sets a bit.
            singles = halves[~(np.isnan(halves) & (halves.view("u2") & 0x200 == 0))].astype("f4")
        for ours, type1 in ((booleans.astype("u1"), "?"), (singles, "f2")):
            for theirs, type2 in ((ours, type1), (ours, ours.dtype), (ours.astype("f8"), "f8")):
                with self.subTest(types=(type1, type2), seed=SEED):
                    self.check(ours, theirs, types=(type1, type2))
        other = booleans ^ (self.rng.random(1000) < 0.1)
        self.check(booleans.astype("u1"), other.astype("u1"), types=("?", "?"))
        self.check(booleans.astype("u1"), other.astype("i8"), types=("?", "i8"))
        a = self.save("a.npy", booleans)
        b = self.write("b.npy", read_bytes(a).replace(b"\x01", b"\xff").replace(b"Y\xff", b"Y\x01"))
        self.expect(0, "", "", a, b)
        self.expect(1, f"{a} {a}.u1 differ: type bool and uint8\n", "", "--strict-type", a,
                    self.save_as(f"{a}.u1", booleans.astype("u1")))

    def test_halves_of_every_bits(self):
        """Every half is the single of the same value, and every NaN keeps its bits."""
        bits = np.arange(0x10000, dtype="u4")
        with np.errstate(invalid="ignore"):
            singles = bits.astype("u2").view("f2").astype("f4").view("u4")
        nans = (bits & 0x7FFF) > 0x7C00
        expected = np.where(nans, (bits & 0x8000) << 16 | 0x7F800000 | (bits & 0x3FF) << 13, singles)
        a = self.save("a.npy", bits.astype("u2").view("f2"))
        b = self.save("b.npy", expected.astype("u4").view("f4"))
        self.expect(0, "", "", a, b)

    def test_slices(self):
        for _ in range(15 * ROUNDS):
            shape = tuple(self.rng.integers(1, 9, size=self.rng.integers(1, 5)))
            values = random_values(self.rng, np.dtype(self.rng.choice(["f8", "i2", "c8"])), shape)
            texts, slices = [], []
            first = self.rng.integers(1, len(shape) + 1)
            last = self.rng.integers(0, len(shape) - first + 1)
            for dimension in shape[:first] + shape[len(shape) - last:]:
                if self.rng.random() < 0.3:
                    slices.append(self.rng.integers(-dimension, dimension))
                    texts.append(str(slices[-1]))
                else:
                    start, stop = self.rng.integers(-dimension - 2, dimension + 3, size=2)
                    step = self.rng.choice([-3, -2, -1, 1, 2, 3])
                    start, stop = (None if self.rng.random() < 0.2 else end for end in (start, stop))
                    slices.append(slice(start, stop, step))
                    texts.append(":".join("" if part is None else str(part)
                                          for part in (start, stop, step)))
            if last != 0 or self.rng.random() < 0.3:
                slices.insert(first, Ellipsis)
                texts.insert(first, "...")
            with self.subTest(shape=shape, texts=texts, seed=SEED):
                self.check(values, near_values(self.rng, values),
                           ["--slice=" + ",".join(texts)], tuple(slices))


class LargeArrays(NumpyFiles):
    """Arrays of several pieces, which are read in all orders and by several threads."""

    def check_places(self, ours, theirs, different, *options):
        a, b = self.save("a.npy", ours), self.save("b.npy", theirs)
        expected = [list(map(int, place)) for place in np.argwhere(different)]
        for threads in (1, 2, 5):
            found = self.only_comparison("-n", 100, "--threads", threads, *options, a, b)
            self.assertEqual([place["index"] for place in found["differences"]], expected[:100])
            self.assertEqual(found["report"]["differing"], len(expected))
            if expected and ours.dtype.kind == "i":
                self.assertEqual(found["report"]["worst"]["index"], expected[0])
            status, output, _ = run("--threads", threads, *options, a, b)
            self.assertEqual(status, 1 if expected else 0)
            self.assertIn(f"differ: {expected[0]}:" if expected else "", output)

    def test_orders(self):
        for shape in [(1100, 700), (3, 700, 300), (130, 2, 3, 400), (1000000,)]:
            for order1, order2 in ["CC", "CF", "FC", "FF"]:
                with self.subTest(shape=shape, orders=order1 + order2, seed=SEED):
                    ours = self.rng.integers(0, 100, size=shape, dtype="i4")
                    different = self.rng.random(shape) < self.rng.choice([0, 1e-5, 1e-3])
                    self.check_places(np.array(ours, order=order1),
                                      np.array(ours + different, order=order2), different)

    def test_slices_of_large_arrays(self):
        shape = (600, 40, 50)
        ours = self.rng.standard_normal(shape)
        theirs = ours.copy(order="F")
        theirs[::7, 3, ::11] += 1
        for text, part in [("::2", np.s_[::2]), (":,3", np.s_[:, 3]), ("5", np.s_[5]),
                           (":,:,::11", np.s_[:, :, ::11]), ("-1:,2:5,3", np.s_[-1:, 2:5, 3])]:
            with self.subTest(slice=text):
                chosen = np.zeros(shape, dtype=bool)
                chosen[part] = True
                self.check_places(ours, theirs, chosen & (ours != theirs), "--slice=" + text)

    def test_nans_that_are_the_same_bit_by_bit(self):
        ours = np.ones(300000)
        ours[0] = np.nan
        a = self.save("a.npy", ours)
        self.assertEqual(self.only_comparison(a, a)["report"]["smallest_tolerance"], 0)
        self.assertEqual(self.only_comparison("--tol=1", a, a)["differences"][0]["index"], [0])
        ours[299999] += 2.0**-52
        b = self.save("b.npy", ours)
        report = self.only_comparison(a, b)["report"]
        self.assertEqual((report["differing"], report["smallest_tolerance"]), (1, None))
        self.assertEqual(report["why_no_tolerance"],
                         "pairs of NaNs are the same under the tolerance 0 only")
        self.assertEqual(self.only_comparison("--tol=1", a, b)["report"]["differing"], 1)

    def test_tolerance_that_depends_on_order(self):
        ours = np.ones(300000)
        for position in (0, 5, 299999):
            theirs = ours.copy()
            theirs[position] = 2.5
            a, b = self.save("a.npy", ours), self.save("b.npy", theirs)
            for threads in (1, 3):
                self.expect(0, "", "", "--tol=52.5", "--threads", threads, a, b)


class StandardInput(NumpyFiles):
    def test_either_operand(self):
        for ours, difference in (
                (np.arange(300000.0), "[3]: 3 and 5 (the same from --tol 52 on)"),
                (np.arange(12).reshape(3, 4), "[0, 3]: 3 and 5 (different integers)"),
                (np.array(3), "[]: 3 and 5 (different integers)")):
            path = self.save("a.npy", ours)
            contents = read_bytes(path)
            self.expect(0, "", "", "-", path, input=contents)
            self.expect(0, "", "", path, "-", input=contents)
            other = self.save("b.npy", np.where(ours == 3, 5, ours))
            self.expect(1, f"- {other} differ: {difference}\n", "", "-", other, input=contents)

    def test_other_order_and_slices(self):
        ours = self.rng.standard_normal((300, 400))
        path = self.save("a.npy", np.asfortranarray(ours))
        ours[7, 9] = 0
        contents = read_bytes(self.save("b.npy", ours))
        self.assertIn("differ: [7, 9]: ", run("-", path, input=contents)[1])
        self.expect(0, "", "", "-", path, "--slice", "::2", input=contents)
        self.assertEqual(run("-", path, "--slice", ":,9", input=contents)[0], 1)

    def test_part_after_what_is_skipped(self):
        ours = np.arange(100000.0)
        path = self.save("a.npy", ours)
        ours[99990] = 0
        contents = read_bytes(self.save("b.npy", ours))
        self.expect(1, f"- {path} differ: [99990]: 0 and 99990 (zero is the same only as zero)\n",
                    "", "-", path, "--slice=99980:99995", input=contents)
        self.expect(0, "", "", "-", path, "--slice=99991:", input=contents)

    def test_named_pipes(self):
        path = self.save("a.npy", np.arange(300000.0))
        other = self.save("b.npy", np.where(np.arange(300000) == 3, 5, np.arange(300000.0)))
        pipe = self.path("pipe")
        os.mkfifo(pipe)
        difference = f"{other} {pipe} differ: [3]: 5 and 3 (the same from --tol 52 on)\n"
        for operands, output in ((pipe, path), ""), ((other, pipe), difference):
            writer = subprocess.Popen(["sh", "-c", 'exec cat "$1" >"$2"', "sh", path, pipe],
                                      stderr=subprocess.DEVNULL)
            self.addCleanup(writer.wait)
            self.addCleanup(writer.kill)
            self.expect(1 if output else 0, output, "", *operands)


class Archives(NumpyFiles):
    def test_same(self):
        arrays = {"x": np.arange(200000.0), "y": np.zeros((3, 4), order="F"), "z": np.array(1)}
        uncompressed = self.save_archive("a.npz", **arrays)
        compressed = self.save_archive("b.npz", np.savez_compressed, **arrays)
        self.expect(0, summary(same=3), "", uncompressed, compressed)
        self.expect(0, summary(same=3), "", compressed, compressed)
        self.expect(0, "".join(f"{compressed}[{name}] {compressed}[{name}] are the same\n"
                               for name in "xyz") + summary(same=3), "", "-v", compressed,
                    compressed)

    def test_members_that_differ(self):
        a = self.save_archive("a.npz", x=np.arange(5), y=np.zeros(2), only_a=np.zeros(1))
        b = self.save_archive("b.npz", np.savez_compressed, x=np.arange(5) + [0, 0, 1, 0, 0],
                              y=np.zeros((2, 1), dtype="f4"), only_b=np.zeros(1))
        only_a = f"{a} {b} differ: only in {a}: only_a\n"
        only_b = f"{a} {b} differ: only in {b}: only_b\n"
        x = f"{a}[x] {b}[x] differ: [2]: 2 and 3 (different integers)\n"
        y = f"{a}[y] {b}[y] differ: shape (2,) and (2, 1)\n"
        self.expect(1, only_a + only_b + x + y
                    + summary(different=2, only_in_first=1, only_in_second=1), "", a, b)
        one = summary(different=1)
        self.expect(1, x + one, "", a, b, "--include", "x")
        self.expect(1, x + one, "", "--include", "z", "--include", "x", a, b)
        self.expect(1, x + y + summary(different=2), "", a, b, "--exclude", "only*")
        self.expect(1, only_a + only_b + y
                    + summary(different=1, only_in_first=1, only_in_second=1), "", a, b,
                    "--include=only*", "--include=y")
        for options, second in (("--include", "x*", "--exclude=x"), b), (
                ("--exclude", "only*", "--exclude", "[xy]"), a):
            self.expect(2, "", f"talcmp: {a}: has no array that --include and --exclude leave, nor "
                               f"has {second}\n", a, *options, second)

    def test_one_member_and_a_file(self):
        a = self.save_archive("a.npz", x=np.arange(5), y=np.zeros(2))
        b = self.save("b.npy", np.arange(5.0))
        self.expect(0, "", "", a, b, "--include=x")
        self.expect(0, "", "", b, a, "--include=x")
        status, _, errors = run(a, b)
        self.assertEqual(status, 2)
        self.assertEqual(errors, f"talcmp: {a}: has 2 arrays, and one is needed; choose one, such "
                                 f"as {a}[x]\n")

    def test_orders(self):
        values = self.rng.standard_normal((200, 300))
        a = self.save_archive("a.npz", np.savez_compressed, x=values)
        b = self.save_archive("b.npz", x=np.asfortranarray(values))
        self.expect(0, summary(same=1), "", a, b)
        self.expect(0, summary(same=1), "", a, b, "--slice=3:5,::2")

    def test_members_that_are_no_arrays(self):
        a = self.save_archive("a.npz", x=np.zeros(3))
        with zipfile.ZipFile(a, "a") as archive:
            archive.writestr("notes.txt", "no array")
        self.expect(2, f"{a}[x] {a}[x] are the same\n" + summary(same=1, trouble=1),
                    f"talcmp: {a}[notes.txt]: is not an .npy file: it does not begin with "
                    "\\x93NUMPY\n", a, a, "-v")
        self.expect(0, summary(same=1), "", a, a, "--exclude=*.txt")

    def test_no_members(self):
        a = self.save_archive("a.npz")
        self.expect(0, summary(), "", a, a)
        self.expect(0, "", "", "-q", a, a)


class FoldersAndPatterns(NumpyFiles):
    def make_folders(self):
        self.save("one/same.npy", np.arange(3))
        self.save("two/same.npy", np.arange(3.0))
        self.save("one/sub/other.npy", np.arange(3))
        self.save("two/sub/other.npy", np.arange(3) + 1)
        self.save("one/mine.npy", np.arange(3))
        self.save("two/yours.npy", np.arange(3))
        self.write("one/notes.txt", b"not compared")
        return self.path("one"), self.path("two")

    def test_folders(self):
        one, two = self.make_folders()
        self.expect(1, f"{one} {two} differ: only in {one}: mine.npy\n"
                       f"{one}/sub/other.npy {two}/sub/other.npy differ: [0]: 0 and 1 (different "
                       f"integers)\n{one} {two} differ: only in {two}: yours.npy\n"
                    + summary(same=1, different=1, only_in_first=1, only_in_second=1,
                              rest="; 1 other file"), "", one, two)
        self.expect(1, "", "", "-q", one, two)

    def test_archives_in_folders(self):
        for folder in ("one", "two"):
            self.save_archive(f"{folder}/a.npz", x=np.arange(3), y=np.zeros(2))
        one, two = self.path("one"), self.path("two")
        self.expect(0, f"{one}/a.npz[x] {two}/a.npz[x] are the same\n"
                       f"{one}/a.npz[y] {two}/a.npz[y] are the same\n" + summary(same=2), "",
                    "-v", one, two)

    def test_files_that_are_left_out(self):
        one, two = self.make_folders()
        self.expect(2, "", f"talcmp: {one}: holds no file of arrays to compare, nor does "
                           f"{two}; in folders, these are the files named *.npy, *.npz, *.h5, "
                           "*.hdf5, *.he5, *.nc, *.nc4 and *.cdf\n", one, two, "--exclude=*")
        self.expect(0, "", "", "-q", one, two, "--exclude=sub/*", "--exclude=mine*",
                    "--exclude=yours*")

    def test_patterns(self):
        one, two = self.make_folders()
        self.expect(0, f"{one}/same.npy {two}/same.npy are the same\n" + summary(same=1), "", "-v",
                    f"{one}/s*.npy", f"{two}/[s]*.npy")
        self.expect(2, "", f"talcmp: {one}/no*.npy: there is no such file, and no file matches it "
                           "as a pattern\n", f"{one}/no*.npy", two)

    def test_file_and_folder(self):
        one, two = self.make_folders()
        self.expect(0, "", "", f"{one}/same.npy", two)
        self.expect(0, "", "", one, f"{two}/same.npy")


class KindsThatAreNotCompared(NumpyFiles):
    def test_each_is_named(self):
        good = self.save("good.npy", np.zeros(2))
        for values, message in [
                (np.zeros(2, dtype=np.longdouble), "extended precision"),
                (np.zeros(2, dtype="U3"), "text"),
                (np.zeros(2, dtype="S3"), "text"),
                (np.zeros(2, dtype="M8[s]"), "dates or times"),
                (np.zeros(2, dtype=[("x", "f8"), ("y", "i4")]), "structured"),
                (np.array([None, 1]), "Python objects")]:
            bad = self.save("bad.npy", values)
            status, output, errors = run(bad, good)
            self.assertEqual((status, output, len(errors.splitlines())), (2, "", 1))
            self.assertTrue(errors.startswith(f"talcmp: {bad}: "), errors)
            self.assertIn(message, errors)


class RecomputedFunctions(NumpyFiles):
    """The function values that NumPy's own tests expect, and those that it computes here."""

    def test_within_the_stated_error(self):
        folder = os.path.join(os.path.dirname(np.__file__), "core", "tests", "data")
        beginning = os.path.join(folder, "umath-validation-set-")
        files = glob.glob(beginning + "*.csv")
        self.assertGreaterEqual(len(files), 15)
        for path in files:
            function = path[len(beginning):-len(".csv")]
            with open(path, encoding="utf-8") as file:
                lines = [line.split(",") for line in file]
            for name in ("float32", "float64"):
                # The arguments, the expected values and the greatest error in ulps.
                rows = [[int(line[1], 16), int(line[2], 16), int(line[3])]
                        for line in lines if line[0] == f"np.{name}"]
                if rows:
                    with self.subTest(function=function, type=name):
                        self.check(getattr(np, function), np.dtype(name), np.array(rows, "u8"))

    def check(self, function, dtype, rows):
        bits = f"u{dtype.itemsize}"
        with np.errstate(all="ignore"):
            computed = function(rows[:, 0].astype(bits).view(dtype))
        expected = rows[:, 1].astype(bits).view(dtype)
        for ulps in np.unique(rows[:, 2]):
            chosen = (rows[:, 2] == ulps) & ~np.isnan(expected)
            a = self.save("computed.npy", computed[chosen])
            b = self.save("expected.npy", expected[chosen])
            # A unit in the last place of a number is at most 2^(1 - bits) times it.
            self.expect(0, "", "", f"--tol={int(ulps).bit_length() + 1}", a, b)


if __name__ == "__main__":
    run_tests()
