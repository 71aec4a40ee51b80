#!/usr/bin/python3
"""Times talcmp on files in the cache of the system, next to cmp and NumPy: talcmp_files.py TALCMP
[--quick]. Prints seconds and the greatest resident memory of each."""

import json
import os
import sys
import tempfile

import numpy as np

from commands_in_turns import in_another_process, measured_in_turns

# A process of its own, so that its memory is known; prints the seconds of the comparison alone.
ALLCLOSE = """
import sys, time
import numpy as np
first, second = (np.load(path) for path in sys.argv[1:])
begin = time.perf_counter()
assert np.allclose(first, second, rtol=2.0**-33, atol=0)
print(time.perf_counter() - begin)
"""


def save_arrays(count, one, same, near):
    """Doubles, a copy of them, and some that differ in a few digits."""
    random = np.random.default_rng(20261121)
    values = random.random(count) + 0.5
    np.save(one, values)
    np.save(same, values)
    np.save(near, values * (1 + random.standard_normal(count) * 2.0**-46))


def main():
    talcmp, quick = sys.argv[1], "--quick" in sys.argv
    count, repetitions = (1 << 17, 1) if quick else (1 << 27, 5)
    with tempfile.TemporaryDirectory() as folder:
        one, same, near = (os.path.join(folder, name + ".npy") for name in ("one", "same", "near"))
        in_another_process(save_arrays, count, one, same, near)
        commands = {
            "cmp, identical": ["cmp", one, same],
            "talcmp, identical": [talcmp, one, same],
            "talcmp, identical, one thread": [talcmp, "--threads", "1", one, same],
            "talcmp --tol 20, near": [talcmp, "--tol", "20", one, near],
            "talcmp --tol 20, near, one thread": [talcmp, "--threads", "1", "--tol", "20", one,
                                                  near],
            "talcmp --tol 20 --report, near": [talcmp, "--tol", "20", "--report", one, near],
            "NumPy allclose of loaded arrays, near": [sys.executable, "-c", ALLCLOSE, one, near],
        }
        measured = measured_in_turns(commands, repetitions)
    print(json.dumps({
        "bytes": 8 * count,
        "rows": [{"name": name, **values} for name, values in measured.items()]}))


if __name__ == "__main__":
    main()
