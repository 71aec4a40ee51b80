#!/usr/bin/env python3
"""Compares files that NumPy writes, and holds talcmp's answers against NumPy's and against a rule
that is stated here in exact arithmetic.

Draws a new seed in every run and prints it; the environment variable TALNUMERICARRAY_SEED sets it,
and TALNUMERICARRAY_ROUNDS how often each kind of array is drawn.
"""

import fractions
import glob
import json
import os
import random
import subprocess
import sys
import tempfile
import unittest
import zipfile

import jsonschema
import numpy as np

from support.talcmp_command import COMMAND, run_tests

with open(os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "..", "tools", "talcmp",
                       "talcmp.schema.json"), encoding="utf-8") as schema_file:
    SCHEMA = json.load(schema_file)
SEED = int(os.environ.get("TALNUMERICARRAY_SEED", random.randrange(2**32)))
TYPES = [np.dtype(name) for name in
         "i1 u1 i2 u2 i4 u4 i8 u8 f4 f8 c8 c16".split()]
NEVER = 54  # digits of a pair that is the same under no tolerance
# Emulation is slow.
ROUNDS = int(os.environ.get("TALNUMERICARRAY_ROUNDS",
                            1 if any("qemu" in argument for argument in sys.argv) else 2))
print(f"seed {SEED}", file=sys.stderr)


def run(*arguments, stdin=None):
    """Returns the exit status, what is on standard output and what on standard error."""
    done = subprocess.run(COMMAND + [str(argument) for argument in arguments], input=stdin,
                          capture_output=True, check=False, timeout=300)
    return done.returncode, done.stdout.decode(), done.stderr.decode()


def read_bytes(path):
    with open(path, "rb") as file:
        return file.read()


# ---- The rule, for one pair

def parts(value, dtype):
    if dtype.kind == "c":
        return [value.real, value.imag]
    return [value]


def bits_of(type1, type2):
    """The binary digits in which reals of these types are compared; None for two integers."""
    if type1.kind in "iu" and type2.kind in "iu":
        return None
    double = {np.dtype("f8"), np.dtype("c16")}
    return 53 if type1 in double or type2 in double else 24


def part_digits(x, y, bits):
    """The smallest whole tolerance from 1 on under which two reals are the same."""
    real = np.float64 if bits == 53 else np.float32
    x, y = real(x), real(y)
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


def smallest_tolerance(x, y, type1, type2):
    bits = bits_of(type1, type2)
    if bits is None:
        return 1 if int(x) == int(y) else NEVER
    of_parts = [part_digits(one, other, bits)
                for one, other in zip(parts(x, type1), parts(y, type2))]
    if (type1.kind == "c") != (type2.kind == "c"):
        imaginary = x.imag if type1.kind == "c" else y.imag
        of_parts.append(1 if imaginary == 0 else NEVER)
    return max(of_parts)


def digits_of(x, y, type1, type2):
    if type1 == type2:
        same = x.tobytes() == y.tobytes()
    else:
        same = smallest_tolerance(x, y, type1, type2) == 1 and equal_by_value(x, y, type1, type2)
    return 0 if same else smallest_tolerance(x, y, type1, type2)


def same_under(tolerance, x, y, type1, type2):
    """Whether a pair is the same under a tolerance, fractional and negative ones included."""
    if tolerance == 0:
        return digits_of(x, y, type1, type2) == 0
    if tolerance < 0 or bits_of(type1, type2) is None:
        return equal_by_value(x, y, type1, type2)
    smallest = smallest_tolerance(x, y, type1, type2)
    if smallest == NEVER or tolerance <= smallest - 1 or tolerance >= smallest:
        return smallest != NEVER and smallest <= tolerance
    bits = bits_of(type1, type2)
    padded = [(parts(value, dtype) + [0])[:2] for value, dtype in ((x, type1), (y, type2))]
    real = np.float64 if bits == 53 else np.float32
    for one, other in zip(*padded):
        one, other = float(real(one)), float(real(other))
        if one != other and not (abs(one - other) < max(abs(one), abs(other))
                                 * 2.0 ** (tolerance - bits)):
            return False
    return True


def equal_by_value(x, y, type1, type2):
    bits = bits_of(type1, type2)
    if bits is None:
        return int(x) == int(y)
    real = np.float64 if bits == 53 else np.float32
    ours, theirs = parts(x, type1), parts(y, type2)
    padded = [(ours + [0])[:2], (theirs + [0])[:2]]
    return all(real(one) == real(other) for one, other in zip(*padded))


# ---- Arrays

def random_values(rng, dtype, shape):
    if dtype.kind in "iu":
        info = np.iinfo(dtype)
        return rng.integers(info.min, info.max, size=shape, dtype=dtype, endpoint=True)
    real = np.dtype("f4") if dtype in (np.dtype("f4"), np.dtype("c8")) else np.dtype("f8")

    def reals():
        values = rng.standard_normal(shape) * 2.0 ** rng.integers(-40, 40, size=shape)
        values = np.asarray(values, dtype=real)
        special = np.array([0.0, -0.0, np.nan, np.inf, -np.inf, 1, -1, 2, 0.5], dtype=real)
        return np.where(rng.random(shape) < 0.1, rng.choice(special, size=shape), values)

    if dtype.kind == "c":
        values = np.empty(shape, dtype=dtype)
        values.real, values.imag = reals(), reals()
        return values
    return np.asarray(reals(), dtype=dtype)


def near_values(rng, values):
    """Of the same type; most elements as they are, or a few digits away."""
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


SHAPES = [(), (1,), (7,), (0,), (3, 0, 2), (2, 3), (5, 1, 4), (2, 3, 4, 5), (40, 30), (1, 1000)]


class Folder(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = folder.name
        self.rng = np.random.default_rng(SEED)

    def path(self, name):
        return os.path.join(self.folder, name)

    def save(self, name, array):
        path = self.path(name)
        os.makedirs(os.path.dirname(path), exist_ok=True)
        np.save(path, array)
        return path

    def report(self, *arguments):
        status, output, _ = run("--json", *arguments)
        document = json.loads(output)
        jsonschema.validate(document, SCHEMA)
        self.assertEqual(document["exit_status"], status)
        return document

    def only_comparison(self, *arguments):
        comparisons = self.report(*arguments)["comparisons"]
        self.assertEqual(len(comparisons), 1)
        return comparisons[0]


# ---- One file against another

class EveryTypeAndShape(Folder):
    def check(self, ours, theirs, options=(), slices=Ellipsis):
        a, b = self.save("a.npy", stored(self.rng, ours)), self.save("b.npy",
                                                                     stored(self.rng, theirs))
        found = self.only_comparison("-n", 10000, *options, a, b)
        part1, part2 = np.asarray(ours[slices]), np.asarray(theirs[slices])
        places = np.arange(ours.size).reshape(ours.shape)[slices]
        indices = [list(index) for index in np.ndindex(ours.shape)]
        chosen = [indices[place] for place in np.asarray(places).reshape(-1)]
        digits = [digits_of(x, y, ours.dtype, theirs.dtype)
                  for x, y in zip(part1.reshape(-1), part2.reshape(-1))]
        from_one = [smallest_tolerance(x, y, ours.dtype, theirs.dtype)
                    for x, y in zip(part1.reshape(-1), part2.reshape(-1))]
        expected = [index for index, digit in zip(chosen, digits) if digit != 0]
        self.assertEqual([place["index"] for place in found["differences"]], expected)
        report = found["report"]
        self.assertEqual(report["pairs"], len(digits))
        self.assertEqual(report["differing"], len(expected))
        histogram = {NEVER if bar["digits"] is None else bar["digits"]: bar["pairs"]
                     for bar in report["histogram"]}
        self.assertEqual(histogram, {digit: digits.count(digit) for digit in digits})
        smallest = 0 if not expected else max(from_one)
        none = smallest >= (bits_of(ours.dtype, theirs.dtype) or NEVER)
        self.assertEqual(report["smallest_tolerance"], None if none else smallest)
        self.assertEqual(report["why_no_tolerance"] is None, not none)
        for place in found["differences"]:
            self.assertEqual(place["digits"],
                             None if digits[chosen.index(place["index"])] == NEVER
                             else digits[chosen.index(place["index"])])
        if expected:
            worst = chosen[digits.index(max(digits))]
            self.assertEqual(report["worst"]["index"], worst)
        self.check_values(report["first_values"], part1)
        self.check_values(report["second_values"], part2)

    def check_values(self, counts, array):
        if array.dtype.kind in "iu":
            expected = (0, 0, 0)
        elif array.dtype.kind == "f":
            expected = (np.isnan(array).sum(), np.isinf(array).sum(),
                        ((array == 0) & np.signbit(array)).sum())
        else:
            negative = [(part == 0) & np.signbit(part) for part in (array.real, array.imag)]
            nans = np.isnan(array.real) | np.isnan(array.imag)
            infinities = np.isinf(array.real) | np.isinf(array.imag)
            expected = (nans.sum(), infinities.sum(), (negative[0] | negative[1]).sum())
        self.assertEqual((counts["nans"], counts["infinities"], counts["negative_zeros"]),
                         tuple(int(count) for count in expected))

    def test_one_type(self):
        for dtype in TYPES:
            for shape in SHAPES * ROUNDS:
                with self.subTest(dtype=dtype, shape=shape, seed=SEED):
                    values = random_values(self.rng, dtype, shape)
                    self.check(values, near_values(self.rng, values))

    def test_two_types(self):
        for type1 in TYPES:
            for type2 in TYPES:
                with self.subTest(type1=type1, type2=type2, seed=SEED):
                    with np.errstate(all="ignore"):
                        small = np.arange(-3, 60).astype(type1)
                        ours = small if type1.kind in "iu" else random_values(self.rng, type1,
                                                                              (63,))
                        theirs = (ours.real if type2.kind != "c" else ours).astype(type2)
                        theirs = near_values(self.rng, theirs)
                    self.check(ours, theirs)

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
                                if not same_under(tolerance, x, y, type1, type2)]
                    found = self.only_comparison(f"--tol={tolerance}", "-n", 1000, a, b)
                    self.assertEqual([place["index"] for place in found["differences"]], expected)
                    self.assertEqual(found["report"]["differing"], len(expected))
                    status, output, _ = run(f"--tol={tolerance}", "-n", 1000, a, b)
                    self.assertEqual(status, 1 if expected else 0)
                    self.assertEqual(len(output.splitlines()), len(expected))

    def test_slices(self):
        for _ in range(15 * ROUNDS):
            shape = tuple(self.rng.integers(1, 9, size=self.rng.integers(1, 5)))
            values = random_values(self.rng, np.dtype(self.rng.choice(["f8", "i2", "c8"])), shape)
            texts, slices = [], []
            for dimension in shape[:self.rng.integers(1, len(shape) + 1)]:
                start, stop = (int(number) for number in
                               self.rng.integers(-dimension - 2, dimension + 3, size=2))
                step = int(self.rng.integers(1, 4))
                if self.rng.random() < 0.3:
                    index = int(self.rng.integers(-dimension, dimension))
                    texts.append(str(index))
                    slices.append(index)
                else:
                    texts.append(f"{start}:{stop}:{step}")
                    slices.append(slice(start, stop, step))
            with self.subTest(shape=shape, texts=texts, seed=SEED):
                self.check(values, near_values(self.rng, values),
                           ["--slice=" + ",".join(texts)], tuple(slices))


class LargeArrays(Folder):
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
            first = f"differ: {expected[0]}:" if expected else ""
            self.assertIn(first, output)

    def test_orders(self):
        for shape in [(1100, 700), (3, 700, 300), (130, 2, 3, 400), (1000000,)]:
            for order1, order2 in ["CC", "CF", "FC", "FF"]:
                with self.subTest(shape=shape, orders=order1 + order2, seed=SEED):
                    ours = self.rng.integers(0, 100, size=shape, dtype="i4")
                    different = self.rng.random(shape) < self.rng.choice([0, 1e-5, 1e-3])
                    theirs = ours + different
                    self.check_places(np.array(ours, order=order1),
                                      np.array(theirs, order=order2), different)

    def test_slices_of_large_arrays(self):
        shape = (600, 40, 50)
        ours = self.rng.standard_normal(shape)
        theirs = ours.copy(order="F")
        theirs[::7, 3, ::11] += 1
        for text, part in [("::2", np.s_[::2]), (":,3", np.s_[:, 3]), (":,:,::11", np.s_[:, :, ::11]),
                           ("5", np.s_[5]), ("-1:,2:5,3", np.s_[-1:, 2:5, 3])]:
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
        report = self.only_comparison("--tol=1", a, b)["report"]
        self.assertEqual(report["differing"], 1)

    def test_tolerance_that_depends_on_order(self):
        ours = np.ones(300000)
        for position in (0, 5, 299999):
            theirs = ours.copy()
            theirs[position] = 2.5
            a, b = self.save("a.npy", ours), self.save("b.npy", theirs)
            for threads in (1, 3):
                self.assertEqual(run("--tol=52.5", "--threads", threads, a, b)[0], 0)


class StandardInput(Folder):
    def test_either_operand(self):
        for ours in (np.arange(300000.0), np.arange(12).reshape(3, 4), np.array(3)):
            path = self.save("a.npy", ours)
            contents = read_bytes(path)
            self.assertEqual(run("-", path, stdin=contents), (0, "", ""))
            self.assertEqual(run(path, "-", stdin=contents), (0, "", ""))
            other = self.save("b.npy", np.where(ours == 3, 5, ours))
            status, output, _ = run("-", other, stdin=contents)
            self.assertEqual(status, 1)
            self.assertTrue(output.startswith(f"- {other} differ: "), output)

    def test_other_order_and_slices(self):
        ours = self.rng.standard_normal((300, 400))
        path = self.save("a.npy", np.asfortranarray(ours))
        ours[7, 9] = 0
        contents = read_bytes(self.save("b.npy", ours))
        self.assertIn("differ: [7, 9]: ", run("-", path, stdin=contents)[1])
        self.assertEqual(run("-", path, "--slice", "::2", stdin=contents)[0], 0)
        self.assertEqual(run("-", path, "--slice", ":,9", stdin=contents)[0], 1)

    def test_part_behind_what_is_passed_over(self):
        ours = np.arange(100000.0)
        path = self.save("a.npy", ours)
        ours[99990] = 0
        contents = read_bytes(self.save("b.npy", ours))
        self.assertIn("differ: [99990]: 0 and 99990 ",
                      run("-", path, "--slice=99980:99995", stdin=contents)[1])
        self.assertEqual(run("-", path, "--slice=99991:", stdin=contents), (0, "", ""))

    def test_too_short_and_too_long(self):
        path = self.save("a.npy", np.arange(100000.0))
        contents = read_bytes(path)
        status, output, errors = run("-", path, stdin=contents[:-5])
        self.assertEqual((status, output), (2, ""))
        self.assertIn("standard input: ends after 99999 of 100000 elements", errors)
        status, output, errors = run("-", path, stdin=contents + b"x")
        self.assertEqual((status, output), (2, ""))
        self.assertIn("standard input: has more data than its shape says", errors)

    def test_named_pipes(self):
        path = self.save("a.npy", np.arange(300000.0))
        other = self.save("b.npy", np.where(np.arange(300000) == 3, 5, np.arange(300000.0)))
        pipe = self.path("pipe")
        os.mkfifo(pipe)
        for operands, answer in (((pipe, path), ""), ((other, pipe), "differ: [3]: 5 and 3 ")):
            writer = subprocess.Popen(["sh", "-c", 'exec cat "$1" >"$2"', "sh", path, pipe],
                                      stderr=subprocess.DEVNULL)
            self.addCleanup(writer.wait)
            self.addCleanup(writer.kill)
            status, output, errors = run(*operands)
            self.assertEqual((status, errors), (1 if answer else 0, ""))
            self.assertIn(answer, output)

    def test_no_room_for_a_copy(self):
        path = self.save("a.npy", np.zeros((20, 30), order="F"))
        contents = read_bytes(self.save("b.npy", np.zeros((20, 30))))
        before = os.environ.get("TMPDIR")
        os.environ["TMPDIR"] = self.path("missing")
        try:
            status, _, errors = run("-", path, stdin=contents)
        finally:
            del os.environ["TMPDIR"]
            if before is not None:
                os.environ["TMPDIR"] = before
        self.assertEqual(status, 2)
        self.assertIn("set TMPDIR", errors)


class Archives(Folder):
    def save_archive(self, name, compressed=False, **arrays):
        path = self.path(name)
        (np.savez_compressed if compressed else np.savez)(path, **arrays)
        return path

    def test_same(self):
        arrays = {"x": np.arange(200000.0), "y": np.zeros((3, 4), order="F"), "z": np.array(1)}
        stored_archive = self.save_archive("a.npz", **arrays)
        compressed = self.save_archive("b.npz", True, **arrays)
        self.assertEqual(run(stored_archive, compressed), (0, "", ""))
        self.assertEqual(run(compressed, compressed), (0, "", ""))

    def test_members_that_differ(self):
        a = self.save_archive("a.npz", x=np.arange(5), y=np.zeros(2), only_a=np.zeros(1))
        b = self.save_archive("b.npz", True, x=np.arange(5) + [0, 0, 1, 0, 0],
                              y=np.zeros((2, 1), dtype="f4"), only_b=np.zeros(1))
        status, output, errors = run(a, b)
        self.assertEqual((status, errors), (1, ""))
        self.assertEqual(output.splitlines(), [
            f"{a} {b} differ: only in {a}: only_a",
            f"{a} {b} differ: only in {b}: only_b",
            f"{a}[x] {b}[x] differ: [2]: 2 and 3 (different integers)",
            f"{a}[y] {b}[y] differ: shape (2,) and (2, 1)"])
        self.assertEqual(run(a, b, "--include", "x*", "--exclude=x")[0], 2)
        self.assertEqual(run(a, b, "--include", "x")[0], 1)
        self.assertEqual(run("--include", "z", "--include", "x", a, b)[0], 1)
        self.assertEqual(run(a, "--exclude", "only*", "--exclude", "[xy]", a), (2, "", f"talcmp: "
                         f"{a}: has no array that --include and --exclude leave, nor has {a}\n"))
        self.assertEqual(len(run(a, b, "--exclude", "only*")[1].splitlines()), 2)
        self.assertEqual(len(run(a, b, "--include=only*", "--include=y")[1].splitlines()), 3)

    def test_one_member_against_a_file(self):
        a = self.save_archive("a.npz", x=np.arange(5), y=np.zeros(2))
        b = self.save("b.npy", np.arange(5.0))
        self.assertEqual(run(a, b, "--include=x"), (0, "", ""))
        self.assertEqual(run(b, a, "--include=x"), (0, "", ""))
        status, _, errors = run(a, b)
        self.assertEqual(status, 2)
        self.assertIn("has 2 arrays, the other file one; choose one with --include", errors)

    def test_orders(self):
        values = self.rng.standard_normal((200, 300))
        a = self.save_archive("a.npz", True, x=values)
        b = self.save_archive("b.npz", x=np.asfortranarray(values))
        self.assertEqual(run(a, b), (0, "", ""))
        self.assertEqual(run(a, b, "--slice=3:5,::2"), (0, "", ""))

    def test_damage(self):
        a = self.save_archive("a.npz", x=np.arange(100000.0))
        contents = read_bytes(a)
        b = self.path("b.npz")
        for damaged, message in [
                (contents[:1000], "broken .npz archive"),
                (contents[:400000] + b"\1" + contents[400001:], "CRC"),
                (contents[:4], "broken .npz archive")]:
            with open(b, "wb") as file:
                file.write(damaged)
            status, output, errors = run(b, b)
            self.assertEqual((status, output), (2, ""), errors)
            self.assertIn(message, errors)
            self.assertEqual(len(errors.splitlines()), 1)

    def test_members_that_are_no_arrays(self):
        a = self.save_archive("a.npz", x=np.zeros(3))
        with zipfile.ZipFile(a, "a") as archive:
            archive.writestr("notes.txt", "no array")
        status, output, errors = run(a, a, "-v")
        self.assertEqual(status, 2)
        self.assertIn(f"{a}[notes.txt]: is not an .npy file", errors)
        self.assertIn(f"{a}[x] {a}[x] are the same", output)
        self.assertEqual(run(a, a, "--exclude=*.txt"), (0, "", ""))

    def test_no_members(self):
        a = self.save_archive("a.npz")
        self.assertEqual(run(a, a), (0, "", ""))
        self.assertEqual(run("-v", a, a), (0, "0 the same, 0 different, 0 only in the first, "
                                           "0 only in the second, 0 in trouble\n", ""))


class FoldersAndPatterns(Folder):
    def make_folders(self):
        self.save("one/same.npy", np.arange(3))
        self.save("two/same.npy", np.arange(3.0))
        self.save("one/sub/other.npy", np.arange(3))
        self.save("two/sub/other.npy", np.arange(3) + 1)
        self.save("one/mine.npy", np.arange(3))
        self.save("two/yours.npy", np.arange(3))
        with open(self.path("one/notes.txt"), "w", encoding="utf-8") as file:
            file.write("not compared")
        return self.path("one"), self.path("two")

    def test_folders(self):
        one, two = self.make_folders()
        status, output, errors = run(one, two)
        self.assertEqual((status, errors), (1, ""))
        self.assertEqual(output.splitlines(), [
            f"{one} {two} differ: only in {one}: mine.npy",
            f"{one}/same.npy {two}/same.npy are the same",
            f"{one}/sub/other.npy {two}/sub/other.npy differ: [0]: 0 and 1 (different integers)",
            f"{one} {two} differ: only in {two}: yours.npy",
            "1 the same, 1 different, 1 only in the first, 1 only in the second, 0 in trouble"])
        self.assertEqual(run("-q", one, two), (1, "", ""))

    def test_archives_in_folders(self):
        for folder in ("one", "two"):
            os.makedirs(self.path(folder))
            np.savez(self.path(folder + "/a.npz"), x=np.arange(3), y=np.zeros(2))
        one, two = self.path("one"), self.path("two")
        status, output, _ = run(one, two)
        self.assertEqual(status, 0)
        self.assertEqual(output.splitlines(), [
            f"{one}/a.npz[x] {two}/a.npz[x] are the same",
            f"{one}/a.npz[y] {two}/a.npz[y] are the same",
            "2 the same, 0 different, 0 only in the first, 0 only in the second, 0 in trouble"])

    def test_trouble_is_the_worst(self):
        one, two = self.make_folders()
        with open(self.path("two/same.npy"), "w", encoding="utf-8") as file:
            file.write("broken")
        status, output, errors = run(one, two)
        self.assertEqual(status, 2)
        self.assertEqual(len(errors.splitlines()), 1)
        self.assertEqual(len(output.splitlines()), 4)
        document = self.report(one, two)
        self.assertEqual(document["summary"], {"same": 0, "different": 1, "only_in_first": 1,
                                               "only_in_second": 1, "trouble": 1})
        mine, trouble, _, yours = document["comparisons"]
        self.assertEqual((mine["in"], mine["name"]), (one, "mine.npy"))
        self.assertEqual(trouble["names"], [one + "/same.npy", two + "/same.npy"])
        self.assertEqual((yours["in"], yours["name"]), (two, "yours.npy"))

    def test_files_that_are_left_out(self):
        one, two = self.make_folders()
        status, _, errors = run(one, two, "--exclude=*")
        self.assertEqual(status, 2)
        self.assertIn("holds no .npy or .npz file to compare", errors)
        self.assertEqual(run("-q", one, two, "--exclude=sub/*", "--exclude=mine*",
                             "--exclude=yours*"), (0, "", ""))

    def test_patterns(self):
        one, two = self.make_folders()
        status, output, _ = run(one + "/s*.npy", two + "/[s]*.npy")
        self.assertEqual(status, 0)
        self.assertEqual(len(output.splitlines()), 2)
        status, _, errors = run(one + "/no*.npy", two)
        self.assertEqual(status, 2)
        self.assertIn("no file matches it as a pattern", errors)

    def test_file_and_folder(self):
        one, two = self.make_folders()
        self.assertEqual(run(one + "/same.npy", two), (0, "", ""))
        self.assertEqual(run(one, two + "/same.npy"), (0, "", ""))

    def test_folders_without_arrays(self):
        os.makedirs(self.path("empty"))
        status, _, errors = run(self.path("empty"), self.path("empty"))
        self.assertEqual(status, 2)
        self.assertIn("holds no .npy or .npz file", errors)


class KindsThatAreNotCompared(Folder):
    def test_each_is_told(self):
        good = self.save("good.npy", np.zeros(2))
        for values, message in [
                (np.zeros(2, dtype="f2"), "half precision"),
                (np.zeros(2, dtype=np.longdouble), "extended precision"),
                (np.zeros(2, dtype="?"), "boolean"),
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


class RecomputedFunctions(Folder):
    """The function values that NumPy's own tests expect, against those that it computes here."""

    FUNCTIONS = {"sin": np.sin, "cos": np.cos, "exp": np.exp, "log": np.log, "exp2": np.exp2,
                 "log2": np.log2, "log10": np.log10, "log1p": np.log1p, "expm1": np.expm1,
                 "tan": np.tan, "arcsin": np.arcsin, "arccos": np.arccos, "arctan": np.arctan,
                 "sinh": np.sinh, "cosh": np.cosh, "tanh": np.tanh, "arcsinh": np.arcsinh,
                 "arccosh": np.arccosh, "arctanh": np.arctanh, "cbrt": np.cbrt}

    @staticmethod
    def rows(path):
        """By type: the arguments, the expected values and the greatest error in ulps."""
        rows = {"np.float32": [], "np.float64": []}
        with open(path, encoding="utf-8") as file:
            for line in file:
                fields = line.split(",")
                if fields[0] in rows:
                    rows[fields[0]].append([int(fields[1], 16), int(fields[2], 16),
                                            int(fields[3])])
        return rows

    def test_within_the_stated_error(self):
        folder = os.path.join(os.path.dirname(np.__file__), "core", "tests", "data")
        files = glob.glob(os.path.join(folder, "umath-validation-set-*.csv"))
        self.assertGreaterEqual(len(files), 15)
        for path in files:
            name = os.path.basename(path)[len("umath-validation-set-"):-len(".csv")]
            for type_name, rows in self.rows(path).items():
                if rows:
                    with self.subTest(function=name, type=type_name):
                        self.check(self.FUNCTIONS[name], type_name[3:], np.array(rows, dtype="u8"))

    def check(self, function, type_name, rows):
        dtype = np.dtype(type_name)
        bits = f"u{dtype.itemsize}"
        with np.errstate(all="ignore"):
            computed = function(rows[:, 0].astype(bits).view(dtype))
        expected = rows[:, 1].astype(bits).view(dtype)
        for ulps in np.unique(rows[:, 2]):
            chosen = (rows[:, 2] == ulps) & ~np.isnan(expected)
            a = self.save("computed.npy", computed[chosen])
            b = self.save("expected.npy", expected[chosen])
            # A unit in the last place of a number is at most 2^(1 - bits) times it.
            tolerance = int(ulps).bit_length() + 1
            self.assertEqual(run(f"--tol={tolerance}", a, b), (0, "", ""))


if __name__ == "__main__":
    run_tests()
