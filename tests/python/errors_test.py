"""What is not taken, and the whole text of each error."""

import warnings

import dask.array
import numpy as np
import pytest
import xarray

import talnumericarray as tna

ARRAY = np.zeros(3)
INTEGERS = "integers, slices and '...' as in an index, or a text such as \"0:10,:,3\""

NO_ARRAYS = [
    (np.ma.array([1.0, 2, 3], mask=[0, 0, 1]), "is a masked array; fill it by .filled(value), or "
     "compare its .data and leave out what is masked by ignore="),
    (np.array([None, 1, 2]), "has elements of type object; give their type if they are numbers, as "
     "by .astype(numpy.float64)"),
    (None, "has elements of type object; give their type if they are numbers, as by "
     ".astype(numpy.float64)"),
    ({1: 2}, "has elements of type object; give their type if they are numbers, as by "
     ".astype(numpy.float64)"),
    ([2**70], "has elements of type object; give their type if they are numbers, as by "
     ".astype(numpy.float64)"),
    (np.array(["a", "b"]), "has elements of type <U1; compare it by numpy.array_equal; if it holds "
     "numbers, convert it by .astype(numpy.float64)"),
    ("text", "has elements of type <U4; compare it by numpy.array_equal; if it holds numbers, "
     "convert it by .astype(numpy.float64)"),
    (b"bytes", "has elements of type |S5; compare it by numpy.array_equal; if it holds numbers, "
     "convert it by .astype(numpy.float64)"),
    (np.zeros(3, "M8[s]"), "has elements of type datetime64[s]; compare what is stored, by "
     ".view(numpy.int64)"),
    (np.zeros(3, "m8[D]"), "has elements of type timedelta64[D]; compare what is stored, by "
     ".view(numpy.int64)"),
    (np.zeros(3, [("x", "f8"), ("y", "i4")]), "has elements of type [('x', '<f8'), ('y', '<i4')]; "
     "compare it field by field"),
    (np.zeros(3, "V4"), "has elements of type |V4; convert it to a type of numbers, as by .view or "
     ".astype"),
    (np.zeros(3, "longdouble"), "has elements of type float128; round it to doubles, by "
     ".astype(numpy.float64)"),
    (np.zeros(3, "clongdouble"), "has elements of type complex256; round it to doubles, by "
     ".astype(numpy.complex128)"),
    (dask.array.zeros(3), "is a Dask collection; use talnumericarray.dask, or .compute()"),
]


@pytest.mark.parametrize("value, message", NO_ARRAYS)
def test_what_is_no_array_of_numbers(value, message):
    for function in (tna.same, tna.equivalent, tna.compare, tna.assert_same):
        for arguments, name in (((value, ARRAY), "first"), ((ARRAY, value), "second"),
                                ((value, value), "first")):
            with pytest.raises(TypeError) as raised:
                function(*arguments)
            assert str(raised.value) == f"{name} {message}"
    with pytest.raises(TypeError) as raised:
        tna.compare(value, ARRAY, names=("mine", "yours"))
    assert str(raised.value) == f"mine {message}"


def test_dataset():
    dataset = xarray.Dataset({"x": ("i", [1, 2, 3])})
    for function in (tna.same, tna.equivalent, tna.compare):
        with pytest.raises(TypeError) as raised:
            function(ARRAY, dataset)
        assert str(raised.value) == \
            "second is a dataset; use assert_same, or compare its variables one by one"


def test_errors_of_objects_are_passed_on():
    class Broken:
        def __array__(self, dtype=None):
            raise LookupError("my own")

        __float__ = __bool__ = __index__ = __array__

    for function in (tna.same, tna.equivalent, tna.compare, tna.assert_same):
        with pytest.raises(LookupError, match="^'?my own'?$"):
            function(Broken(), ARRAY)
    for name in ("tol", "relative", "absolute", "equal_nan", "threads", "slices", "ignore"):
        for function in (tna.same, tna.compare, tna.assert_same):
            with pytest.raises(LookupError, match="^'?my own'?$"):
                function(ARRAY, ARRAY, **{name: Broken()})
    with pytest.raises(ValueError, match="inhomogeneous"):
        tna.same([[1], [2, 3]], ARRAY)


DIGITS = "tol takes a number of binary digits, such as 10 or 2.5, not "
RELATIVE = "relative takes an error between 0 and 1, such as 1e-9, not "
ABSOLUTE = "absolute takes an error from 0 to 1e300, such as 1e-12, not "
THREADS = "threads takes a whole number from 1 to 64, not "
PLACES = "max_places takes a whole number from 1 to 1000000, not "
BOTH = "tol and relative both say how much reals may differ; give one"
BOOLEANS = "; it takes an array of booleans, True where nothing is compared"
SHAPE = ", not that of first, which is (3,)"

OPTIONS = [
    (dict(tol=np.nan), ValueError, DIGITS + "nan"),
    (dict(tol="x"), TypeError, DIGITS + "'x'"),
    (dict(tol=[1]), TypeError, DIGITS + "[1]"),
    (dict(tol=10**400), ValueError, DIGITS + str(10**400)),
    (dict(tol=1, relative=0.1), ValueError, BOTH),
    (dict(relative=0.1, tol=0), ValueError, BOTH),
    (dict(relative=0), ValueError, RELATIVE + "0"),
    (dict(relative=1.0), ValueError, RELATIVE + "1.0"),
    (dict(relative=-1), ValueError, RELATIVE + "-1"),
    (dict(relative=np.nan), ValueError, RELATIVE + "nan"),
    (dict(relative="1e-9"), TypeError, RELATIVE + "'1e-9'"),
    (dict(absolute=-1), ValueError, ABSOLUTE + "-1"),
    (dict(absolute=1.1e300), ValueError, ABSOLUTE + "1.1e+300"),
    (dict(absolute=np.inf), ValueError, ABSOLUTE + "inf"),
    (dict(absolute=np.nan), ValueError, ABSOLUTE + "nan"),
    (dict(absolute="1"), TypeError, ABSOLUTE + "'1'"),
    (dict(threads=0), ValueError, THREADS + "0"),
    (dict(threads=65), ValueError, THREADS + "65"),
    (dict(threads=-10**30), ValueError, THREADS + str(-10**30)),
    (dict(threads=1.5), TypeError, THREADS + "1.5"),
    (dict(threads="2"), TypeError, THREADS + "'2'"),
    (dict(max_places=0), ValueError, PLACES + "0"),
    (dict(max_places=1000001), ValueError, PLACES + "1000001"),
    (dict(max_places="1"), TypeError, PLACES + "'1'"),
    (dict(names=1), TypeError, "names takes two texts, not 1"),
    (dict(names="ab"), TypeError, "names takes two texts, not 'ab'"),
    (dict(names=("a",)), TypeError, "names takes two texts, not ('a',)"),
    (dict(names=("a", 1)), TypeError, "names takes two texts, not ('a', 1)"),
    (dict(progress=1), TypeError, "progress takes a function of two numbers, not 1"),
    (dict(slices=(0, 0)), ValueError, "slices are for 2 dimensions, but first has 1"),
    (dict(slices="0,...,0"), ValueError, "slices are for 2 dimensions, but first has 1"),
    (dict(slices=3), ValueError, "first: has no index 3 in axis 0, whose length is 3"),
    (dict(slices=-4), ValueError, "first: has no index -4 in axis 0, whose length is 3"),
    (dict(slices=slice(0, 1, 0)), ValueError, "slices: a step is 0"),
    (dict(slices="::0"), ValueError, "slices: a step is 0"),
    (dict(slices="a"), ValueError, "slices: 'a' is no index"),
    (dict(slices="1.5"), ValueError, "slices: '1.5' is no index"),
    (dict(slices=""), ValueError, "slices: an axis has neither an index nor a colon"),
    (dict(slices=":::"), ValueError, "slices: ':::' has more than two colons"),
    (dict(slices=(..., ...)), ValueError, "slices: there is more than one '...'"),
    (dict(slices="...,..."), ValueError, "slices: there is more than one '...'"),
    (dict(slices=1.5), TypeError, f"slices takes {INTEGERS}, not 1.5"),
    (dict(slices=[0]), TypeError, f"slices takes {INTEGERS}, not [0]"),
    (dict(slices=(None,)), TypeError, f"slices takes {INTEGERS}, not None"),
    (dict(slices=slice("a")), TypeError, f"slices takes {INTEGERS}, not 'a'"),
    (dict(ignore=[1, 0, 1]), TypeError, "ignore has elements of type int64" + BOOLEANS),
    (dict(ignore="x"), TypeError, "ignore has elements of type <U1" + BOOLEANS),
    (dict(ignore=np.ma.array([True] * 3)), TypeError, "ignore is a masked array; fill it by "
     ".filled(value), or compare its .data and leave out what is masked by ignore="),
    (dict(ignore=[True]), ValueError, "ignore: has the shape (1,)" + SHAPE),
    (dict(ignore=True), ValueError, "ignore: has the shape ()" + SHAPE),
    (dict(ignore=np.zeros((3, 1), "?")), ValueError, "ignore: has the shape (3, 1)" + SHAPE),
]


@pytest.mark.parametrize("options, kind, message", OPTIONS)
def test_options(options, kind, message):
    functions = [tna.compare, tna.assert_same]
    if not {"max_places", "names"} & options.keys():
        functions.append(tna.same)
    for function in functions:
        with pytest.raises(kind) as raised:
            function(ARRAY, ARRAY, **options)
        assert (type(raised.value), str(raised.value)) == (kind, message)


@pytest.mark.parametrize("function, name", [(tna.same, "same"), (tna.compare, "compare")])
def test_unknown_keyword(function, name):
    with pytest.raises(TypeError) as raised:
        function(ARRAY, ARRAY, rtol=1e-9)
    assert str(raised.value) == f"{name}() got an unexpected keyword argument 'rtol'"


def test_flag_without_truth():
    for name in ("equal_nan", "strict_type", "squeeze"):
        with pytest.raises(ValueError, match="^The truth value of an array"):
            tna.same(ARRAY, ARRAY, **{name: ARRAY})


@pytest.mark.parametrize("function, name", [(tna.same, "same"), (tna.equivalent, "equivalent")])
def test_numbers_of_arguments(function, name):
    for count in (0, 1, 3):
        with pytest.raises(TypeError) as raised:
            function(*[ARRAY] * count)
        assert str(raised.value) == f"{name}() takes two arrays, not {count} arguments"


def test_compare_takes_two_arrays_by_position():
    for function in (tna.compare, tna.assert_same):
        for count in (0, 1, 3):
            with pytest.raises(TypeError, match="positional argument"):
                function(*[ARRAY] * count)
        with pytest.raises(TypeError, match="positional"):
            function(first=ARRAY, second=ARRAY)


def test_none_stands_for_the_default():
    everything = dict.fromkeys(["tol", "relative", "absolute", "equal_nan", "strict_type",
                                "squeeze", "slices", "ignore", "threads", "progress"])
    assert tna.same(ARRAY, ARRAY, **everything) is True
    assert tna.compare(ARRAY, ARRAY, max_places=None, names=None, **everything) \
        == tna.compare(ARRAY, ARRAY)
    assert tna.same(ARRAY, ARRAY, **{**everything, "relative": 0.1}) is True


def test_shapes_for_slices():
    square = np.zeros((2, 2))
    for first, second, name in ((square, ARRAY, "second"), (ARRAY, square, "first")):
        with pytest.raises(ValueError) as raised:
            tna.same(first, second, slices=(0, 0))
        assert str(raised.value) == f"slices are for 2 dimensions, but {name} has 1"


def test_warning_of_an_error_taken_for_digits():
    expected = "tol=0.001 means 0.001 binary digits; a relative error is relative=0.001"
    for function in (tna.same, tna.compare):
        with warnings.catch_warnings(record=True) as caught:
            warnings.simplefilter("always")
            function(ARRAY, ARRAY, tol=0.001)
        assert [(each.category, str(each.message)) for each in caught] == [(UserWarning, expected)]
        with warnings.catch_warnings():
            warnings.simplefilter("error")
            with pytest.raises(UserWarning) as raised:
                function(ARRAY, ARRAY, tol=0.001)
            assert str(raised.value) == expected
            function(ARRAY, ARRAY, tol=1)
            function(ARRAY, ARRAY, tol=0)
            function(ARRAY, ARRAY, tol=-0.5)


def test_a_comparison_is_no_truth_value():
    with pytest.raises(TypeError) as raised:
        bool(tna.compare(ARRAY, ARRAY))
    assert str(raised.value) == "a comparison is neither true nor false; ask for its .same"
