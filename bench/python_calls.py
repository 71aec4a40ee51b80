#!/usr/bin/python3
"""Times the functions of the Python package, and NumPy's that are used instead, on the same arrays:
python_calls.py PYTHON_FOLDER MODULE_CALLS [--quick].

PYTHON_FOLDER holds the package; MODULE_CALLS is the library of module_calls.cpp. Prints JSON with a
row for each function: seconds of a call, the shortest of many taken in turns, and the bytes that it
allocates at most beside its arguments, for Python and in all.
"""

import ctypes
import json
import re
import sys
import time
import tracemalloc
from pathlib import Path

import numpy as np

TOLERANCE = 10
RELATIVE = 2.0 ** (TOLERANCE - 53)


def near_arrays(shape):
    """Doubles, and others that are near them but equal nowhere."""
    random = np.random.default_rng(20240229)
    first = random.choice([-1, 1], shape) * random.uniform(2**-10, 4, shape)
    return first, first * (1 + random.integers(1, 257, shape) * np.finfo(float).eps)


class ModuleCalls:
    """The same comparison, called by C++."""

    def __init__(self, library):
        self._compare = ctypes.CDLL(library).compare_doubles
        self._compare.argtypes = [ctypes.c_double, ctypes.c_void_p, ctypes.c_void_p, ctypes.c_int,
                                  ctypes.c_int]

    def function(self, first, second, calls):
        def compare():
            return self._compare(TOLERANCE, first.ctypes.data, second.ctypes.data, first.size,
                                 calls) == calls
        return compare


# ---- What is timed


def functions_of(tna, first, near):
    """The package's functions and NumPy's, by their names."""
    identical = first.copy()
    return {
        "same": lambda: tna.same(first, near, tol=TOLERANCE, threads=1),
        "same, identical": lambda: tna.same(first, identical, threads=1),
        "same, all threads": lambda: tna.same(first, near, tol=TOLERANCE),
        "compare": lambda: tna.compare(first, near, tol=TOLERANCE, threads=1).same,
        "compare, all threads": lambda: tna.compare(first, near, tol=TOLERANCE).same,
        "assert_same": lambda: tna.assert_same(first, near, tol=TOLERANCE, threads=1) is None,
        "numpy.allclose": lambda: np.allclose(first, near, rtol=RELATIVE, atol=0),
        "numpy.array_equal, identical": lambda: np.array_equal(first, identical),
        "numpy.testing.assert_allclose":
            lambda: np.testing.assert_allclose(first, near, rtol=RELATIVE, atol=0) is None,
    }


def seconds_of(functions, turns, repetitions=2, calls=1):
    """The least for each. In a turn each function is timed some times after another, so that it
    finds in the caches what it leaves there; each time is that of `calls` calls.
    """
    best = dict.fromkeys(functions, float("inf"))
    for function in functions.values():
        assert function(), "the answer is wrong"
    for _ in range(turns):
        for name, function in functions.items():
            for _ in range(repetitions):
                start = time.perf_counter()
                for _ in range(calls):
                    function()
                best[name] = min(best[name], (time.perf_counter() - start) / calls)
    return best


def peak_memory():
    """The largest resident memory, in bytes, since `forget_peak`."""
    status = Path("/proc/self/status").read_text(encoding="ascii")
    return int(re.search(r"VmHWM:\s*(\d+) kB", status).group(1)) * 1024


def forget_peak():
    Path("/proc/self/clear_refs").write_text("5", encoding="ascii")


def memory_of(function):
    """The most that a call allocates through Python, and that the process grows by."""
    function()
    forget_peak()
    before = peak_memory()
    function()
    grown = peak_memory() - before
    tracemalloc.start()
    function()
    tracemalloc.clear_traces()
    function()
    traced = tracemalloc.get_traced_memory()[1]
    tracemalloc.stop()
    return {"traced": traced, "grown": grown}


def main():
    folder, library, *options = sys.argv[1:]
    quick = "--quick" in options
    sys.path.insert(0, folder)
    import talnumericarray as tna

    module_calls = ModuleCalls(library)
    rows = []
    for count, turns, repetitions, calls in ((10, 200, 1, 200), (10**6, 40, 5, 1),
                                             (10**7, 15, 2, 1)):
        first, near = near_arrays(count)
        functions = functions_of(tna, first, near)
        functions["C++"] = module_calls.function(first, near, calls)
        best = seconds_of(functions, 2 if quick else turns, repetitions, calls)
        best["C++"] /= calls
        for name, function in functions.items():
            memory = memory_of(function) if count == 10**7 and name != "C++" else {}
            rows.append({"count": count, "name": name, "seconds": best[name], **memory})
    side = 1000 if quick else 3000
    first, near = near_arrays((side, side))
    turned = np.asfortranarray(near)
    views = {
        "same, C and Fortran order": lambda: tna.same(first, turned, tol=TOLERANCE, threads=1),
        "same, every other column":
            lambda: tna.same(first[:, ::2], near[:, ::2], tol=TOLERANCE, threads=1),
        "same, both turned round":
            lambda: tna.same(first[::-1, ::-1], near[::-1, ::-1], tol=TOLERANCE, threads=1),
        "numpy.allclose, C and Fortran order":
            lambda: np.allclose(first, turned, rtol=RELATIVE, atol=0),
        "numpy.allclose, every other column":
            lambda: np.allclose(first[:, ::2], near[:, ::2], rtol=RELATIVE, atol=0),
        "numpy.allclose, both turned round":
            lambda: np.allclose(first[::-1, ::-1], near[::-1, ::-1], rtol=RELATIVE, atol=0),
    }
    for name, seconds in seconds_of(views, 2 if quick else 15).items():
        rows.append({"count": side * side, "name": name, "seconds": seconds,
                     **memory_of(views[name])})
    json.dump({"numpy": np.__version__, "rows": rows}, sys.stdout, indent=1)
    print()


if __name__ == "__main__":
    main()
