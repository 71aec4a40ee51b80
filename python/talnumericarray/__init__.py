"""Compares arrays of numbers exactly: under a tolerance in binary digits that is the same in both
directions, without temporary arrays.

>>> import numpy as np
>>> import talnumericarray as tna
>>> a = np.linspace(0, 1, 5)
>>> b = a.copy()
>>> b[3] += 1e-12
>>> tna.same(a, b)
False
>>> tna.compare(a, b).smallest_tolerance
14
>>> tna.same(a, b, tol=14)
True
"""

from typing import TYPE_CHECKING, Any

from talnumericarray._assertions import assert_same
from talnumericarray._comparison import (
    ArrayFacts,
    Bar,
    Comparison,
    NotSameError,
    Place,
    ValueCounts,
    compare,
)
from talnumericarray._core import __version__, equivalent, same

if TYPE_CHECKING:
    from talnumericarray import dask as dask

__all__ = [
    "ArrayFacts",
    "Bar",
    "Comparison",
    "NotSameError",
    "Place",
    "ValueCounts",
    "assert_same",
    "compare",
    "equivalent",
    "same",
]

# What is shown of them, and pickled, does not say where they are kept.
for _public in (ArrayFacts, Bar, Comparison, NotSameError, Place, ValueCounts, assert_same, compare):
    _public.__module__ = "talnumericarray"


def __getattr__(name: str) -> Any:
    """Imports `talnumericarray.dask`, and so Dask, where it is used first."""
    if name != "dask":
        raise AttributeError(f"module {__name__!r} has no attribute {name!r}")
    import importlib

    return importlib.import_module("talnumericarray.dask")
