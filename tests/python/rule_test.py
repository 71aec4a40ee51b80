"""Every field of a comparison, for arrays that Hypothesis draws, by a rule in exact fractions."""

import dataclasses
import os
import random
import warnings

import numpy as np
import pytest
from hypothesis import HealthCheck, assume, given, settings
from hypothesis import strategies as st

import drawn_arrays
import exact_rule
import talnumericarray as tna

EXAMPLES = int(os.environ.get("TALNUMERICARRAY_PYTHON_EXAMPLES", 1000))
drawn = settings(max_examples=EXAMPLES, deadline=None, database=None, print_blob=True,
                 suppress_health_check=list(HealthCheck))


def shown(field):
    """A field so that NaNs and zeros compare by what they print as."""
    if isinstance(field, tuple):
        return tuple(map(shown, field))
    if dataclasses.is_dataclass(field):
        return tuple(shown(getattr(field, each.name)) for each in dataclasses.fields(field))
    return type(field), repr(field)


def fields_of(comparison):
    return {field.name: shown(getattr(comparison, field.name))
            for field in dataclasses.fields(comparison)}


def check(first, second, options, extra):
    try:
        expected = exact_rule.comparison_of(first, second, **options)
    except exact_rule.InDoubt:
        assume(False)
    text = exact_rule.text_of(expected, **options)
    with warnings.catch_warnings():
        warnings.simplefilter("ignore")
        found = tna.compare(first, second, **options, **extra)
        alone = {name: each for name, each in options.items() if name != "max_places"}
        same = tna.same(first, second, **alone, **extra)
    assert str(found) == text
    assert fields_of(found) == {name: shown(each) for name, each in
                                {**expected, "text": text}.items()}
    assert found.same is same is (expected["difference"] is None)


@drawn
@given(st.randoms(use_true_random=False), st.sampled_from([None, 1, 2, 64]), st.booleans())
def test_comparison_of_drawn_arrays(rng, threads, with_progress):
    first, second, options = drawn_arrays.case(rng)
    extra = {} if threads is None else {"threads": threads}
    if with_progress:
        extra["progress"] = lambda done, total: None
    check(first, second, options, extra)
    if "ignore" not in options or first.shape == second.shape:
        check(second, first, options, extra)


@drawn
@given(st.randoms(use_true_random=False))
def test_same_without_options(rng):
    """The shortest way through the library is for arrays in one order, without options."""
    type1, type2 = rng.choice(drawn_arrays.TYPES), rng.choice(drawn_arrays.TYPES)
    first, second = drawn_arrays.arrays(rng, type1, type2, drawn_arrays.shape(rng))
    order = rng.choice(["C", "F"])
    first, second = np.asarray(first, order=order), np.asarray(second, order=order)
    tolerance = rng.choice(drawn_arrays.TOLERANCES)
    try:
        expected = exact_rule.comparison_of(first, second, tol=tolerance)
    except exact_rule.InDoubt:
        assume(False)
    with warnings.catch_warnings():
        warnings.simplefilter("ignore")
        assert tna.same(first, second, tol=tolerance) is (expected["difference"] is None)
        assert tna.same(second, first, tol=tolerance) is (expected["difference"] is None)
    assert tna.equivalent(first, second) is (type1 == type2)


def test_every_pair_of_types():
    """Hypothesis draws pairs of types; here is each one, with many elements."""
    rng = random.Random(1)
    for type1 in drawn_arrays.TYPES:
        for type2 in drawn_arrays.TYPES:
            first, second = drawn_arrays.arrays(rng, type1, type2, (3, 7))
            check(drawn_arrays.stored(rng, first), drawn_arrays.stored(rng, second),
                  {"tol": rng.choice([0, 1, 10, 52]), "max_places": 100}, {})


@pytest.mark.parametrize("dtype", ["f4", "f8"])
def test_differences_of_every_size(dtype):
    """From one unit to more than all digits, of numbers of all magnitudes, side by side: also of
    the smallest ones, whose differences have no more digits."""
    info = np.finfo(dtype)
    smallest = float(info.smallest_normal)
    bases = [smallest * factor for factor in (0.25, 0.75, 1, 1.5, 2, 3.75, 2.0**10, 2.0**info.nmant)]
    bases += [1.0, 1.75, float(info.max) / 4]
    first = np.repeat(np.array(bases, dtype), info.nmant + 2)
    bits = first.view(f"u{first.itemsize}")
    steps = np.tile([1 << step for step in range(info.nmant + 2)], len(bases)).astype(bits.dtype)
    for second in ((bits + steps).view(dtype), (bits + steps // 2 * 3).view(dtype)):
        for options in ({"max_places": 10000}, {"tol": info.nmant // 2, "max_places": 10000}):
            check(first, second, options, {})
        check(-second * dtype_complex(dtype), -first * dtype_complex(dtype), options, {})


def dtype_complex(dtype):
    """The imaginary unit, so that products are exact."""
    return np.array(1j, {"f4": "c8", "f8": "c16"}[dtype])
