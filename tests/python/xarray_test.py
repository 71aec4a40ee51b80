"""`assert_same` for datasets and data arrays of xarray."""

from __future__ import annotations

from typing import Any

import dask.array as da
import numpy as np
import pytest

import talnumericarray as tna

xr = pytest.importorskip("xarray")


def dataset(**changes: Any) -> Any:
    """With variables of several kinds; a variable that is changed to None is left out."""
    variables = {
        "heat": (("time", "x"), np.arange(6.0).reshape(2, 3)),
        "count": ("x", np.array([1, 2, 3])),
        "valid": ("x", np.array([True, False, True])),
        "name": ("x", np.array(["a", "b", "c"])),
        "missing": ("x", np.array([1.0, np.nan, 3.0])),
        **changes,
    }
    times = np.array(["2026-01-01", "2026-01-02"], "M8[ns]")
    kept = {name: value for name, value in variables.items() if value is not None}
    return xr.Dataset(kept, {"time": times}, {"title": "an attribute"})


def text_of(first: Any, second: Any, **options: Any) -> str:
    with pytest.raises(AssertionError) as caught:
        tna.assert_same(first, second, **options)
    return str(caught.value)


def test_the_same_datasets() -> None:
    tna.assert_same(dataset(), dataset())
    tna.assert_same(dataset(), dataset(count=("x", np.array([1.0, 2.0, 3.0]))))
    tna.assert_same(dataset(), dataset().assign_attrs(title="another"))
    tna.assert_same(dataset().heat, dataset().heat.assign_attrs(units="K"))
    tna.assert_same(dataset().heat.variable, dataset().heat.variable)
    near = dataset().assign(heat=dataset().heat * (1 + 1e-12))
    tna.assert_same(dataset(), near, relative=1e-9, equal_nan=True)
    tna.assert_same(dataset(), near, tol=20, equal_nan=True, names=("old", "new"))


def test_the_text_names_the_variable_and_is_its_report() -> None:
    other = dataset().assign(heat=dataset().heat + 1)
    with pytest.raises(tna.NotSameError) as caught:
        tna.assert_same(dataset(), other, max_places=2)
    expected = tna.compare(
        dataset().heat.values,
        other.heat.values,
        max_places=2,
        names=("first['heat']", "second['heat']"),
    )
    assert str(caught.value) == expected.text
    assert caught.value.comparison == expected
    assert expected.text.startswith(
        "first['heat'] and second['heat'] differ: [0, 0]: 0 and 1 (zero is the same only as "
        "zero)\n"
    )


def test_all_that_differs_is_named() -> None:
    heat = xr.Variable(("time", "x"), np.zeros((2, 3)))
    other = dataset(
        heat=heat,
        count=None,
        name=("x", np.array(["a", "b", "d"])),
        missing=("x", np.array([1.0, 2.0, 3.0])),
        extra=("x", np.array([1, 1, 1])),
    )
    other["time"] = other.time + np.timedelta64(1, "D")
    old = dataset()
    reports = [
        tna.compare(
            old[name].values, other[name].values, names=(f"old[{name!r}]", f"new[{name!r}]")
        ).text
        for name in ("heat", "missing")
    ]
    assert text_of(old, other, names=("old", "new")) == "\n".join(
        [
            "only in old: 'count'",
            "only in new: 'extra'",
            reports[0],
            "old['name'] and new['name'] differ: [2]: 'c' and 'd'",
            reports[1],
            "old['time'] and new['time'] differ: [0]: 2026-01-01T00:00:00.000000000 and "
            "2026-01-02T00:00:00.000000000",
        ]
    )


def test_dimensions() -> None:
    turned = dataset().assign(heat=dataset().heat.transpose())
    assert text_of(dataset(), turned) == (
        "first['heat'] and second['heat'] differ: dimensions ('time', 'x') and ('x', 'time')"
    )
    shorter = dataset()[["count", "name"]].isel(x=slice(2))
    count = tna.compare([1, 2, 3], [1, 2], names=("first['count']", "second['count']"))
    assert count.difference == "shape"
    assert text_of(dataset()[["count", "name"]], shorter) == (
        f"{count.text}\nfirst['name'] and second['name'] differ: shapes (3,) and (2,)"
    )


def test_data_arrays() -> None:
    first = xr.DataArray([1.0, 2.0], dims="x", coords={"x": [10, 20]}, name="a")
    tna.assert_same(first, first.rename("b"))
    values = tna.compare([1.0, 2.0], [1.0, 3.0])
    assert text_of(first, first.copy(data=[1.0, 3.0])) == values.text
    indices = tna.compare([10, 20], [10, 30], names=("first['x']", "second['x']"))
    assert text_of(first, first.assign_coords(x=[10, 30])) == indices.text
    assert text_of(first, first.drop_vars("x")) == "only in first: 'x'"
    assert text_of(first, first.to_dataset(name="a")) == (
        "first is a xarray.DataArray, and second a xarray.Dataset"
    )
    assert text_of(first, np.array([1.0, 2.0]), names=("a", "b")) == (
        "a is a xarray.DataArray, and b a numpy.ndarray"
    )


def test_text_and_dates_that_are_missing() -> None:
    never = np.array(["2026-01-01", "NaT"], "M8[ns]")
    names = np.array(["a", None], object)
    first = xr.Dataset({"when": ("x", never), "who": ("x", names)})
    tna.assert_same(first, first.copy(deep=True))
    second = xr.Dataset({"when": ("x", never[::-1]), "who": ("x", names[::-1])})
    assert text_of(first, second) == (
        "first['when'] and second['when'] differ: [0]: 2026-01-01T00:00:00.000000000 and NaT\n"
        "first['who'] and second['who'] differ: [0]: 'a' and None"
    )
    numbers = xr.Dataset({"when": ("x", [1, 2]), "who": ("x", names)})
    assert text_of(first, numbers) == (
        "first['when'] and second['when'] differ: types datetime64[ns] and int64"
    )


def test_variables_of_dask() -> None:
    loaded = []

    def seen(block: Any) -> Any:
        loaded.append(block.shape)
        return block

    values = np.arange(12.0).reshape(4, 3)
    blocks = da.from_array(values, chunks=2).map_blocks(seen, dtype=float)
    first = xr.Dataset({"heat": (("x", "y"), blocks)})
    second = xr.Dataset({"heat": (("x", "y"), values)})
    tna.assert_same(first, second)
    assert max(loaded) == (2, 2)
    other = second + 1
    expected = tna.compare(values, values + 1, names=("first['heat']", "second['heat']"))
    assert text_of(first, other) == expected.text
    assert text_of(first, other.chunk(x=3)) == expected.text


def test_options_are_checked() -> None:
    with pytest.raises(TypeError, match="unexpected keyword argument 'what'"):
        tna.assert_same(dataset(), dataset(), what=1)
