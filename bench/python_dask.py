#!/usr/bin/python3
"""Times comparisons of Dask arrays: python_dask.py [--quick]; PYTHONPATH has the package.

Prints rows as JSON, each with a "name" and the best of some repetitions:
- "build", "optimize", "compare, threads", "same, threads" and "sum, threads": microseconds a block,
  of arrays with small blocks; the sum is that of one of the arrays, by Dask alone. "compare" and
  "same" include what "optimize" takes, but not "build".
- "one worker" and "two workers": seconds for `compare` of two Zarr stores, each worker a process
  with one thread; "bytes" of both arrays.
- "ratio": how many times faster two workers are.
"""

from __future__ import annotations

import itertools
import json
import logging
import sys
import tempfile
import time
from typing import Any, Callable, Dict, List

import dask
import dask.array as da
import distributed
import numpy as np
import zarr

import talnumericarray.dask as td


def seconds_of(action: Callable[[], Any], repetitions: int) -> float:
    """The least; the first run, which is not counted, loads what is needed."""
    action()
    times = []
    for _ in range(repetitions):
        begin = time.perf_counter()
        action()
        times.append(time.perf_counter() - begin)
    return min(times)


def overheads(blocks: int, repetitions: int) -> List[Dict[str, Any]]:
    first, second = (da.zeros(10 * blocks, chunks=10) for _ in range(2))
    comparison, same = td.compare(first, second), td.same(first, second)
    actions = {
        "build": lambda: td.compare(first, second),
        "optimize": lambda: dask.optimize(comparison),
        "compare, threads": lambda: comparison.compute(scheduler="threads", num_workers=2),
        "same, threads": lambda: same.compute(scheduler="threads", num_workers=2),
        "sum, threads": lambda: first.sum().compute(scheduler="threads", num_workers=2),
    }
    return [
        {
            "name": name,
            "blocks": blocks,
            "microseconds_a_block": round(1e6 * seconds_of(action, repetitions) / blocks, 1),
        }
        for name, action in actions.items()
    ]


def write_store(path: str, blocks: int, block: int, factor: float) -> None:
    store = zarr.open(path, "w", shape=blocks * block, chunks=block, dtype="f8")
    for i in range(blocks):
        store[i * block : (i + 1) * block] = (1 + np.arange(block) % 1000) * factor


def seconds_by(workers: int, first: str, second: str, repetitions: int) -> float:
    with distributed.LocalCluster(
        n_workers=workers,
        threads_per_worker=1,
        processes=True,
        dashboard_address="127.0.0.1:0",
        host="127.0.0.1",
        silence_logs=logging.ERROR,
    ) as cluster, distributed.Client(cluster):
        runs = itertools.count()

        def compare() -> None:
            # Under another name, as a cluster may still have the result of the same question.
            names = (f"run {next(runs)}", "second")
            td.compare(da.from_zarr(first), da.from_zarr(second), tol=20, names=names).compute()

        return seconds_of(compare, repetitions)


def main() -> None:
    quick = "--quick" in sys.argv[1:]
    repetitions = 1 if quick else 5
    rows = overheads(100 if quick else 10_000, repetitions)
    blocks, block = (4, 1000) if quick else (64, 1_000_000)
    with tempfile.TemporaryDirectory() as folder:
        first, second = f"{folder}/first.zarr", f"{folder}/second.zarr"
        write_store(first, blocks, block, 1.0)
        write_store(second, blocks, block, 1 + 2.0**-40)
        seconds = [seconds_by(workers, first, second, repetitions) for workers in (1, 2)]
    for name, value in zip(("one worker", "two workers"), seconds):
        rows.append({"name": name, "bytes": 16 * blocks * block, "seconds": round(value, 4)})
    rows.append({"name": "ratio", "ratio": round(seconds[0] / seconds[1], 2)})
    print(json.dumps(rows))


if __name__ == "__main__":
    main()
