"""Compares Dask's arrays block by block, for arrays that no machine could hold.

What is found in blocks is merged as a tree. Answers and reports are exactly those for whole arrays.

>>> import dask.array as da
>>> import talnumericarray.dask as td
>>> a = da.linspace(0, 1, 1000, chunks=100)
>>> b = a.rechunk(300) * (1 + 1e-12)
>>> td.same(a, b).compute()
False
>>> td.compare(a, b).compute().smallest_tolerance
14
"""

from __future__ import annotations

import functools
from typing import TYPE_CHECKING, Any, List, Optional

from talnumericarray import _core
from talnumericarray._comparison import NotSameError
from talnumericarray._dask_answers import LazyComparison, LazySame
from talnumericarray._dask_blocks import Problem
from talnumericarray._options import CompareOptions, SameOptions, shows

if TYPE_CHECKING:
    from typing_extensions import Unpack

__all__ = ["LazyComparison", "LazySame", "assert_same", "compare", "same"]

for _public in (LazyComparison, LazySame):
    _public.__module__ = __name__


@shows(CompareOptions)
def compare(first: Any, second: Any, /, **options: "Unpack[CompareOptions]") -> LazyComparison:
    """What `talnumericarray.compare` returns for two Dask arrays, lazily.

    Takes what that takes but for `progress`; one of the arrays, and `ignore`, may be NumPy's. All
    arrays need known shapes. `threads` is for each task, by default 1.

    >>> import dask.array as da
    >>> import talnumericarray.dask as td
    >>> a = da.arange(1000, chunks=100)
    >>> b = da.where(a == 123, -1, a).rechunk(300)
    >>> td.compare(a, b)
    <LazyComparison of 10 pairs of blocks>
    >>> c = td.compare(a, b).compute()
    >>> c.differing, c.pairs, c.places[0].index
    (1, 1000, (123,))
    """
    problem = Problem(_core.compare, first, second, dict(options))

    find = problem.comparer.find
    leaves = [(find, pair.number, pair.parts, *pair.keys) for pair in problem.pairs()]
    lazy: LazyComparison = LazyComparison.of(problem, leaves, _merge, problem.conclusion.of)
    return lazy


# Compiled functions cannot be pickled.
def _merge(parts: List[_core.Findings]) -> _core.Findings:
    return _core.merge(parts)


@shows(SameOptions)
def same(first: Any, second: Any, /, **options: "Unpack[SameOptions]") -> LazySame:
    """Whether two Dask arrays are the same, lazily.

    Takes what `compare` takes but for `max_places` and `names`. `compute()` stops at the first
    block that differs: tasks that have not begun by then are cancelled, on a cluster and in this
    process. dask.compute(), which may have other results to compute, runs all of them.

    >>> import dask.array as da
    >>> import talnumericarray.dask as td
    >>> a = da.linspace(0, 1, 1000, chunks=100)
    >>> td.same(a, a * (1 + 1e-12)).compute()
    False
    >>> td.same(a, a * (1 + 1e-12), relative=1e-9).compute()
    True
    """
    problem = Problem(_core.same, first, second, dict(options))
    may_be_same = problem.conclusion.of(None).same
    is_same = problem.comparer.is_same
    pairs = problem.pairs() if may_be_same else ()
    leaves = [(is_same, pair.parts, *pair.keys) for pair in pairs]
    lazy: LazySame = LazySame.of(problem, leaves, all, functools.partial(_and, may_be_same))
    return lazy


def _and(may_be_same: bool, blocks_are: Optional[bool]) -> bool:
    return may_be_same and blocks_are is not False


@shows(CompareOptions)
def assert_same(first: Any, second: Any, /, **options: "Unpack[CompareOptions]") -> None:
    """Raises a `talnumericarray.NotSameError` unless two Dask arrays are the same.

    Computes at once, as an assertion that nobody computes would always hold; if the arrays differ
    they are computed again, for the report. Takes what `compare` takes.

    >>> import dask.array as da
    >>> import talnumericarray.dask as td
    >>> a = da.arange(1000, chunks=100)
    >>> td.assert_same(a, a.rechunk(300))
    """
    __tracebackhide__ = True
    of_report = ("max_places", "names")
    alone: Any = {name: value for name, value in options.items() if name not in of_report}
    if not same(first, second, **alone).compute():
        raise NotSameError(compare(first, second, **options).compute())
