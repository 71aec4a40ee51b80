#!/usr/bin/python3
"""Times talcmp on files in the cache of the system, next to cmp and NumPy: talcmp_files.py TALCMP
[--quick]. Prints seconds and the greatest resident memory of each."""

import json
import os
import re
import subprocess
import sys
import tempfile
import time

import numpy as np

# A process of its own, so that its memory is known; prints the seconds of the comparison alone.
ALLCLOSE = """
import sys, time
import numpy as np
first, second = (np.load(path) for path in sys.argv[1:])
begin = time.perf_counter()
assert np.allclose(first, second, rtol=2.0**-33, atol=0)
print(time.perf_counter() - begin)
"""


def write_files(folder, count):
    """Doubles, a copy of them, and some that differ in a few digits."""
    paths = [os.path.join(folder, name + ".npy") for name in ("one", "same", "near")]
    # In another process, as a child begins with the memory of its parent.
    writer = os.fork()
    if writer == 0:
        save_arrays(count, *paths)
        os._exit(0)
    assert os.waitpid(writer, 0)[1] == 0, "the files could not be written"
    return paths


def save_arrays(count, one, same, near):
    random = np.random.default_rng(20261121)
    values = random.random(count) + 0.5
    np.save(one, values)
    np.save(same, values)
    np.save(near, values * (1 + random.standard_normal(count) * 2.0**-46))


def seconds_of(command):
    begin = time.perf_counter()
    output = subprocess.run(command, check=True, stdout=subprocess.PIPE).stdout
    seconds = time.perf_counter() - begin
    return float(output) if "-c" in command else seconds


def memory_of(command):
    """The greatest resident memory in bytes, as seen while the command runs."""
    most = 0
    with subprocess.Popen(command, stdout=subprocess.DEVNULL) as process:
        while process.poll() is None:
            with open(f"/proc/{process.pid}/status", encoding="utf-8") as status:
                found = re.search(r"VmHWM:\s+(\d+) kB", status.read())
            most = max(most, 1024 * int(found.group(1)) if found else 0)
            time.sleep(0.001)
    return most


def main():
    talcmp, quick = sys.argv[1], "--quick" in sys.argv
    count, repetitions = (1 << 17, 1) if quick else (1 << 27, 5)
    with tempfile.TemporaryDirectory() as folder:
        one, same, near = write_files(folder, count)
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
        memory = {name: memory_of(command) for name, command in commands.items()}
        # In turns, so that other work of the machine affects all of them.
        seconds = {name: [] for name in commands}
        for _ in range(repetitions):
            for name, command in commands.items():
                seconds[name].append(seconds_of(command))
    print(json.dumps({
        "bytes": 8 * count,
        "rows": [{"name": name, "seconds": min(seconds[name]),
                  "memory": memory[name]} for name in commands]}))


if __name__ == "__main__":
    main()
