"""Calls that have to type-check; they are only read, by mypy."""

from typing import Optional, Tuple

import numpy as np
from numpy.typing import NDArray

import talnumericarray as tna


def progress(done: int, total: int) -> None:
    print(done, total)


def use(first: NDArray[np.float64], mask: NDArray[np.bool_]) -> Optional[int]:
    same: bool = tna.same(first, [1, 2], tol=10, equal_nan=True, progress=progress, threads=2)
    same = tna.same(first, first, relative=np.float64(1e-9), slices=np.s_[1:, ...], ignore=mask)
    same = tna.same(first, 5, slices="0:10,:,3", absolute=1e-12, strict_type=None)
    equivalent: bool = tna.equivalent(first, (1.0, 2.0))
    found: tna.Comparison = tna.compare(first, first, max_places=5, names=("a", "b"), squeeze=True)
    nothing: None = tna.assert_same(first, first, tol=3, max_places=2)
    index: Tuple[int, ...] = found.places[0].index
    worst: Optional[tna.Place] = found.worst
    if worst is None:
        return found.smallest_tolerance
    digits: Optional[int] = worst.digits
    pairs: int = found.histogram[0].pairs + found.first_values.nans + found.ignored
    shape: Tuple[int, ...] = found.first.shape
    text: str = found.text + str(found) + found.first.stored_type
    difference: Optional[str] = found.difference
    largest: float = found.largest_absolute_difference
    try:
        tna.assert_same(first, first)
    except tna.NotSameError as error:
        print(error.comparison.differing)
    print(same, equivalent, nothing, index, digits, pairs, shape, text, difference, largest)
    return digits
