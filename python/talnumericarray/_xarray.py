"""`assert_same` for xarray's objects, variable by variable."""

from __future__ import annotations

from typing import Any, Dict, Hashable, Iterator, Optional, Tuple

import numpy
import pandas
import xarray

from talnumericarray import _core
from talnumericarray._comparison import Comparison, NotSameError, compare


def assert_same(first: Any, second: Any, /, **options: Any) -> None:
    """Raises an AssertionError unless both have the same variables and coordinates, and each of
    these has the same dimensions and is the same in both; the text names all that differ. Numbers
    are compared as the options say, text and dates exactly; attributes and the names of data arrays
    are not compared.
    """
    __tracebackhide__ = True
    names = options.pop("names", None) or ("first", "second")
    problems = list(_problems(first, second, names, options))
    if not problems:
        return
    if len(problems) == 1 and isinstance(problems[0], Comparison):
        raise NotSameError(problems[0])
    raise AssertionError("\n".join(str(problem) for problem in problems))


def _problems(
    first: Any, second: Any, names: Tuple[str, str], options: Dict[str, Any]
) -> Iterator[object]:
    """What is not the same: texts and comparisons."""
    if type(first) is not type(second):
        yield f"{names[0]} is a {_kind(first)}, and {names[1]} a {_kind(second)}"
        return
    variables1, variables2 = _variables(first), _variables(second)
    for name in variables1:
        if name not in variables2:
            yield f"only in {names[0]}: {name!r}"
    for name in variables2:
        if name not in variables1:
            yield f"only in {names[1]}: {name!r}"
    for name, variable1 in variables1.items():
        if name in variables2:
            named = {**options, "names": tuple(_name_of(array, name) for array in names)}
            yield from _problem(variable1, variables2[name], named)


def _kind(array: Any) -> str:
    return f"{type(array).__module__.partition('.')[0]}.{type(array).__name__}"


def _variables(array: Any) -> Dict[Hashable, xarray.Variable]:
    """The variables and coordinates of a dataset; None stands for a data array's values."""
    if isinstance(array, xarray.Dataset):
        return dict(array.variables)
    if isinstance(array, xarray.DataArray):
        return {None: array.variable, **{name: c.variable for name, c in array.coords.items()}}
    return {None: array}


def _name_of(array: str, variable: Hashable) -> str:
    return array if variable is None else f"{array}[{variable!r}]"


def _problem(
    first: xarray.Variable, second: xarray.Variable, options: Dict[str, Any]
) -> Iterator[object]:
    names = options["names"]
    if first.dims != second.dims:
        yield f"{names[0]} and {names[1]} differ: dimensions {first.dims} and {second.dims}"
    elif _is_number(first) and _is_number(second):
        comparison = _comparison(first.data, second.data, options)
        if comparison is not None:
            yield comparison
    else:
        difference = _other_difference(first, second)
        if difference is not None:
            yield f"{names[0]} and {names[1]} differ: {difference}"


def _other_difference(first: xarray.Variable, second: xarray.Variable) -> Optional[str]:
    """Of two variables that are not both of numbers."""
    if first.shape != second.shape:
        return f"shapes {first.shape} and {second.shape}"
    if first.dtype.kind != second.dtype.kind:
        return f"types {first.dtype} and {second.dtype}"
    values1, values2 = first.values, second.values
    # None, NaN and "not a time" are the same as themselves.
    differs = (values1 != values2) & ~(pandas.isnull(values1) & pandas.isnull(values2))
    if not differs.any():
        return None
    index = tuple(numpy.argwhere(differs)[0].tolist())
    return f"{list(index)}: {_shown(values1[index])} and {_shown(values2[index])}"


def _shown(value: Any) -> str:
    if isinstance(value, (numpy.datetime64, numpy.timedelta64)):
        return str(value)
    return repr(value.item() if isinstance(value, numpy.generic) else value)


def _is_number(variable: xarray.Variable) -> bool:
    return bool(
        numpy.issubdtype(variable.dtype, numpy.number)
        or numpy.issubdtype(variable.dtype, numpy.bool_)
    )


def _comparison(first: Any, second: Any, options: Dict[str, Any]) -> Optional[Comparison]:
    """None if the two are the same."""
    if hasattr(first, "dask") or hasattr(second, "dask"):
        import talnumericarray.dask

        comparison: Comparison = talnumericarray.dask.compare(first, second, **options).compute()
        return None if comparison.same else comparison
    alone = {name: value for name, value in options.items() if name not in ("max_places", "names")}
    return None if _core.same(first, second, **alone) else compare(first, second, **options)
