"""`assert_same`, for tests."""

from __future__ import annotations

import sys
from typing import TYPE_CHECKING, Any

from talnumericarray import _core
from talnumericarray._comparison import NotSameError, compare
from talnumericarray._options import CompareOptions, shows

if TYPE_CHECKING:
    from typing_extensions import Unpack


@shows(CompareOptions)
def assert_same(first: Any, second: Any, /, **options: "Unpack[CompareOptions]") -> None:
    """Raises a `NotSameError`, which is an AssertionError, unless two arrays are the same.

    Takes what `compare` takes; also two of xarray's datasets or data arrays, which have to have the
    same variables, coordinates and dimensions. Raises what `compare` raises.

    >>> import talnumericarray as tna
    >>> tna.assert_same([1, 2, 3], [1, 2, 3])
    >>> tna.assert_same([1, 2, 3], [1, 2, 4])  # doctest: +ELLIPSIS
    Traceback (most recent call last):
        ...
    talnumericarray.NotSameError: first and second differ: [2]: 3 and 4 (different integers)
    ...
    """
    __tracebackhide__ = True
    if _has_variables(first) or _has_variables(second):
        from talnumericarray import _xarray

        _xarray.assert_same(first, second, **options)
        return
    checked: "dict[str, Any]" = {**options}
    if not _core.same(first, second, **checked):
        raise NotSameError(compare(first, second, **options))


def _has_variables(array: Any) -> bool:
    """Whether the array is one of xarray's, without importing it."""
    xarray = sys.modules.get("xarray")
    return xarray is not None and isinstance(
        array, (xarray.Dataset, xarray.DataArray, xarray.Variable)
    )
