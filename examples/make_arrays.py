#!/usr/bin/python3
"""Writes the sample arrays of this folder: make_arrays.py [FOLDER]."""

import sys
from pathlib import Path

import numpy as np


def partial_sums(order):
    """Sums of 1/k^2 up to each of 100 terms, added in the given order."""
    terms = 1.0 / np.arange(1, 101, dtype=np.float64) ** 2
    return np.array([sum(order(terms[:n]), np.float64(0)) for n in range(1, 101)])


def arrays():
    counts = np.array([[0, 1, 2], [3, 40, 127]])
    yield "counts_int8", counts.astype(np.int8)
    yield "counts_float64", counts.astype(np.float64)

    # The same sums with other rounding: equal up to their last few binary digits.
    yield "sums_forward", partial_sums(lambda terms: terms)
    yield "sums_backward", partial_sums(lambda terms: terms[::-1])

    grid = np.linspace(0, 1, 24, dtype=np.float32).reshape(2, 3, 4)
    changed = grid.copy()
    changed[1, 0, 2] += np.float32(0.001)
    yield "grid", grid
    yield "grid_changed", changed

    roots = np.array([-1.5, 0.25, 2.0])
    yield "roots_real", roots
    yield "roots_complex", roots.astype(np.complex128)

    # The first integer that no double holds.
    yield "beyond_2_53_int64", np.array([2**53 + 1], dtype=np.int64)
    yield "beyond_2_53_uint64", np.array([2**53], dtype=np.uint64)
    yield "beyond_2_53_float64", np.array([2.0**53])


def main():
    folder = Path(sys.argv[1]) if len(sys.argv) > 1 else Path(__file__).parent / "arrays"
    folder.mkdir(exist_ok=True)
    for name, array in arrays():
        np.save(folder / f"{name}.npy", array)


if __name__ == "__main__":
    main()
