"""Lazy answers: trees of tasks, whose leaves compare a part of a block with a part of another."""

from __future__ import annotations

import inspect
import itertools
import pickle
from typing import Any, Callable, Dict, List, Optional, Sequence, Tuple

import dask
import dask.threaded
from dask.base import DaskMethodsMixin, tokenize
from dask.highlevelgraph import HighLevelGraph
from dask.core import istask
from dask.optimization import cull, fuse, inline

from talnumericarray._dask_blocks import Problem

Graph = Dict[Any, Any]

_LEAF = "talnumericarray-blocks-"


def _is_leaf(key: Any) -> bool:
    return isinstance(key, tuple) and isinstance(key[0], str) and key[0].startswith(_LEAF)


class Lazy(DaskMethodsMixin):  # type: ignore[misc]
    """A result that Dask computes."""

    __dask_scheduler__ = staticmethod(dask.threaded.get)

    def __init__(self, graph: HighLevelGraph, key: str, pairs_of_blocks: int) -> None:
        self._graph = graph
        self._key = key
        self.pairs_of_blocks = pairs_of_blocks
        """The number of tasks that compare."""

    @classmethod
    def of(
        cls,
        problem: Problem,
        leaves: List[Tuple[Any, ...]],
        merge: Callable[[List[Any]], Any],
        conclude: Callable[[Optional[Any]], Any],
    ) -> Any:
        """`conclude` is called with the leaves' results merged; with None if there are none."""
        token = tokenize(cls.__name__, problem.arrays, problem.conclusion)
        level: List[Any] = [(_LEAF + token, i) for i in range(len(leaves))]
        graph: Graph = dict(zip(level, leaves))
        for depth in itertools.count():
            if len(level) <= 1:
                break
            groups = [level[i : i + 8] for i in range(0, len(level), 8)]
            level = [(f"talnumericarray-merge-{token}", depth, i) for i in range(len(groups))]
            graph.update((key, (merge, group)) for key, group in zip(level, groups))
        key = f"talnumericarray-{token}"
        graph[key] = (conclude, level[0] if level else None)
        layers = HighLevelGraph.from_collections(key, graph, dependencies=problem.arrays)
        return cls(layers, key, len(leaves))

    def __repr__(self) -> str:
        return f"<{type(self).__name__} of {self.pairs_of_blocks} pairs of blocks>"

    def __dask_graph__(self) -> HighLevelGraph:
        return self._graph

    def __dask_keys__(self) -> List[Any]:
        return [self._key]

    def __dask_layers__(self) -> Tuple[str, ...]:
        return (self._key,)

    def __dask_tokenize__(self) -> Any:
        return self._key

    @staticmethod
    def __dask_optimize__(graph: Any, keys: Any, **_: Any) -> Graph:
        """Loads what a single task compares in that task, so that no blocks wait in memory."""
        tasks, _dependencies = cull(dict(graph), keys)
        # What all tasks need, such as an opened store, is sent from worker to worker. Where one of
        # them dies meanwhile, Distributed (as of 2022.12) may wait for it for ever, so that each
        # task gets its own if that is small.
        sources = [key for key, value in tasks.items() if not istask(value) and _is_small(value)]
        tasks, dependencies = cull(inline(tasks, sources, inline_constants=False), keys)
        kept = [*dask.core.flatten(keys), *filter(_is_leaf, tasks)]
        fused, _dependencies = fuse(tasks, kept, dependencies, ave_width=4, rename_keys=False)
        return dict(fused)

    def __dask_postcompute__(self) -> Any:
        return _only, ()

    def __dask_postpersist__(self) -> Any:
        return self._rebuilt, ()

    def _rebuilt(self, graph: Any, **_: Any) -> "Lazy":
        layers = HighLevelGraph.from_collections(self._key, graph)
        return type(self)(layers, self._key, self.pairs_of_blocks)

    def __bool__(self) -> bool:
        raise TypeError("nothing has been compared yet; call .compute()")


class _TooLarge(Exception):
    pass


class _Room:
    """A file that only counts what is written, and has room for little."""

    def __init__(self, room: int) -> None:
        self._room = room

    def write(self, data: Any) -> int:
        size = memoryview(data).nbytes
        self._room -= size
        if self._room < 0:
            raise _TooLarge
        return size


def _is_small(value: Any) -> bool:
    """Whether few bytes are sent for an object."""
    try:
        pickle.Pickler(_Room(4096), protocol=5).dump(value)
    except Exception:  # too large, or what raises as it cannot be pickled
        return False
    return True


def _only(results: Sequence[Any]) -> Any:
    return results[0]


class LazyComparison(Lazy):
    """A `talnumericarray.Comparison`, which compute() returns."""


class LazySame(Lazy):
    """A bool, which compute() returns. It stops at the first block that differs."""

    def compute(self, **options: Any) -> Any:
        stopping = self._stopping_at_difference()
        if stopping is None:
            return super().compute(**options)
        try:
            answer = stopping.compute(**options)
        except DifferenceFound:
            return False
        return _awaited(answer) if inspect.isawaitable(answer) else answer

    def _stopping_at_difference(self) -> Optional["_AllBlocks"]:
        """The same with an error instead of False, which ends the computation at once under all
        schedulers; None if there are no blocks to compare.
        """
        tasks = dict(self._graph.layers[self._key])
        leaves = list(filter(_is_leaf, tasks))
        if not leaves:
            return None
        key = f"{self._key}-or-stop"
        graph = {
            (_LEAF + key, number): (_true_or_stop, tasks[leaf, number]) for leaf, number in leaves
        }
        layers, needs = dict(self._graph.layers), dict(self._graph.dependencies)
        del layers[self._key]
        layers[key], needs[key] = graph, needs.pop(self._key)
        return _AllBlocks(HighLevelGraph(layers, needs), key, self.pairs_of_blocks)


class _AllBlocks(Lazy):
    """Without a tree, so that blocks are compared in row-major order."""

    def __dask_keys__(self) -> List[Any]:
        return list(self._graph.layers[self._key])

    def __dask_postcompute__(self) -> Any:
        return all, ()


class DifferenceFound(Exception):
    """Not the user's to see, but in a cluster's log."""


def _true_or_stop(is_same: bool) -> bool:
    if not is_same:
        raise DifferenceFound("two blocks differ, which ends the comparison")
    return True


async def _awaited(answer: Any) -> Any:
    try:
        return await answer
    except DifferenceFound:
        return False
