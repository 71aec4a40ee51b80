#!/usr/bin/env python3
"""What users allow beside the tolerance, and which elements they leave out, checked by a rule that
is written here in exact arithmetic.

Draws a new seed in every run and prints it; the environment variable TALNUMERICARRAY_SEED sets it.
"""

import math
import os
import random
import sys
from fractions import Fraction

import numpy as np

from support.talcmp_command import EMULATED, Folder, document_of, read_bytes, run, run_tests, summary

SEED = int(os.environ.get("TALNUMERICARRAY_SEED", random.randrange(2**32)))
REALS_AND_INTEGERS = "i1 u1 i2 u2 i4 u4 i8 u8 f4 f8 c8 c16".split()
print(f"seed {SEED}", file=sys.stderr)


def parts(value):
    """The real and the imaginary part, as numbers of Python."""
    return (value.real.item(), value.imag.item()) if value.dtype.kind == "c" else (value.item(), 0)


def is_allowed(one, other, absolute, equal_nan):
    """Whether a pair of parts is allowed to differ."""
    if math.isnan(one) or math.isnan(other):
        return equal_nan and math.isnan(one) and math.isnan(other)
    if absolute is None or math.isinf(one) or math.isinf(other):
        return False
    return abs(Fraction(one) - Fraction(other)) <= Fraction(absolute)


def same_parts(one, other, to_real):
    """Under the tolerance -1, that is by value."""
    return one == other if to_real is None else to_real(one) == to_real(other)


def real_type(type1, type2):
    """The type of real in which elements are compared; None for two integers."""
    if type1.kind in "iu" and type2.kind in "iu":
        return None
    return np.float64 if {type1.char, type2.char} & set("dD") else np.float32


def same(x, y, absolute, equal_nan):
    to_real = real_type(x.dtype, y.dtype)
    return all(is_allowed(one, other, absolute, equal_nan) or same_parts(one, other, to_real)
               for one, other in zip(parts(x), parts(y)))


class Drawn(Folder):
    def setUp(self):
        super().setUp()
        self.rng = np.random.default_rng(SEED)

    def differences(self, *arguments):
        """The indices of the differing elements, and the report."""
        status, output, errors = run("--json", "-n", 100000, *arguments)
        document = document_of(output)
        self.assertEqual(errors, "")
        self.assertEqual(status, document["exit_status"])
        found = document["comparisons"][0]
        self.assertEqual(status, 1 if found["differences"] else 0)
        self.assertEqual(found["report"]["differing"], len(found["differences"]))
        # The answer without a report is found in another way.
        lines = run("-n", 100000, *arguments)[1].splitlines()
        self.assertEqual(len(lines), len(found["differences"]))
        return [place["index"] for place in found["differences"]], found["report"]


# Errors that some differences below hit exactly, and their neighbours.
ERRORS = [0.0, 1.0, 3.0, 0.5, 0.1, 2.0**-30, np.nextafter(1, 0), np.nextafter(1, 2), 1e-300, 5e-324,
          2.0**53, 2.0**63, 1.7e19, 1e300]


class AbsoluteErrors(Drawn):
    def values(self, name, near):
        """Values of a type, many of them an error or almost an error away from `near`."""
        dtype = np.dtype(name)
        with np.errstate(all="ignore"):
            if dtype.kind in "iu":
                info = np.iinfo(dtype)
                moved = [int(value) + int(self.rng.integers(-4, 5)) if abs(value) < 2**64 else 0
                         for value in near]
                return np.array([min(max(value, info.min), info.max) for value in moved], dtype)
            signs = self.rng.choice([-1, 1], size=near.shape)
            errors = self.rng.choice(ERRORS, size=near.shape)
            moved = near + signs * errors
            return (moved + 1j * errors if dtype.kind == "c" else moved).astype(dtype)

    def centres(self):
        edges = [0.0, 1, 0.1, 100, 2.0**31, 2.0**53, 2.0**62, 2.0**63, 2.0**64, -2.0**63, -1, -100,
                 1e-300, 1e300, -1e300, np.inf, -np.inf, np.nan]
        return np.array(edges + list(self.rng.standard_normal(30))
                        + list(self.rng.integers(-2**63, 2**63, size=30)), dtype="f8")

    def test_are_decided_exactly(self):
        for type1 in REALS_AND_INTEGERS:
            # Emulation is slow.
            for type2 in self.rng.choice(REALS_AND_INTEGERS, size=2 if EMULATED else 12,
                                         replace=False):
                near = np.nan_to_num(self.centres(), nan=0, posinf=2.0**62, neginf=-2.0**62)
                centres = near if "i" in (type1 + type2) or "u" in (type1 + type2) else self.centres()
                ours, theirs = self.values(type1, centres), self.values(type2, centres)
                a, b = self.save("a.npy", ours), self.save("b.npy", theirs)
                for error in self.rng.choice(ERRORS, size=2, replace=False):
                    with self.subTest(types=(type1, type2), error=error, seed=SEED):
                        expected = [[i] for i, (x, y) in enumerate(zip(ours, theirs))
                                    if not same(x, y, error, False)]
                        found, _ = self.differences("--tol=-1", f"--absolute={error!r}", a, b)
                        self.assertEqual(found, expected)

    def test_of_64_bit_integers(self):
        ours = np.array([2**63 - 1, -2**63, 2**53 + 1, 5, -1], "i8")
        theirs = np.array([2**64 - 1, 2**64 - 1, 2**53 + 3, 2, 0], "u8")
        a, b = self.save("a.npy", ours), self.save("b.npy", theirs)
        for error, expected in ((2.0**63, [1]), (np.nextafter(2.0**63, 0), [0, 1]), (2, [0, 1, 3]),
                                (1.75, [0, 1, 2, 3]), (1e300, [])):
            with self.subTest(error=error):
                found, report = self.differences(f"--absolute={error!r}", a, b)
                self.assertEqual(found, [[i] for i in expected])
                self.assertEqual(report["largest_absolute_difference"], 2.0**64 + 2.0**63)

    def test_an_integer_and_a_real(self):
        """The integer is not rounded first: 2^62 + 1 is 1 away from 2^62, and not 0."""
        a, b = self.save("a.npy", [2**62 + 1, 2**62 + 2], "i8"), self.save("b.npy", [2.0**62] * 2)
        self.assertEqual(self.differences("--absolute=1", "--strict-type", a, a)[0], [])
        found, report = self.differences("--absolute=0", a, b)
        self.assertEqual((found, report["largest_absolute_difference"]), ([], 2))
        c = self.save("c.npy", [2.0**62 + 2**10] * 2)
        self.assertEqual(self.differences("--absolute=1022", a, c)[0], [[0]])
        self.assertEqual(self.differences("--absolute=1023", a, c)[0], [])

    def test_are_reported_where_rounding_makes_a_pair_the_same(self):
        for integer, integer_type, real_type, difference in (
                (2**53 + 1, "i8", "f8", 1), (2**64 - 1, "u8", "c16", 1), (2**24 + 1, "u4", "f4", 1),
                (-2**31 + 5, "i4", "c8", 5), (2**24 + 1, "u4", "f8", 0), (255, "u1", "f2", 0)):
            real = np.array([integer]).astype(real_type)
            for dtypes in ((integer_type, real_type), (real_type, integer_type)):
                with self.subTest(dtypes=dtypes):
                    a, b = (self.save(name, [integer] if dtype == integer_type else real, dtype)
                            for name, dtype in zip(("a.npy", "b.npy"), dtypes))
                    larger = max(abs(float(integer)), abs(real[0]))
                    found, report = self.differences(a, b)
                    self.assertEqual((found, report["largest_absolute_difference"],
                                      report["largest_relative_difference"]),
                                     ([], difference, difference / larger))

    def test_zero_beside_a_tiny_number(self):
        a, b = self.save("a.npy", [0.0, 1]), self.save("b.npy", [1e-17, 1 + 2.0**-52])
        self.assertEqual(self.differences("--tol=50", a, b)[0], [[0]])
        self.assertEqual(self.differences("--tol=1", "--absolute=1e-17", a, b)[0], [])
        self.expect(1, f"{a} {b} differ: [1]: 1 and 1.0000000000000002 (the same from --tol 1 on)\n",
                    "", "--absolute=1e-17", a, b)

    def test_parts_are_allowed_one_by_one(self):
        a = self.save("a.npy", [1 + 1e-17j, 1 + 1e-17j, 1e-17 + 2j])
        b = self.save("b.npy", [1.0, 1 + 2.0**-52, 2])
        self.expect(1, f"{a} {b} differ: [1]: 1+1e-17j and 1.0000000000000002 (the same from --tol 1 "
                       f"on)\n{a} {b} differ: [2]: 1e-17+2j and 2 (real parts: no digit in common)\n",
                    "", "-n5", "--absolute=1e-17", a, b)


class EqualNaNs(Drawn):
    def test_of_every_type_and_bits(self):
        for type1 in ("f4", "f8", "c8", "c16"):
            for type2 in ("f4", "f8", "c8", "c16"):
                values = [0.0, -0.0, 1, np.nan, -np.nan, np.inf]
                ours = self.rng.choice(values, size=300).astype(type1)
                theirs = self.rng.choice(values, size=300).astype(type2)
                for array in (ours, theirs):
                    if array.dtype.kind == "c":
                        array.imag = self.rng.choice(values, size=300)
                a, b = self.save("a.npy", ours), self.save("b.npy", theirs)
                for equal_nan in (False, True):
                    with self.subTest(types=(type1, type2), equal_nan=equal_nan, seed=SEED):
                        expected = [[i] for i, (x, y) in enumerate(zip(ours, theirs))
                                    if not same(x, y, None, equal_nan)]
                        options = ["--equal-nan"] if equal_nan else []
                        found, report = self.differences("--tol=-1", *options, a, b)
                        self.assertEqual(found, expected)
                        # What is stored is counted, not what the module is asked about.
                        self.assertEqual(report["first_values"]["nans"], int(np.isnan(ours).sum()))
                        self.assertEqual(report["second_values"]["nans"],
                                         int(np.isnan(theirs).sum()))

    def test_under_the_tolerance_0(self):
        bits = np.array([0x7FF8000000000001, 0x7FF8000000000002], "u8").view("f8")
        a, b = self.save("a.npy", bits[:1]), self.save("b.npy", bits[1:])
        self.expect(0, "", "", "--equal-nan", a, b)
        self.assertEqual(self.differences(a, b)[0], [[0]])

    def test_the_other_part_decides(self):
        a, b = self.save("a.npy", [complex(np.nan, 1)]), self.save("b.npy", [complex(np.nan, 2)])
        self.expect(1, f"{a} {b} differ: [0]: nan(0x7ff8000000000000)+1j and "
                       "nan(0x7ff8000000000000)+2j (imaginary parts: no digit in common)\n", "",
                    "--equal-nan", a, b)


class RelativeErrors(Drawn):
    def test_are_tolerances_of_the_type_that_is_compared(self):
        ours = self.rng.standard_normal(2000)
        theirs = ours * (1 + self.rng.standard_normal(2000) * 2.0**self.rng.integers(-40, -3, 2000))
        for dtype, bits in (("f8", 53), ("f4", 24)):
            a, b = self.save("a.npy", ours, dtype), self.save("b.npy", theirs, dtype)
            for error in (1e-9, 1e-3, 0.25, 0.999):
                with self.subTest(dtype=dtype, error=error, seed=SEED):
                    found, _ = self.differences(f"--relative={error}", a, b)
                    tolerance = bits + math.log2(error)
                    self.assertEqual(found, self.differences(f"--tol={tolerance!r}", a, b)[0])
                    x, y = (each.astype(dtype).astype("f8") for each in (ours, theirs))
                    quotients = abs(x - y) / np.maximum(abs(x), abs(y))
                    clear = abs(quotients / error - 1) > 1e-6
                    self.assertEqual([[i] for i in np.flatnonzero(clear & (quotients > error))],
                                     [index for index in found if clear[index[0]]])

    def test_in_reports(self):
        a, b = self.save("a.npy", [1.0]), self.save("b.npy", [1.5], "f4")
        document = document_of(run("--json", "--relative=0.5", a, b)[1])
        self.assertEqual((document["tolerance"], document["relative"]), (None, 0.5))
        self.assertEqual(document["comparisons"][0]["tolerance"], 52)
        self.assertEqual(document_of(run("--json", "--relative=0.5", b, b)[1])["comparisons"][0]
                         ["tolerance"], 23)
        output = run("--report", "--relative=0.5", "--absolute=1e-3", "--equal-nan", a, b)[1]
        self.assertIn("\n  tolerance             52 binary digits (a relative error of 0.5), or an "
                      "absolute error of 0.001; NaNs are equal\n", output)


class LargestDifferences(Drawn):
    def expect_largest(self, x, y):
        """x and y are doubles; those of the files may be of other types with the same values."""
        with np.errstate(all="ignore"):
            differences = abs(x - y)
            larger = np.maximum(abs(x), abs(y))
            quotients = np.where(np.isinf(larger), differences, differences / larger)
        expected = [np.max(each[~np.isnan(each)], initial=0) for each in (differences, quotients)]
        report = document_of(run("--json", "--tol=1", self.path("a.npy"), self.path("b.npy"))[1]
                             )["comparisons"][0]["report"]
        found = [float(report[f"largest_{kind}_difference"]) for kind in ("absolute", "relative")]
        self.assertEqual(found, expected)

    def test_are_found_wherever_they_are(self):
        """The largest absolute difference is of large numbers, the largest relative one of small
        ones; others are smaller by one unit in the last place, so that none can be missed."""
        for count in (511, 512, 513, 1023, 1025, 5000):
            for _ in range(4):
                with self.subTest(count=count, seed=SEED):
                    x = self.rng.standard_normal(count)
                    y = x * (1 + self.rng.standard_normal(count) * 1e-6)
                    large, small, *others = self.rng.choice(count, 8, replace=False)
                    x[large], y[large] = 1e9, 1e9 + 1
                    x[small], y[small] = 1e-9, 1.5e-9
                    x[others] = 1e-9
                    y[others] = np.nextafter(1.5e-9, 0)
                    self.save("a.npy", x), self.save("b.npy", y)
                    self.expect_largest(x, y)
                    self.save("a.npy", x + 1j), self.save("b.npy", y + 1j)
                    self.expect_largest(x, y)

    def test_are_found_by_one_unit_in_the_last_place(self):
        """Of quotients whose product with the larger magnitude is rounded up to the difference."""
        unit = 2.0**-51
        for _ in range(10):
            product, difference = 0, 1
            while product < difference:
                larger = 1 + float(self.rng.integers(2**51)) * unit
                smaller = float(self.rng.integers(2**51)) * unit
                difference = larger + smaller
                before = np.nextafter(difference / larger, 0)
                product = larger * before
            with self.subTest(larger=larger, smaller=smaller):
                x, y = np.ones(1024), np.ones(1024)
                x[0], y[0] = 8, -8 * (before - 1)
                x[600], y[600] = larger, -smaller
                self.save("a.npy", x), self.save("b.npy", y)
                self.expect_largest(x, y)

    def test_of_special_values(self):
        special = np.array([0, -0.0, 5e-324, 1e-310, 1, 1.7e308, -1.7e308, np.inf, -np.inf, np.nan])
        for _ in range(40):
            with self.subTest(seed=SEED):
                drawn = special[self.rng.choice(len(special), 1 + self.rng.integers(10))]
                x, y = (np.ones(2000) for _ in range(2))
                some = self.rng.choice(2000, 3, replace=False)
                x[some], y[some] = self.rng.choice(drawn, (2, 3))
                self.save("a.npy", x), self.save("b.npy", y)
                self.expect_largest(x, y)


class Masks(Drawn):
    def test_leave_elements_out(self):
        for shape, order in (((), "C"), ((7,), "C"), ((40, 30), "C"), ((40, 30), "F"),
                             ((700, 900), "C"), ((700, 900), "F"), ((60, 50, 70), "F")):
            ours = self.rng.integers(0, 3, size=shape, dtype="i4")
            theirs = np.where(self.rng.random(shape) < 0.999, ours, ours + 1)
            mask = self.rng.random(shape) < self.rng.choice([0, 0.5, 0.999, 1])
            a = self.save("a.npy", ours, order=order)
            b = self.save("b.npy", theirs)
            for mask_order in "CF":
                m = self.save("m.npy", mask, order=mask_order)
                with self.subTest(shape=shape, order=order, seed=SEED):
                    expected = np.argwhere((ours != theirs) & ~mask).tolist()
                    found, report = self.differences("--ignore", m, a, b)
                    self.assertEqual(found, expected)
                    self.assertEqual((report["pairs"], report["ignored"]),
                                     (int((~mask).sum()), int(mask.sum())))

    def test_are_cut_like_the_arrays(self):
        ours = self.rng.integers(0, 3, size=(20, 30))
        theirs = self.rng.integers(0, 3, size=(20, 30))
        mask = self.rng.random((20, 30)) < 0.5
        a, b, m = (self.save(name, each) for name, each in
                   (("a.npy", ours), ("b.npy", theirs), ("m.npy", mask)))
        chosen = np.zeros((20, 30), bool)
        chosen[3:17:2, ::-4] = True
        found, report = self.differences("--slice=3:17:2,::-4", f"--ignore={m}", a, b)
        self.assertEqual(found, np.argwhere((ours != theirs) & ~mask & chosen).tolist())
        self.assertEqual(report["pairs"], int((chosen & ~mask).sum()))

    def test_from_an_archive_and_with_allowances(self):
        a, b = self.save("a.npy", [1.0, 2, np.nan, 4]), self.save("b.npy", [1.0, 3, np.nan, 4.5])
        m = self.save_archive("m.npz", np.savez_compressed, first=[False, True, False, False])
        found, _ = self.differences("--equal-nan", "--absolute=0.4", f"--ignore={m}[first]", a, b)
        self.assertEqual(found, [[3]])
        self.assertEqual(self.differences("--equal-nan", "--absolute=0.5", "--ignore", m, a, b)[0], [])

    def test_that_are_read_from_beginning_to_end(self):
        """By one thread, though several could read the arrays."""
        ours = np.zeros(1000000)
        ignored = self.rng.random(ours.size) < 0.5
        theirs = np.where(ignored, 1.0, 0)
        a, b = self.save("a.npy", ours), self.save("b.npy", theirs)
        m = self.save("m.npy", ignored)
        packed = self.save_archive("m.npz", np.savez_compressed, m=ignored)
        self.expect(0, "", "", "--threads=8", "--ignore", packed, a, b)
        self.expect(0, "", "", "--threads=8", "--ignore=-", a, b, input=read_bytes(m))
        theirs[-1:] = 2
        ignored[-1:] = False
        b, m = self.save("b.npy", theirs), self.save("m.npy", ignored)
        self.expect(1, f"{a} {b} differ: [999999]: 0 and 2 (zero is the same only as zero)\n", "",
                    "--threads=8", "--ignore=-", a, b, input=read_bytes(m))

    def test_of_all_pairs(self):
        a, b = self.save("a.npy", np.zeros((2, 3))), self.save("b.npy", np.ones((2, 3)))
        m = self.save("m.npy", [[True] * 3, [True, True, False]])
        ignored = f"{a} {b} are the same (all pairs ignored)\n"
        self.expect(0, ignored, "", "-v", "--slice=0", "--ignore", m, a, b)
        self.expect(0, f"{a} {a} are the same\n", "", "-v", "--ignore", m, a, a)
        self.expect(0, f"{a} {a} are the same (no elements)\n", "", "-v", "--slice=2:", "--ignore", m,
                    a, a)
        self.assertEqual(run("--report", "--slice=0", "--ignore", m, a, b)[1].splitlines()[0] + "\n",
                         ignored)

    def test_that_do_not_fit(self):
        a = self.save("a.npy", np.zeros((2, 3)))
        m = self.save("m.npy", np.zeros((3, 2), bool))
        self.expect(2, "", f"talcmp: {m}: has the shape (3, 2), not that of {a}, which is (2, 3)\n",
                    "--ignore", m, a, a)
        m = self.save("m.npy", np.zeros((2, 3), "u1"))
        self.expect(2, "", f"talcmp: {m}: has elements of type uint8; --ignore takes an array of "
                           "booleans\n", "--ignore", m, a, a)
        self.expect(2, "", f"talcmp: {m}x: cannot be opened: No such file or directory\n",
                    "--ignore", m + "x", a, a)

    def test_that_can_be_read_once_are_for_one_comparison(self):
        """Standard input is closed when it has been read, and another file gets its number."""
        for name in ("a.npy", "b.npy"):
            ours = self.save(f"one/{name}", [True, True, False])
            self.save(f"two/{name}", [False, True, False])
        mask = self.save("m.npy", [False, False, True])
        one, two = self.path("one"), self.path("two")
        many = (self.save_archive("one.npz", x=[1], y=[2]), self.save_archive("two.npz", x=[1], y=[3]))
        pipe = self.path("pipe")
        os.mkfifo(pipe)
        message = ("can be read only once, but several arrays are compared without what --ignore "
                   "names; save that to a file first\n")
        for operands in (one, two), many:
            for option in "-", "-[x]":
                self.expect(2, "", f"talcmp: standard input: {message}", f"--ignore={option}",
                            *operands, input=read_bytes(mask))
            self.expect(2, "", f"talcmp: {pipe}: {message}", "--ignore", pipe, *operands)
        self.expect(1, f"{ours} {two}/b.npy differ: [0]: 1 and 0 (different integers)\n", "",
                    "--ignore=-", ours, f"{two}/b.npy", input=read_bytes(mask))

    def test_of_several_in_a_file(self):
        """Patterns are for the arrays that are compared."""
        a = self.save_archive("a.npz", x=[1, 2], y=[1, 2])
        b = self.save_archive("b.npz", x=[1, 3], y=[1, 2])
        m = self.save_archive("m.npz", land=[False, True])
        self.expect(0, summary(same=1), "", "--include=x", "--ignore", m, a, b)
        m = self.save_archive("m.npz", land=[False, True], sea=[True, False])
        self.expect(2, summary(trouble=1), f"talcmp: {m}: has 2 arrays, and one is needed; choose one, "
                    f"such as {m}[land]\n", "--include=x", "--ignore", m, a, b)


class SqueezedShapes(Drawn):
    def test_axes_of_length_1_do_not_matter(self):
        values = self.rng.standard_normal((3, 4))
        a = self.save("a.npy", values.reshape(1, 3, 1, 4))
        b = self.save("b.npy", np.asfortranarray(values).reshape(3, 4, 1))
        self.expect(0, "", "", "--squeeze", a, b)
        self.expect(1, f"{a} {b} differ: shape (1, 3, 1, 4) and (3, 4, 1)\n", "", a, b)
        values[1, 2] = 7
        c = self.save("c.npy", values)
        found, _ = self.differences("--squeeze", a, c)
        self.assertEqual(found, [[0, 1, 0, 2]])
        self.expect(0, "", "", "--squeeze", self.save("d.npy", 5), self.save("e.npy", [[5.0]]))


if __name__ == "__main__":
    run_tests()
