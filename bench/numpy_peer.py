#!/usr/bin/python3
"""Times NumPy on the reals of peers.cpp, in nanoseconds: numpy_peer.py [--quick]."""

import json
import sys
import time
import timeit

import numpy as np

BYTES = 256 * 1024  # of both arrays together
TOLERANCE = 10


def arrays(dtype):
    """An array of reals, and one that is near it but equal nowhere."""
    random = np.random.default_rng(20240229)
    count = BYTES // 2 // np.dtype(dtype).itemsize
    signs = random.choice([-1, 1], count)
    first = (signs * random.uniform(2**-10, 4, count)).astype(dtype)
    epsilons = random.integers(1, 257, count).astype(dtype)
    return first, first * (1 + epsilons * np.finfo(dtype).eps)


def nanoseconds(function, repetitions):
    assert function(), "the answer is wrong"
    # Processor time: the other libraries use one processor.
    return min(timeit.repeat(function, timer=time.process_time, number=1, repeat=repetitions)) * 1e9


def main():
    repetitions = 5 if "--quick" in sys.argv[1:] else 500
    rows = []
    for dtype in (np.float64, np.float32):
        first, near = arrays(dtype)
        identical = first.copy()
        relative = 2.0 ** (TOLERANCE - 1 - np.finfo(dtype).nmant)
        name = np.dtype(dtype).name
        for function, time in (
            ("NumPy allclose", nanoseconds(
                lambda: np.allclose(first, near, rtol=relative, atol=0), repetitions)),
            ("NumPy array_equal", nanoseconds(
                lambda: np.array_equal(first, identical), repetitions)),
        ):
            rows.append({"type": name, "len": len(first), "name": function, "nanoseconds": time})
    json.dump({"numpy": np.__version__, "rows": rows}, sys.stdout, indent=1)
    print()


if __name__ == "__main__":
    main()
