"""`talnumericarray.dask` answers what `talnumericarray` answers about the whole arrays."""

from __future__ import annotations

import pickle
import random
import subprocess
import sys
import threading
from typing import Any, Dict, List, Tuple

import dask
import dask.array as da
import numpy as np
import pytest

import talnumericarray as tna
import talnumericarray.dask as td

TYPES = ["i1", "u1", "i2", "u2", "i4", "u4", "i8", "u8", "f4", "f8", "c8", "c16", "f2", "?", ">f8"]
SPECIAL = [0.0, -0.0, np.nan, np.inf, -np.inf, 5e-324, 1.0, 1.0 + 2.0**-52]


# ---- Random calls


def random_lengths(draw: random.Random, length: int) -> Tuple[int, ...]:
    """Of the blocks along an axis, some without elements."""
    bounds = sorted(draw.choices(range(length + 1), k=draw.choice([0, 1, 2, 4])))
    return tuple(b - a for a, b in zip([0, *bounds], [*bounds, length]))


def random_values(draw: random.Random, shape: Tuple[int, ...], dtype: Any) -> Any:
    numbers = np.random.default_rng(draw.getrandbits(32))
    values = np.asarray(numbers.integers(0, 3, shape), float)
    special = numbers.choice(SPECIAL, shape)
    real = np.where(numbers.random(shape) < 0.2, special, values)
    if dtype.kind not in "fc":
        return values.astype(dtype)
    return np.asarray(real * (1 + 2j) if dtype.kind == "c" else real).astype(dtype)


def other_values(draw: random.Random, values: Any) -> Any:
    """The same but in a few places, or but for rounding."""
    numbers = np.random.default_rng(draw.getrandbits(32))
    if draw.random() < 0.3 and values.dtype.kind in "fc":
        rounding = 1 + numbers.random(values.shape) * 2.0**-20
        with np.errstate(invalid="ignore"):
            return np.asarray(values * rounding, values.dtype)
    places = numbers.random(values.shape) < draw.choice([0, 0, 0.02, 0.3])
    other = np.where(places, random_values(draw, values.shape, values.dtype), values)
    dtype = draw.choice([values.dtype, np.dtype("f8"), np.dtype("c16")])
    return other if other.dtype.kind == "c" and dtype.kind != "c" else other.astype(dtype)


def random_slices(draw: random.Random, shape: Tuple[int, ...]) -> Any:
    items: List[Any] = []
    for length in shape[: draw.randint(0, len(shape))]:
        if length and draw.random() < 0.25:
            items.append(draw.randrange(-length, length))
        else:
            bounds = [draw.choice([None, draw.randint(-length - 1, length + 1)]) for _ in "ab"]
            items.append(slice(*bounds, draw.choice([None, 1, 2, -1, -3])))
    if draw.random() < 0.3:
        items.insert(draw.randint(0, len(items)), Ellipsis)
    if not items or draw.random() < 0.5:
        return tuple(items)
    return ",".join(slice_text(item) for item in items)


def slice_text(item: Any) -> str:
    if item is Ellipsis:
        return "..."
    if not isinstance(item, slice):
        return str(item)
    bounds = ["" if bound is None else str(bound) for bound in (item.start, item.stop)]
    return ":".join(bounds if item.step is None else [*bounds, str(item.step)])


def random_options(draw: random.Random, shape: Tuple[int, ...]) -> Dict[str, Any]:
    every = {
        draw.choice(["tol", "relative"]): draw.choice([0.25, 2.0**-20]),
        "absolute": 2.0**-50,
        "equal_nan": True,
        "strict_type": True,
        "squeeze": True,
        "slices": random_slices(draw, shape),
        "ignore": np.random.default_rng(draw.getrandbits(32)).random(shape) < 0.3,
        "threads": 2,
    }
    options = {name: value for name, value in every.items() if draw.random() < 0.25}
    if "tol" in options:
        options["tol"] = draw.choice([1, 2.5, 33, 53])
    return options


def random_call(seed: int) -> Tuple[Any, Any, Dict[str, Any], Dict[str, Any], Any]:
    """Two arrays, options, those that only `compare` has, and a function that makes blocks."""
    draw = random.Random(seed)
    shape = tuple(draw.choice([0, 1, 2, 3, 5, 9]) for _ in range(draw.randint(0, 4)))
    first = random_values(draw, shape, np.dtype(draw.choice(TYPES)))
    second = other_values(draw, first)
    if draw.random() < 0.05:
        second = second[np.newaxis]
    report = {"max_places": draw.choice([1, 3, 1000]), "names": ("a", "b")}

    def blocks(array: Any) -> Any:
        if draw.random() < 0.1:
            return array
        return da.from_array(array, chunks=tuple(random_lengths(draw, n) for n in array.shape))

    return first, second, random_options(draw, shape), report, blocks


SEEDS = [*range(300), random.getrandbits(32)]


@pytest.mark.parametrize("scheduler, seeds", [("sync", SEEDS), ("threads", SEEDS[:50])])
def test_answers_are_those_for_whole_arrays(scheduler: str, seeds: List[int]) -> None:
    differing, empty = 0, 0
    for seed in seeds:
        first, second, options, report, blocks = random_call(seed)
        whole = tna.compare(first, second, **options, **report)
        differing += not whole.same
        empty += whole.pairs == 0
        lazily = {**options}
        if "ignore" in options:
            lazily["ignore"] = blocks(options["ignore"])
        arrays = blocks(first), blocks(second)
        comparison = td.compare(*arrays, **lazily, **report).compute(scheduler=scheduler)
        assert comparison.text == whole.text, seed
        assert comparison == whole, seed
        assert values_of(comparison) == values_of(whole), seed
        same = td.same(*arrays, **lazily).compute(scheduler=scheduler)
        assert same is tna.same(first, second, **options), seed
    assert min(differing, len(seeds) - differing, empty) >= len(seeds) // 10


@pytest.mark.parametrize("slices", ["1:,::-2", (3, slice(None, 1, -1)), "...,1::2", (-2, ..., 1)])
@pytest.mark.parametrize("squeeze", [False, True])
def test_places_are_those_in_the_whole_array(slices: Any, squeeze: bool) -> None:
    first = np.arange(120.0).reshape(5, 6, 4)
    second = first + 1
    options: Dict[str, Any] = {"slices": slices, "squeeze": squeeze, "max_places": 1000}
    whole = tna.compare(first, second, **options)
    blocks = da.from_array(first, chunks=(2, 4, 3)), da.from_array(second, chunks=(3, 2, 2))
    assert len(whole.places) == whole.pairs > 5
    assert td.compare(*blocks, **options).compute() == whole


def values_of(comparison: tna.Comparison) -> List[str]:
    places = [*comparison.places, *([comparison.worst] if comparison.worst else [])]
    return [repr((place.first, place.second)) for place in places]


def test_answers_of_other_processes_are_the_same() -> None:
    for seed in SEEDS[:60]:
        first, second, options, report, blocks = random_call(seed)
        if first.ndim == second.ndim and tna.compare(first, second, **options).differing > 1:
            break
    answers = dask.compute(
        td.compare(blocks(first), blocks(second), **options, **report),
        td.same(blocks(first), blocks(second), **options),
        td.same(da.from_array(first, chunks=1), blocks(first), tol=0),
        scheduler="processes",
        num_workers=2,
    )
    assert answers == (tna.compare(first, second, **options, **report), False, True)
    assert td.same(da.from_array(first, chunks=1), blocks(second), **options).compute(
        scheduler="processes", num_workers=2
    ) is False


# ---- Laziness


class Blocks:
    """An array that counts the blocks that are loaded."""

    def __init__(self, values: Any, broken: int = -1) -> None:
        self.values = values
        self.dtype, self.shape, self.ndim = values.dtype, values.shape, values.ndim
        self.broken = broken
        self.loaded: List[int] = []
        self.lock = threading.Lock()

    def __getitem__(self, index: Any) -> Any:
        with self.lock:
            self.loaded.append(index[0].start)
        if index[0].start == self.broken:
            raise OSError(f"row {self.broken} cannot be read")
        return self.values[index]


def lazy_blocks(values: Any, broken: int = -1) -> Tuple[Any, Blocks]:
    """One for each row."""
    blocks = Blocks(values, broken)
    return da.from_array(blocks, chunks=(1, *values.shape[1:]), meta=values[:0]), blocks


def test_nothing_is_loaded_before_compute() -> None:
    values = np.arange(12.0).reshape(4, 3)
    first, loaded1 = lazy_blocks(values)
    second, loaded2 = lazy_blocks(values)
    comparison, same = td.compare(first, second), td.same(first, second)
    assert repr(comparison) == "<LazyComparison of 4 pairs of blocks>"
    assert repr(same) == "<LazySame of 4 pairs of blocks>"
    for lazy in (comparison, same):
        with pytest.raises(TypeError, match=r"^nothing has been compared yet; call \.compute\(\)$"):
            bool(lazy)
    assert loaded1.loaded == loaded2.loaded == []
    assert same.compute() is True
    assert sorted(loaded1.loaded) == sorted(loaded2.loaded) == [0, 1, 2, 3]


def test_blocks_are_cut_where_those_of_either_array_end() -> None:
    first = da.zeros((10, 6), chunks=((4, 6), (6,)))
    second = da.zeros((10, 6), chunks=((0, 4, 3, 3), (2, 0, 4)))
    assert td.compare(first, second).pairs_of_blocks == 3 * 2
    assert td.compare(first, second, slices="4:7").pairs_of_blocks == 2
    assert td.compare(first, second[:5]).pairs_of_blocks == 0
    assert td.same(first, second.astype("f4"), strict_type=True).pairs_of_blocks == 0
    assert td.compare(first, second.astype("f4"), strict_type=True).pairs_of_blocks == 3 * 2
    assert td.compare(first[:0], second[:0]).pairs_of_blocks == 0


def test_no_block_is_larger_than_those_of_the_arrays() -> None:
    sizes = []

    def seen(block: Any) -> Any:
        sizes.append(block.shape)
        return block

    first = da.zeros((64, 64), chunks=(64, 8)).map_blocks(seen, dtype=float)
    second = da.zeros((64, 64), chunks=(8, 64))
    merged = td.compare(first, second)
    assert merged.pairs_of_blocks == 64
    assert merged.compute().pairs == 64 * 64
    assert set(sizes) <= {(64, 8), (0, 0)} and sizes.count((64, 8)) == 8


@pytest.mark.parametrize("scheduler", ["threads", "sync"])
def test_same_stops_at_the_first_difference(scheduler: str) -> None:
    values = np.zeros((500, 10))
    other = values.copy()
    other[0] = 1
    first, blocks = lazy_blocks(values)
    second, _ = lazy_blocks(other)
    same = td.same(first, second)
    assert same.compute(scheduler=scheduler, num_workers=2) is False
    assert 1 <= len(blocks.loaded) <= 20
    # With other results nothing may be left out.
    blocks.loaded.clear()
    assert dask.compute(same, first.sum(), scheduler=scheduler) == (False, 0)
    assert sorted(set(blocks.loaded)) == list(range(500))


def test_several_results_at_once_and_persisted_ones() -> None:
    first, second = da.arange(100, chunks=7), da.arange(100, chunks=9)
    other = da.where(second == 50, 0, second)
    lazy = [
        td.compare(first, second),
        td.compare(first, other),
        td.same(first, second),
        td.same(first, other),
        td.same(first, second[:-1]),
    ]
    whole = np.arange(100)
    wrong = np.where(whole == 50, 0, whole)
    expected = (tna.compare(whole, whole), tna.compare(whole, wrong), True, False, False)
    assert dask.compute(*lazy) == expected
    assert tuple(one.compute() for one in lazy) == expected
    persisted = dask.persist(*lazy)
    assert [len(one.__dask_graph__()) for one in persisted] == [1] * 5
    assert dask.compute(*persisted) == expected
    assert tuple(one.persist().compute() for one in lazy) == expected
    assert tuple(pickle.loads(pickle.dumps(one)).compute() for one in lazy) == expected
    assert [repr(one) for one in persisted] == [repr(one) for one in lazy]


def test_the_same_question_has_the_same_key() -> None:
    first, second = da.arange(100, chunks=7), da.arange(100, chunks=9)
    keys = [
        td.compare(first, second),
        td.compare(first, second, tol=1),
        td.compare(first, second, slices="1:"),
        td.compare(first, second, ignore=first > 3),
        td.compare(first, second, ignore=first > 4),
        td.compare(first, second, names=("a", "b")),
        td.compare(second, first),
        td.same(first, second),
    ]
    assert len({dask.base.tokenize(key) for key in keys}) == len(keys)
    assert dask.base.tokenize(td.same(first, second)) == dask.base.tokenize(keys[-1])
    assert td.same(first, second).__dask_keys__() == keys[-1].__dask_keys__()


@pytest.mark.parametrize("scheduler", ["threads", "sync"])
def test_registered_callbacks_see_the_tasks(scheduler: str) -> None:
    shown: List[Any] = []
    zeros = da.zeros(3, chunks=1)
    with dask.callbacks.Callback(posttask=lambda key, *_: shown.append(key)):
        assert td.same(zeros, zeros).compute(scheduler=scheduler) is True
        assert len(shown) >= 3
        shown.clear()
        assert td.same(zeros, zeros + 1).compute(scheduler=scheduler) is False
        assert len(shown) >= 1


# ---- Errors


def test_errors_of_loading_come_through() -> None:
    values = np.zeros((6, 3))
    first, _ = lazy_blocks(values, broken=3)
    for lazy in (td.compare(first, da.zeros((6, 3), chunks=2)), td.same(first, values)):
        for scheduler in ("sync", "threads"):
            with pytest.raises(OSError, match=r"^row 3 cannot be read$"):
                lazy.compute(scheduler=scheduler)
    with pytest.raises(OSError, match=r"^row 3 cannot be read$"):
        td.assert_same(first, values)


def message(kind: type, call: Any) -> str:
    with pytest.raises(kind) as caught:
        call()
    return str(caught.value)


def test_blocks_have_to_be_what_the_array_says() -> None:
    of_type = da.zeros(6, chunks=3).map_blocks(lambda block: block.astype("f4"), dtype="f8")
    assert message(ValueError, td.compare(da.zeros(6, chunks=2), of_type).compute) == (
        "second has a block of type float32 and shape (3,), but should have one of type float64 "
        "and shape (3,); give dtype and chunks to what makes the Dask array as its blocks have them"
    )
    of_size = da.zeros(6, chunks=3).map_blocks(lambda block: block[:2], dtype="f8")
    for names in ({}, {"names": ("left", "right")}):
        name = names.get("names", ("first",))[0]
        assert message(ValueError, td.compare(of_size, of_size, **names).compute) == (
            f"{name} has a block of type float64 and shape (2,), but should have one of type "
            "float64 and shape (3,); give dtype and chunks to what makes the Dask array as its "
            "blocks have them"
        )


def test_blocks_of_another_shape_are_refused() -> None:
    assert message(ValueError, lambda: tna._core.find(np.zeros(3), np.zeros(4), 0, [1])) == (
        "first and second are blocks of different shapes"
    )
    assert message(ValueError, lambda: tna._core.find(np.zeros(3), np.zeros(3), 0, [1, 2])) == (
        "there are strides for 2 axes, but blocks have 1"
    )


REFUSED = {
    "tol": [{"tol": "x"}, {"tol": np.nan}],
    "relative": [{"relative": 2}, {"relative": 1e-3, "tol": 3}],
    "slices": [{"slices": "a:b"}, {"slices": "9"}, {"slices": (0, -5)}, {"slices": (0, 0, 0)}],
    "more slices": [{"slices": (..., ...)}, {"slices": slice(0, 1, 0)}, {"slices": "0,0,0"}],
    "ignore": [{"ignore": np.zeros(3, bool)}, {"ignore": np.zeros((3, 4))}],
    "masked": [{"ignore": np.ma.zeros((3, 4), bool)}],
    "unknown": [{"what": 1}, {"what": None}],
    "threads": [{"threads": 0}],
}


@pytest.mark.parametrize("options", [o for options in REFUSED.values() for o in options], ids=str)
@pytest.mark.parametrize("function", ["same", "compare"])
def test_options_are_refused_at_once_as_for_whole_arrays(
    function: str, options: Dict[str, Any]
) -> None:
    values = np.zeros((3, 4))
    array, blocks = lazy_blocks(values)

    def whole() -> None:
        getattr(tna, function)(values, values, **options)

    with pytest.raises((TypeError, ValueError)) as caught:
        whole()
    expected = str(caught.value)
    assert message(caught.type, lambda: getattr(td, function)(array, array, **options)) == expected
    assert blocks.loaded == []


@pytest.mark.parametrize(
    "other",
    [
        np.array(["a"] * 3),
        np.array([None] * 3),
        np.zeros(3, "M8[s]"),
        np.zeros(3, "m8[s]"),
        np.zeros(3, [("x", "f4")]),
        np.zeros(3, np.longdouble),
        np.ma.array([1.0, 2.0, 3.0], mask=[0, 1, 0]),
    ],
    ids=lambda array: str(array.dtype),
)
def test_arrays_are_refused_at_once_as_whole_ones(other: Any) -> None:
    numbers = np.zeros(3)
    names = {"names": ("left", "right")}
    for function, options in (("same", {}), ("compare", {}), ("compare", names)):
        whole, lazily = getattr(tna, function), getattr(td, function)
        for blocks in (da.from_array(other, chunks=2), other):
            assert message(
                TypeError, lambda: lazily(blocks, da.from_array(numbers), **options)
            ) == message(TypeError, lambda: whole(other, numbers, **options))
            assert message(
                TypeError, lambda: lazily(da.from_array(numbers), blocks, **options)
            ) == message(TypeError, lambda: whole(numbers, other, **options))


def test_other_collections_are_refused() -> None:
    known = da.zeros(10, chunks=4)
    unknown = known[known == 0]
    assert message(ValueError, lambda: td.same(known, unknown)) == (
        "second has blocks of unknown size; call its compute_chunk_sizes() first"
    )
    assert message(ValueError, lambda: td.compare(unknown, known, names=("a", "b"))) == (
        "a has blocks of unknown size; call its compute_chunk_sizes() first"
    )
    assert message(ValueError, lambda: td.same(known, known, ignore=unknown > 0)) == (
        "ignore has blocks of unknown size; call its compute_chunk_sizes() first"
    )
    assert message(TypeError, lambda: td.same(known, dask.delayed(np.zeros)(10))) == (
        "second is a Dask collection, but no array; make it one, as by dask.array.from_delayed or "
        ".to_dask_array(lengths=True)"
    )
    assert message(TypeError, lambda: td.same(known, known, progress=print)) == (
        "progress is shown by dask.diagnostics.ProgressBar or the dashboard"
    )
    for whole in (tna.same, tna.compare, tna.equivalent):
        assert message(TypeError, lambda: whole(known, np.zeros(10))) == (
            "first is a Dask collection; use talnumericarray.dask, or .compute()"
        )


def test_dask_arrays_in_xarray_are_not_computed() -> None:
    xarray = pytest.importorskip("xarray")
    first, blocks = lazy_blocks(np.zeros((4, 3)))
    lazy = td.same(xarray.DataArray(first), xarray.Variable(("x", "y"), first + 0))
    assert blocks.loaded == []
    assert lazy.compute() is True


# ---- Assertions


def test_assert_same_computes_at_once() -> None:
    first = da.arange(100, chunks=7)
    other = da.where(first == 50, 0, first).rechunk(9)
    td.assert_same(first, first.rechunk(9), names=("a", "b"), max_places=2, tol=0)
    whole = np.arange(100)
    expected = tna.compare(whole, np.where(whole == 50, 0, whole), names=("a", "b"), max_places=2)
    with pytest.raises(tna.NotSameError) as caught:
        td.assert_same(first, other, names=("a", "b"), max_places=2)
    assert str(caught.value) == expected.text
    assert caught.value.comparison == expected
    td.assert_same(first, other, ignore=first == 50)


def test_dask_is_imported_where_it_is_used_first() -> None:
    program = (
        "import sys; import talnumericarray as tna; assert 'dask' not in sys.modules; "
        "import numpy; print(tna.dask.same(numpy.ones(3), numpy.ones(3)).compute()); tna.other"
    )
    done = subprocess.run(
        [sys.executable, "-c", program], capture_output=True, text=True, check=False
    )
    assert done.stdout == "True\n"
    assert done.stderr.splitlines()[-1] == (
        "AttributeError: module 'talnumericarray' has no attribute 'other'"
    )
