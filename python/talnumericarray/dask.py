"""Compares Dask's arrays block by block, for arrays that no machine could hold.

Blocks of both arrays are cut where either array's blocks end, so that each task compares a part of
one block with a part of another, and no block is copied into a larger one. What was found is
merged as a tree. Answers and reports are exactly those for whole arrays.
"""

from __future__ import annotations

import functools
import itertools
import math
from typing import TYPE_CHECKING, Any, Dict, Iterator, List, NamedTuple, Optional, Sequence, Tuple

import dask
import dask.array
import dask.threaded
import numpy
from dask.base import DaskMethodsMixin, tokenize
from dask.callbacks import Callback
from dask.highlevelgraph import HighLevelGraph
from dask.optimization import cull, fuse

from talnumericarray import _core
from talnumericarray._assertions import NotSameError
from talnumericarray._comparison import Comparison, comparison_of
from talnumericarray._options import CompareOptions, SameOptions, shows

if TYPE_CHECKING:
    from typing_extensions import Unpack

__all__ = ["LazyComparison", "LazySame", "assert_same", "compare", "same"]

Key = Tuple[str, int]
Graph = Dict[Any, Any]


# ---- What is compared


class _Part(NamedTuple):
    """What is selected of an array, and which of the whole array's elements that is."""

    array: dask.array.Array
    number: int
    """The row-major number, in the whole array, of the first element."""
    strides: Tuple[int, ...]
    """Those of steps along the axes."""


def _dask_array(array: Any, like: Any) -> dask.array.Array:
    """The array with blocks; one without any gets those of `like` if it can."""
    if not isinstance(array, dask.array.Array):
        array = numpy.asanyarray(array)
        one_shape = isinstance(like, dask.array.Array) and like.shape == array.shape
        array = dask.array.from_array(array, chunks=like.chunks if one_shape else "auto")
    if any(math.isnan(length) for length in array.shape):
        raise ValueError(
            "an array has blocks of unknown size; call its compute_chunk_sizes() first"
        )
    return array


def _items(slices: Any, rank: int) -> List[Any]:
    """An item of an index for each axis, from the argument `slices`, which has been checked."""
    if slices is None:
        slices = ()
    if isinstance(slices, str):
        slices = tuple(_item(text.strip()) for text in slices.split(","))
    items = list(slices) if isinstance(slices, tuple) else [slices]
    if not any(item is Ellipsis for item in items):
        items.append(Ellipsis)
    where = next(i for i, item in enumerate(items) if item is Ellipsis)
    missing = rank - (len(items) - 1)
    if missing < 0:
        raise ValueError(
            f"slices are for {len(items) - 1} dimensions, but an array has {rank}"
        )
    return items[:where] + [slice(None)] * missing + items[where + 1 :]


def _item(text: str) -> Any:
    if text == "...":
        return Ellipsis
    if ":" not in text:
        return int(text)
    return slice(*(int(bound) if bound.strip() else None for bound in text.split(":")))


def _selected(array: dask.array.Array, slices: Any, squeeze: bool) -> _Part:
    """What `slices` and `squeeze` leave of an array, in ascending order along each axis."""
    index: List[Any] = []
    number = 0
    strides: List[int] = []
    stride = math.prod(array.shape)
    for item, length in zip(_items(slices, array.ndim), array.shape):
        stride //= max(length, 1)
        if isinstance(item, slice):
            chosen = range(length)[item]
            ascending = chosen if chosen.step > 0 else chosen[::-1]
            if squeeze and len(ascending) == 1:
                index.append(ascending[0])
            else:
                index.append(slice(ascending.start, ascending.stop, ascending.step))
                strides.append(ascending.step * stride)
            number += ascending.start * stride if len(ascending) else 0
        else:
            try:
                index.append(range(length)[item])
            except IndexError:
                raise ValueError(
                    f"an array has no index {item} in an axis whose length is {length}"
                ) from None
            number += index[-1] * stride
    return _Part(array[tuple(index)], number, tuple(strides))


class _Block(NamedTuple):
    """A part of a block of each array: its key, and where it is in it."""

    number: int
    sides: List[Tuple[Any, Tuple[slice, ...]]]


def _places(cuts: Sequence[int], lengths: Sequence[int]) -> List[Tuple[int, slice]]:
    """The block, and the place in it, of what is between each cut and the next along an axis."""
    places = []
    block, begin = 0, 0
    for start, stop in zip(cuts, cuts[1:]):
        while begin + lengths[block] <= start:
            begin += lengths[block]
            block += 1
        places.append((block, slice(start - begin, stop - begin)))
    return places


class _Problem:
    """Two arrays and what is asked about them; raises what `talnumericarray.compare` raises, but
    for what only the elements show.
    """

    def __init__(self, first: Any, second: Any, options: Dict[str, Any]) -> None:
        if options.get("progress") is not None:
            raise TypeError("progress is shown by dask.diagnostics.ProgressBar or the dashboard")
        self.options = {"threads": 1, **options}
        mask = self.options.pop("ignore", None)
        array1 = _dask_array(first, second)
        array2 = _dask_array(second, array1)
        _core.equivalent(array1._meta, array2._meta)  # refuses masked arrays and other types
        self._headers: Tuple[Any, Any] = (self._header(array1, array1), self._header(array2, array2))
        self.conclude(None)  # refuses options that have no meaning
        slices = self.options.pop("slices", None)
        squeeze = bool(self.options.pop("squeeze", None))
        self.first = _selected(array1, slices, squeeze)
        self.second = _selected(array2, slices, squeeze)
        self._headers = (
            self._header(array1, self.first.array),
            self._header(array2, self.second.array),
        )
        self.arrays = [self.first.array, self.second.array]
        if mask is not None:
            ignored = _dask_array(mask, array1)
            if ignored.dtype != bool:
                raise TypeError(
                    f"ignore has elements of type {ignored.dtype}; it takes an array of booleans, "
                    "True where nothing is compared"
                )
            if ignored.shape != array1.shape:
                raise ValueError(
                    f"ignore has the shape {ignored.shape}, not that of the first array, which is "
                    f"{array1.shape}"
                )
            self.arrays.append(_selected(ignored, slices, squeeze).array)

    @property
    def is_one_shape(self) -> bool:
        return bool(self.first.array.shape == self.second.array.shape)

    @property
    def has_elements(self) -> bool:
        return all(self.first.array.shape)

    @staticmethod
    def _header(whole: dask.array.Array, selected: dask.array.Array) -> Any:
        return (whole.dtype, whole.shape, selected.shape)

    def conclude(self, findings: Any) -> Comparison:
        return _conclude(self._headers, self.options, findings)

    @property
    def conclusion(self) -> Any:
        """The last task: a function of what was found, without the arrays."""
        return functools.partial(_conclude, self._headers, self.options)

    def blocks(self) -> Iterator[_Block]:
        """Cut where any array's blocks end, in row-major order."""
        cuts = [
            sorted(set(itertools.chain(*(numpy.cumsum((0, *lengths)).tolist() for lengths in axis))))
            for axis in zip(*(array.chunks for array in self.arrays))
        ]
        places = [[_places(axis, array.chunks[i]) for i, axis in enumerate(cuts)]
                  for array in self.arrays]
        for cell in itertools.product(*(range(len(axis) - 1) for axis in cuts)):
            number = self.first.number + sum(
                cuts[axis][i] * stride
                for axis, (i, stride) in enumerate(zip(cell, self.first.strides))
            )
            sides = []
            for array, axes in zip(self.arrays, places):
                place = [axes[axis][i] for axis, i in enumerate(cell)]
                key = (array.name, *(block for block, _ in place))
                sides.append((key, tuple(part for _, part in place)))
            yield _Block(number, sides)


# ---- Tasks


def _find(
    number: int, strides: Tuple[int, ...], options: Dict[str, Any], parts: Any, *blocks: Any
) -> Any:
    first, second, *mask = (block[part] for block, part in zip(blocks, parts))
    if mask:
        options = {**options, "ignore": mask[0]}
    return _core.find(first, second, number, strides, **options)


def _is_same(options: Dict[str, Any], parts: Any, *blocks: Any) -> bool:
    first, second, *mask = (block[part] for block, part in zip(blocks, parts))
    if mask:
        options = {**options, "ignore": mask[0]}
    return bool(_core.same(first, second, **options))


def _conclude(headers: Any, options: Dict[str, Any], findings: Any) -> Comparison:
    return comparison_of(_core.conclude(findings, *headers, **options))


def _and(known: bool, merged: Optional[bool]) -> bool:
    return known and merged is not False


def _merge(parts: List[Any]) -> Any:
    return _core.merge(parts)


# ---- Lazy answers


def _tree(leaves: List[Key], merge: Any, name: str, graph: Graph) -> Any:
    """Adds tasks that merge the leaves some at a time, and returns the key of the last."""
    at_once = 8
    level: List[Any] = list(leaves)
    for depth in itertools.count():
        if len(level) == 1:
            return level[0]
        groups = [level[i : i + at_once] for i in range(0, len(level), at_once)]
        level = [(f"{name}-{depth}", i) for i in range(len(groups))]
        graph.update((key, (merge, group)) for key, group in zip(level, groups))


class _Lazy(DaskMethodsMixin):  # type: ignore[misc]
    """A result that Dask computes: a tree of tasks, whose leaves compare blocks."""

    __dask_scheduler__ = staticmethod(dask.threaded.get)

    def __init__(self, graph: HighLevelGraph, layer: str, key: Any) -> None:
        self._graph = graph
        self._layer = layer
        self._key = key

    @classmethod
    def of(cls, problem: _Problem, task_of: Any, merge: Any, last: Any, needs_blocks: bool) -> Any:
        """`last` makes the result of what `merge` makes of the results of a task for each block; of
        None where no elements have to be compared.
        """
        name = tokenize(cls.__name__, *problem.arrays, problem.options)
        graph: Graph = {}
        leaves: List[Key] = []
        if needs_blocks and problem.has_elements:
            for block in problem.blocks():
                leaves.append((_LEAVES + name, len(leaves)))
                graph[leaves[-1]] = task_of(block)
        merged = _tree(leaves, merge, f"talnumericarray-merge-{name}", graph) if leaves else None
        key = f"talnumericarray-{name}"
        graph[key] = (last, merged)
        return cls(HighLevelGraph.from_collections(key, graph, dependencies=problem.arrays), key, key)

    def __dask_graph__(self) -> HighLevelGraph:
        return self._graph

    def __dask_keys__(self) -> List[Any]:
        return [self._key]

    def __dask_layers__(self) -> Tuple[str, ...]:
        return (self._layer,)

    def __dask_tokenize__(self) -> Any:
        return self._key

    @staticmethod
    def __dask_optimize__(graph: Any, keys: Any, **_: Any) -> Graph:
        """Loads what a single task compares in that task, so that no blocks wait in memory."""
        tasks, dependencies = cull(dict(graph), keys)
        leaves = [key for key in tasks if _is_leaf(key)]
        fused, _dependencies = fuse(
            tasks, [*dask.core.flatten(keys), *leaves], dependencies, ave_width=4, rename_keys=False
        )
        return dict(fused)

    def __dask_postcompute__(self) -> Any:
        return _only, ()

    def __dask_postpersist__(self) -> Any:
        return self._rebuilt, ()

    def _rebuilt(self, graph: Any, **_: Any) -> "_Lazy":
        layer = HighLevelGraph.from_collections(self._layer, graph)
        return type(self)(layer, self._layer, self._key)

    def __bool__(self) -> bool:
        raise TypeError("nothing has been compared yet; call .compute()")


def _only(results: Sequence[Any]) -> Any:
    return results[0]


_LEAVES = "talnumericarray-block-"


def _is_leaf(key: Any) -> bool:
    return isinstance(key, tuple) and isinstance(key[0], str) and key[0].startswith(_LEAVES)


class LazyComparison(_Lazy):
    """A `talnumericarray.Comparison`, which compute() returns."""


class LazySame(_Lazy):
    """A bool, which compute() returns. It stops at the first block that differs."""

    def compute(self, **options: Any) -> bool:
        get = dask.base.get_scheduler(
            collections=[self], scheduler=options.get("scheduler"), get=options.get("get")
        )
        client = getattr(get, "__self__", None)
        if client is not None and hasattr(client, "cancel"):
            return self._compute_by(client)
        try:
            with _StopAtDifference():
                return bool(super().compute(**options))
        except _DifferenceFound:
            return False

    def _compute_by(self, client: Any) -> bool:
        import distributed

        graph = self.__dask_optimize__(self._graph, [self._key])
        leaves = [key for key in graph if _is_leaf(key)]
        futures = client.get(graph, leaves, sync=False)
        try:
            for _, same_there in distributed.as_completed(futures, with_results=True):
                if not same_there:
                    return False
            return True
        finally:
            client.cancel(futures)


class _DifferenceFound(Exception):
    pass


class _StopAtDifference(Callback):  # type: ignore[misc]
    """Ends a computation in this process, or in its own pool, by an exception."""

    def _posttask(self, key: Any, result: Any, *_: Any) -> None:
        if _is_leaf(key) and result is False:
            raise _DifferenceFound


# ---- The functions


@shows(CompareOptions)
def compare(first: Any, second: Any, /, **options: "Unpack[CompareOptions]") -> LazyComparison:
    """What `talnumericarray.compare` returns for two Dask arrays, lazily.

    Takes what that takes but for `progress`; one of the arrays, and `ignore`, may be NumPy's. All
    arrays need known shapes. `threads` is for each task, by default 1.

    >>> import dask.array as da
    >>> import talnumericarray as tna
    >>> import talnumericarray.dask
    >>> a = da.arange(1000, chunks=100)
    >>> b = da.where(a == 123, -1, a).rechunk(300)
    >>> c = tna.dask.compare(a, b).compute()
    >>> c.differing, c.pairs, c.places[0].index
    (1, 1000, (123,))
    """
    problem = _Problem(first, second, dict(options))

    def task_of(block: _Block) -> Any:
        keys, parts = zip(*block.sides)
        return (_find, block.number, problem.first.strides, problem.options, parts, *keys)

    return LazyComparison.of(problem, task_of, _merge, problem.conclusion, problem.is_one_shape)


@shows(SameOptions)
def same(first: Any, second: Any, /, **options: "Unpack[SameOptions]") -> LazySame:
    """Whether two Dask arrays are the same, lazily.

    Takes what `compare` takes. `compute()` stops at the first block that differs: tasks that have
    not begun by then are cancelled, on a cluster and in this process; dask.compute(), which may
    have other results to compute, runs all of them.

    >>> import dask.array as da
    >>> import talnumericarray as tna
    >>> import talnumericarray.dask
    >>> a = da.linspace(0, 1, 1000, chunks=100)
    >>> tna.dask.same(a, a * (1 + 1e-12)).compute()
    False
    >>> tna.dask.same(a, a * (1 + 1e-12), relative=1e-9).compute()
    True
    """
    problem = _Problem(first, second, dict(options))
    known = problem.conclude(None).same

    def task_of(block: _Block) -> Any:
        keys, parts = zip(*block.sides)
        return (_is_same, problem.options, parts, *keys)

    return LazySame.of(problem, task_of, all, functools.partial(_and, known), known)


@shows(CompareOptions)
def assert_same(first: Any, second: Any, /, **options: "Unpack[CompareOptions]") -> None:
    """Raises a `talnumericarray.NotSameError` unless two Dask arrays are the same.

    Computes at once, as an assertion that nobody computes would always hold. Takes what `compare`
    takes.
    """
    __tracebackhide__ = True
    alone = {name: value for name, value in options.items() if name not in ("max_places", "names")}
    if not same(first, second, **alone).compute():
        raise NotSameError(compare(first, second, **options).compute())
