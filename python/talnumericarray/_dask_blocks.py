"""What is compared of two Dask arrays, block by block.

Blocks of both arrays are cut where either array's blocks end, so that each task compares a part of
one block with a part of another, and no block is copied into a larger one.
"""

from __future__ import annotations

import itertools
import math
from dataclasses import dataclass
from typing import Any, Callable, Dict, Iterator, List, NamedTuple, Optional, Sequence, Tuple

import dask
import dask.array
import numpy

from talnumericarray import _core
from talnumericarray._comparison import Comparison, comparison_of

Options = Dict[str, Any]
Slices = Tuple[slice, ...]


class Header(NamedTuple):
    """What is known of an array without its elements."""

    dtype: Any
    shape: Tuple[int, ...]
    selected_shape: Tuple[int, ...]


class Part(NamedTuple):
    """A part of a block."""

    block_shape: Tuple[int, ...]
    slices: Slices


class PairOfBlocks(NamedTuple):
    """Parts of a block of each array that are compared; a part of the mask, if any, is third."""

    number: int
    """The row-major number, in the first array, of the first element."""
    keys: List[Any]
    parts: List[Part]


class _Selected(NamedTuple):
    """What `slices` and `squeeze` leave of an array."""

    array: dask.array.Array
    number: int
    """The row-major number, in the whole array, of the first element."""
    strides: List[int]
    """How far the numbers of neighbours along each axis are apart."""


# ---- Selection


def _dask_array(array: Any, name: str, like: Any) -> dask.array.Array:
    """The array with blocks; one without any gets those of `like` if it can."""
    if dask.is_dask_collection(array):
        array = getattr(array, "data", array)  # of xarray's
        if not isinstance(array, dask.array.Array):
            raise TypeError(
                f"{name} is a Dask collection, but no array; make it one, as by "
                "dask.array.from_delayed or .to_dask_array(lengths=True)"
            )
    if not isinstance(array, dask.array.Array):
        array = numpy.asanyarray(array)
        one_shape = isinstance(like, dask.array.Array) and like.shape == array.shape
        array = dask.array.from_array(array, chunks=like.chunks if one_shape else -1)
    if any(math.isnan(length) for length in array.shape):
        raise ValueError(
            f"{name} has blocks of unknown size; call its compute_chunk_sizes() first"
        )
    return array


def _mask(ignore: Any, first: dask.array.Array, name: str) -> dask.array.Array:
    mask = _dask_array(ignore, "ignore", first)
    _core.compare(mask._meta, mask._meta, names=("ignore", "ignore"))  # refuses masked arrays
    if mask.dtype != bool:
        raise TypeError(
            f"ignore has elements of type {mask.dtype}; it takes an array of booleans, True where "
            "nothing is compared"
        )
    if mask.shape != first.shape:
        raise ValueError(
            f"ignore: has the shape {mask.shape}, not that of {name}, which is {first.shape}"
        )
    return mask


def _index(item: str) -> Any:
    if item == "...":
        return Ellipsis
    if ":" not in item:
        return int(item)
    return slice(*(int(bound) if bound.strip() else None for bound in item.split(":")))


def _item_for_each_axis(slices: Any, name: str, rank: int) -> List[Any]:
    """From the argument `slices`, whose form has been checked."""
    if slices is None:
        slices = ()
    if isinstance(slices, str):
        slices = tuple(_index(item.strip()) for item in slices.split(","))
    items = list(slices) if isinstance(slices, tuple) else [slices]
    is_rest = [item is Ellipsis for item in items]
    before = is_rest.index(True) if any(is_rest) else len(items)
    after = items[before + 1 :]
    named = before + len(after)
    if named > rank:
        raise ValueError(f"slices are for {named} dimensions, but {name} has {rank}")
    return items[:before] + [slice(None)] * (rank - named) + after


def _selected(array: dask.array.Array, name: str, slices: Any, squeeze: bool) -> _Selected:
    """In ascending order along each axis, whatever the signs of steps, so that places are found in
    row-major order.
    """
    index: List[Any] = []
    number = 0
    strides: List[int] = []
    stride = math.prod(array.shape)
    items = _item_for_each_axis(slices, name, array.ndim)
    for axis, (item, length) in enumerate(zip(items, array.shape)):
        stride //= max(length, 1)
        if isinstance(item, slice):
            chosen = range(length)[item]
            chosen = chosen if chosen.step > 0 else chosen[::-1]
        elif -length <= item < length:
            chosen = range(item % length, item % length + 1)
        else:
            raise ValueError(
                f"{name}: has no index {item} in axis {axis}, whose length is {length}"
            )
        number += chosen[0] * stride if chosen else 0
        if len(chosen) == 1 and (squeeze or not isinstance(item, slice)):
            index.append(chosen[0])
        else:
            index.append(slice(chosen.start, chosen.stop, chosen.step))
            strides.append(chosen.step * stride)
    return _Selected(array[tuple(index)], number, strides)


# ---- Two arrays, and what is asked about them


class Conclusion(NamedTuple):
    """The last task."""

    headers: Tuple[Header, Header]
    options: Options

    def of(self, findings: Optional[_core.Findings]) -> Comparison:
        return comparison_of(_core.conclude(findings, *self.headers, **self.options))


@dataclass(frozen=True, eq=False)  # with identity, so that a cluster pickles it once
class Comparer:
    """What all tasks that compare have in common."""

    options: Options
    types: List[Any]
    strides: List[int]

    def is_same(self, parts: List[Part], *blocks: Any) -> bool:
        first, second, options = self._arguments(parts, blocks)
        options.pop("names", None)
        return _core.same(first, second, **options)

    def find(self, number: int, parts: List[Part], *blocks: Any) -> _core.Findings:
        first, second, options = self._arguments(parts, blocks)
        return _core.find(first, second, number, self.strides, **options)

    def _arguments(self, parts: List[Part], blocks: Sequence[Any]) -> Tuple[Any, Any, Options]:
        names = (*self.options.get("names", ("first", "second")), "ignore")
        first, second, *mask = map(_elements, names, self.types, parts, blocks)
        return first, second, {**self.options, **({"ignore": mask[0]} if mask else {})}


def _elements(name: str, dtype: Any, part: Part, block: Any) -> Any:
    """Those of a part of a block. Dask does not check that a block is what its array says, and what
    is found is understood by what the array says.
    """
    block = numpy.asanyarray(block)
    if block.dtype.newbyteorder("=") != dtype.newbyteorder("=") or block.shape != part.block_shape:
        raise ValueError(
            f"{name} has a block of type {block.dtype} and shape {block.shape}, but should have "
            f"one of type {dtype} and shape {part.block_shape}; give dtype and chunks to what "
            "makes the Dask array as its blocks have them"
        )
    return block[part.slices]


class Problem:
    """Two arrays and what `function`, `_core.compare` or `_core.same`, is asked about them; raises
    what that raises, but for what only the elements show.
    """

    def __init__(
        self, function: Callable[..., object], first: Any, second: Any, options: Options
    ) -> None:
        if options.get("progress") is not None:
            raise TypeError("progress is shown by dask.diagnostics.ProgressBar or the dashboard")
        names = options.get("names") or ("first", "second")
        whole = [_dask_array(first, names[0], second), _dask_array(second, names[1], first)]
        of_no_elements = {**options, "slices": None, "ignore": None}
        function(*(array._meta for array in whole), **of_no_elements)
        options = {name: value for name, value in options.items() if value is not None}
        ignore = options.pop("ignore", None)
        Conclusion(_headers(whole, whole), options).of(None)  # refuses slices that have no meaning
        slices, squeeze = options.pop("slices", None), options.pop("squeeze", False)
        selected = [_selected(array, name, slices, squeeze) for array, name in zip(whole, names)]
        self.arrays = [part.array for part in selected]
        self.number, self.strides = selected[0].number, selected[0].strides
        self.conclusion = Conclusion(_headers(whole, self.arrays), options)
        if ignore is not None:
            mask = _mask(ignore, whole[0], names[0])
            self.arrays.append(_selected(mask, "ignore", slices, squeeze).array)
        types = [array.dtype for array in self.arrays]
        self.comparer = Comparer({"threads": 1, **options}, types, self.strides)

    def pairs(self) -> Iterator[PairOfBlocks]:
        """In row-major order; none if the shapes differ."""
        shape = self.arrays[0].shape
        if shape != self.arrays[1].shape or not all(shape):
            return
        axes = [_cut(lengths) for lengths in zip(*(array.chunks for array in self.arrays))]
        for cuts in itertools.product(*axes):
            number = self.number + sum(cut.start * s for cut, s in zip(cuts, self.strides))
            keys, parts = [], []
            for which, array in enumerate(self.arrays):
                sides = [cut.sides[which] for cut in cuts]
                keys.append((array.name, *(side.block for side in sides)))
                parts.append(Part(tuple(s.length for s in sides), tuple(s.part for s in sides)))
            yield PairOfBlocks(number, keys, parts)


def _headers(
    whole: List[dask.array.Array], selected: List[dask.array.Array]
) -> Tuple[Header, Header]:
    first, second = (Header(w.dtype, w.shape, s.shape) for w, s in zip(whole, selected))
    return first, second


# ---- Cutting


class _Side(NamedTuple):
    """Where a cut is in one of the arrays."""

    block: int
    length: int
    """Of the block."""
    part: slice


class _Cut(NamedTuple):
    """Indices along an axis that are in one block of each array."""

    start: int
    sides: List[_Side]


def _cut(lengths: Sequence[Tuple[int, ...]]) -> List[_Cut]:
    """Cuts an axis where any array's blocks end; there are no cuts without indices."""
    ends = [list(itertools.accumulate(of_array)) for of_array in lengths]
    bounds = [0, *sorted({end for of_array in ends for end in of_array} - {0})]
    blocks = [0] * len(lengths)
    cuts = []
    for start, stop in zip(bounds, bounds[1:]):
        sides = []
        for which, of_array in enumerate(lengths):
            while ends[which][blocks[which]] <= start:
                blocks[which] += 1
            block = blocks[which]
            begin = ends[which][block] - of_array[block]
            sides.append(_Side(block, of_array[block], slice(start - begin, stop - begin)))
        cuts.append(_Cut(start, sides))
    return cuts
