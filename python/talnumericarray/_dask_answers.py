"""Lazy answers: trees of tasks, whose leaves compare a part of a block with a part of another."""

from __future__ import annotations

import itertools
from concurrent.futures import CancelledError
from typing import Any, Callable, Dict, List, Optional, Sequence, Tuple

import dask
import dask.local
import dask.multiprocessing
import dask.threaded
from dask.base import DaskMethodsMixin, get_scheduler, tokenize
from dask.callbacks import Callback
from dask.highlevelgraph import HighLevelGraph
from dask.optimization import cull, fuse

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
        """`conclude` is called with the results of all leaves merged; with None if there are none."""
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
        tasks, dependencies = cull(dict(graph), keys)
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


def _only(results: Sequence[Any]) -> Any:
    return results[0]


class LazyComparison(Lazy):
    """A `talnumericarray.Comparison`, which compute() returns."""


class LazySame(Lazy):
    """A bool, which compute() returns. It stops at the first block that differs."""

    def compute(self, **options: Any) -> Any:
        get = get_scheduler(
            collections=[self], scheduler=options.get("scheduler"), get=options.get("get")
        )
        client: Any = getattr(get, "__self__", None)
        by_client = hasattr(client, "scheduler_info") and not client.asynchronous
        # Without the tree they run in row-major order; there are none if this was persisted.
        leaves = list(filter(_is_leaf, self._graph))
        if not leaves or not (by_client or getattr(get, "func", get) in _LOCAL_SCHEDULERS):
            return super().compute(**options)
        is_optimized = options.get("optimize_graph", True)
        graph = self.__dask_optimize__(self._graph, leaves) if is_optimized else self._graph
        dasks_own = ("scheduler", "get", "traverse", "optimize_graph")
        others = {name: value for name, value in options.items() if name not in dasks_own}
        return (_all_by_client if by_client else _all_here)(get, graph, leaves, others)


def _all_by_client(
    get: Callable[..., Any], graph: Any, leaves: List[Any], options: Dict[str, Any]
) -> bool:
    from distributed import as_completed

    futures = get(graph, leaves, sync=False, **options)
    try:
        for _, is_same in as_completed(futures, with_results=True):
            if isinstance(is_same, CancelledError):
                raise is_same
            if not is_same:
                return False
        return True
    finally:
        # Cancelled, they would take with them what another result needs.
        for future in futures:
            future.release()


def _all_here(
    get: Callable[..., Any], graph: Any, leaves: List[Any], options: Dict[str, Any]
) -> bool:
    # In the call: what is registered may be taken by another thread's computation.
    callbacks = [*Callback.active, (None, None, None, _stop_at_difference, None)]
    try:
        return all(get(graph, leaves, callbacks=callbacks, **options))
    except _DifferenceFound:
        return False


_LOCAL_SCHEDULERS = (
    dask.local.get_async,
    dask.local.get_sync,
    dask.multiprocessing.get,
    dask.threaded.get,
)


class _DifferenceFound(Exception):
    pass


def _stop_at_difference(key: Any, result: Any, *_: Any) -> None:
    if _is_leaf(key) and result is False:
        raise _DifferenceFound
