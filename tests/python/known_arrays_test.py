"""Arrays that are known to be awkward, and what each function says of them.

The kinds are those that tests of numerical libraries are about: special values, numbers a few units
apart, empty and 0-d arrays, subclasses, types that look like numbers, and integers beside reals.
"""

import fractions

import numpy as np
import pytest

import talnumericarray as tna

INF, NAN = np.inf, np.nan
OTHER_NAN = np.array([0x7FF8000000000001], "u8").view("f8")


def ulps(value, count, dtype="f8"):
    """The number `count` steps from another."""
    array = np.array([value], dtype)
    return (array.view(f"i{array.itemsize}") + count).view(dtype)


def single(value):
    return np.array(value, "f4")


class Named(np.ndarray):
    """A subclass that answers comparisons wrongly, as those of units of measure may."""

    def __eq__(self, other):
        raise AssertionError("elements are not compared by NumPy")

    __hash__ = None


# What `same` says, the smallest tolerance that a comparison recommends, and why there is none.
CASES = [
    ("equal", [1.0, 2.0], [1.0, 2.0], {}, True, 0, None),
    ("nan beside nan", [1, NAN], [1, NAN], {}, True, 0, None),
    ("nan beside nan, by value", [1, NAN], [1, NAN], {"tol": 1}, False, 0, None),
    ("nan beside nan, equal", [1, NAN], [1, NAN], {"tol": 1, "equal_nan": True}, True, 0, None),
    ("nans of other bits", [NAN], OTHER_NAN, {}, False, None,
     "[0]: nan(0x7ff8000000000000) and nan(0x7ff8000000000001) (two NaNs)"),
    ("nans of other bits, equal", [NAN], OTHER_NAN, {"equal_nan": True}, True, 0, None),
    ("nan beside a number", [1, NAN], [1, 2], {"equal_nan": True}, False, None,
     "[1]: nan(0x7ff8000000000000) and 2 (a NaN)"),
    ("nan and another difference", [NAN, 1], [NAN, ulps(1, 1)[0]], {}, False, None,
     "pairs of NaNs are the same under the tolerance 0 only"),
    ("infinities", [INF, -INF], [INF, -INF], {"tol": 10}, True, 0, None),
    ("opposite infinities", [INF], [-INF], {"tol": 53}, False, None,
     "[0]: inf and -inf (opposite signs)"),
    ("infinity beside the largest", [INF], [np.finfo("f8").max], {"tol": 52}, False, None,
     "[0]: inf and 1.7976931348623157e+308 (no digit in common)"),
    ("infinity, all digits", [INF], [1.0], {"tol": 53}, True, None,
     "[0]: inf and 1 (no digit in common)"),
    ("infinity, absolute error", [INF], [1e300], {"absolute": 1e300}, False, None,
     "[0]: inf and 1e+300 (no digit in common)"),
    ("nan part", [complex(1, NAN)], [complex(1, 2)], {"tol": 5}, False, None,
     "[0]: 1+nan(0x7ff8000000000000)j and 1+2j (imaginary parts: a NaN)"),
    ("infinite parts", [complex(INF, 1)], [complex(INF, -1)], {"tol": 5}, False, None,
     "[0]: inf+1j and inf-1j (imaginary parts: opposite signs)"),
    ("zeros of both signs", [0.0], [-0.0], {}, False, 1, None),
    ("zeros of both signs, by value", [0.0], [-0.0], {"tol": 1}, True, 1, None),
    ("zero beside the smallest number", [0.0], [5e-324], {"tol": 53}, False, None,
     "[0]: 0 and 5e-324 (zero is the same only as zero)"),
    ("zero beside the smallest number, absolute", [0.0], [5e-324], {"absolute": 5e-324}, True, 0,
     None),
    ("one unit apart", [1.0], ulps(1.0, 1), {"tol": 1}, True, 1, None),
    ("one unit apart, bits", [1.0], ulps(1.0, 1), {}, False, 1, None),
    ("two units apart", [1.0], ulps(1.0, 2), {"tol": 1}, False, 2, None),
    ("four units apart", [1.0], ulps(1.0, 4), {"tol": 3}, True, 3, None),
    ("one unit below a power of two", [1.0], ulps(1.0, -1), {"tol": 1}, True, 1, None),
    ("subnormal neighbours", [5e-324 * 3], [5e-324 * 4], {"tol": 51}, False, 52, None),
    ("singles one unit apart", single([1]), ulps(1, 1, "f4"), {"tol": 1}, True, 1, None),
    ("singles as doubles", single([0.1]), [0.1], {"tol": 26}, False, 27, None),
    ("singles as doubles, relative", single([0.1]), [0.1], {"relative": 1e-7}, True, 27, None),
    ("halves", np.array([1, 0.1], "f2"), single([1, 0.1]), {"tol": 13}, True, 13, None),
    ("halves, same type", np.array([NAN, -0.0], "f2"), np.array([NAN, -0.0], "f2"), {}, True, 0,
     None),
    ("halves beside bits", np.array([-0.0], "f2"), single([0.0]), {}, False, 1, None),
    ("0-d", 1.0, 1.0, {}, True, 0, None),
    ("0-d, different", 1, 2, {}, False, None, "[]: 1 and 2 (different integers)"),
    ("0-d beside one element", 1.0, [1.0], {}, False, None, "shape () and (1,)"),
    ("0-d beside one element, squeezed", 1.0, [1.0], {"squeeze": True}, True, 0, None),
    ("no broadcasting", [1.0, 1.0, 1.0], 1.0, {}, False, None, "shape (3,) and ()"),
    ("row beside column", np.ones((1, 3)), np.ones((3, 1)), {}, False, None,
     "shape (1, 3) and (3, 1)"),
    ("empty", [], [], {}, True, 0, None),
    ("empty, other types", np.zeros((0, 3)), np.zeros((0, 3), "i4"), {}, True, 0, None),
    ("empty, other types, strict", np.zeros(0), np.zeros(0, "i4"), {"strict_type": True}, False, 0,
     None),
    ("empty beside one element", [], [0.0], {}, False, None, "shape (0,) and (1,)"),
    ("empty, other shape", np.zeros((0, 3)), np.zeros((3, 0)), {}, False, None,
     "shape (0, 3) and (3, 0)"),
    ("integers have no tolerance", [100000], [100001], {"tol": 53}, False, None,
     "[0]: 100000 and 100001 (different integers)"),
    ("integers, absolute", [100000], [100001], {"absolute": 1}, True, 0, None),
    ("beyond 2^53", np.array([2**53 + 1], "i8"), np.array([2**53], "u8"), {}, False, None,
     "[0]: 9007199254740993 and 9007199254740992 (different integers)"),
    ("beyond 2^53 beside a double", np.array([2**53 + 1]), [2.0**53], {}, True, 0, None),
    ("all bits", np.array([-1], "i8"), np.array([2**64 - 1], "u8"), {}, False, None,
     "[0]: -1 and 18446744073709551615 (different integers)"),
    ("most negative", np.array([-128], "i1"), np.array([128], "u1"), {"tol": 5}, False, None,
     "[0]: -128 and 128 (different integers)"),
    ("booleans", [True, False], [1, 0], {}, True, 0, None),
    ("booleans, strict", [True], np.array([1], "u1"), {"strict_type": True}, False, 0, None),
    ("booleans differ", [True], [False], {"tol": 53}, False, None,
     "[0]: 1 and 0 (different integers)"),
    ("complex beside real", [1 + 0j], [1.0], {}, True, 0, None),
    ("complex beside real, a negative zero", [complex(1, -0.0)], [1.0], {}, True, 0, None),
    ("tiny imaginary part", [1 + 1e-300j], [1.0], {"tol": 52}, False, None,
     "[0]: 1+1e-300j and 1 (imaginary parts: zero is the same only as zero)"),
    ("other byte order", np.array([1.5], ">f8"), np.array([1.5], "<f8"), {"strict_type": True},
     True, 0, None),
    ("near zero", [1e-9], [2e-9], {"tol": 30}, False, None,
     "[0]: 1e-09 and 2e-09 (no digit in common)"),
    ("not relative to the second", [1.0], [1.1], {"relative": 0.1}, True, 50, None),
    ("not relative to the first", [1.1], [1.0], {"relative": 0.1}, True, 50, None),
    ("subclass", np.array([1.0, 2.0]).view(Named), [1.0, 2.0], {}, True, 0, None),
    ("matrix", np.asmatrix([[1.0, 2.0]]), [[1.0, 2.0]], {}, True, 0, None),
    ("recarray's field", np.rec.array([(1, 2.0)], dtype=[("i", "i4"), ("x", "f8")]).x, [2.0], {},
     True, 0, None),
    ("the largest numbers", [np.finfo("f8").max], [-np.finfo("f8").max], {"tol": 20}, False, None,
     "[0]: 1.7976931348623157e+308 and -1.7976931348623157e+308 (opposite signs)"),
]


@pytest.mark.parametrize("first, second, options, same, smallest, why",
                         [pytest.param(*case[1:], id=case[0]) for case in CASES])
def test_answers(first, second, options, same, smallest, why):
    for one, other in ((first, second), (second, first)):
        assert tna.same(one, other, **options) is same
        found = tna.compare(one, other, **options)
        assert found.same is same
        assert found.smallest_tolerance == smallest
        if same:
            tna.assert_same(one, other, **options)
        else:
            with pytest.raises(AssertionError) as raised:
                tna.assert_same(one, other, **options)
            assert str(raised.value) == str(found) == str(raised.value.comparison)
            assert type(raised.value) is tna.NotSameError
    assert tna.compare(first, second, **options).why_no_tolerance == why


@pytest.mark.parametrize("dtype, bits", [("f4", 24), ("f8", 53)])
@pytest.mark.parametrize("scale", [1.0, 3.7, 2.0**100, -1e-20])
def test_units_in_the_last_place(dtype, bits, scale):
    """A number of units is below a whole number of digits."""
    for count in (1, 2, 3, 4, 5, 7, 8, 100, 1000, 2**15):
        first, second = np.array([scale], dtype), ulps(scale, count, dtype)
        exact = [abs(fractions.Fraction(float(each[0]))) for each in (first, second)]
        error = (exact[1] - exact[0]) / max(exact)
        needed = next(tol for tol in range(1, bits + 1)
                      if error < fractions.Fraction(2)**(tol - bits))
        assert tna.compare(first, second).smallest_tolerance == needed
        assert tna.same(first, second, tol=needed)
        assert not tna.same(first, second, tol=needed - 1)


@pytest.mark.parametrize("first, second, expected", [
    (np.zeros((2, 3)), np.ones((2, 3)), True),
    (np.zeros((2, 3)), np.zeros((3, 2)), False),
    (np.zeros(6), np.zeros((2, 3)), False),
    (np.zeros(3), np.zeros(3, "f4"), False),
    (np.zeros(3, "f2"), np.zeros(3, "f4"), False),
    (np.zeros(3, "?"), np.zeros(3, "u1"), False),
    (np.zeros(3, ">i4"), np.zeros(3, "<i4"), True),
    (np.zeros(3, "l"), np.zeros(3, "q"), True),
    (np.zeros((4, 4), order="F"), np.zeros((4, 4)), True),
    (np.zeros(0), np.zeros(0), True),
    (np.zeros(0), np.zeros(0, "i4"), False),
    (1, 2, True),
    (1, 2.0, False),
    ([1, 2], (3, 4), True),
    (np.broadcast_to(1.0, (5, 5)), np.zeros((5, 5)), True),
])
def test_equivalent(first, second, expected):
    assert tna.equivalent(first, second) is expected
    assert tna.equivalent(second, first) is expected


@pytest.mark.parametrize("dtype, tolerance", [("f8", 52.5), ("f4", 23.5)])
def test_tolerance_that_leaves_less_than_one_digit(dtype, tolerance):
    """The answer does not depend on what the thread compared before: 1 and 2.5 differ by 1.5, where
    2^-0.5 times the larger is 1.77."""
    first, second = np.array([1, 1], dtype), np.array([2.5, 1], dtype)
    for compared in (lambda: tna.same(first, second, tol=tolerance),
                     lambda: tna.same(first[::-1], second[::-1], tol=tolerance),
                     lambda: tna.compare(first, second, tol=tolerance).same):
        assert not tna.same(first, second, tol=3)  # this tolerance is the last one
        assert compared() is True
