"""Comparisons by a `distributed` cluster of two processes, of which one is killed on the way.

With TALNUMERICARRAY_LARGE_CLUSTER in the environment the arrays are larger than the memory that the
workers are allowed, which takes minutes instead of seconds.
"""

from __future__ import annotations

import contextlib
import os
import signal
from concurrent.futures import ThreadPoolExecutor
from concurrent.futures import TimeoutError as FutureTimeout
from pathlib import Path
from typing import Any, Callable, Iterator, List, NamedTuple, Tuple

import dask
import dask.array as da
import numpy as np
import pytest

import talnumericarray as tna
import talnumericarray.dask as td

distributed = pytest.importorskip("distributed")
zarr = pytest.importorskip("zarr")

IS_LARGE = "TALNUMERICARRAY_LARGE_CLUSTER" in os.environ
BLOCKS = 200 if IS_LARGE else 50
BLOCK = 1_000_000 if IS_LARGE else 10_000
MEMORY_LIMIT = 300 << 20
TIMEOUT = 600 if IS_LARGE else 20


@contextlib.contextmanager
def two_workers(folder: Path) -> Iterator[Any]:
    # So long a worker waits for one that has died.
    with dask.config.set({"distributed.comm.timeouts.connect": "2s"}), distributed.LocalCluster(
        n_workers=2,
        threads_per_worker=1,
        processes=True,
        dashboard_address="127.0.0.1:0",
        host="127.0.0.1",
        memory_limit=MEMORY_LIMIT,
        local_directory=str(folder),
    ) as cluster, distributed.Client(cluster, set_as_default=True) as client:
        client.wait_for_workers(2, timeout=TIMEOUT)
        yield client


@pytest.fixture(scope="module")
def client(tmp_path_factory: pytest.TempPathFactory) -> Iterator[Any]:
    with two_workers(tmp_path_factory.mktemp("workers")) as client:
        yield client


class Stores(NamedTuple):
    """Two arrays, in Zarr stores with blocks of different sizes and in files of NumPy."""

    zarr: Tuple[str, str]
    npy: Tuple[str, str]

    def lazy(self) -> Tuple[Any, Any]:
        first, second = (da.from_zarr(path) for path in self.zarr)
        return first, second

    def whole(self) -> Tuple[Any, Any]:
        first, second = (np.load(path, mmap_mode="r") for path in self.npy)
        return first, second


@pytest.fixture(scope="module")
def stores(tmp_path_factory: pytest.TempPathFactory) -> Stores:
    folder = tmp_path_factory.mktemp("stores")
    names = ("first", "second")
    kinds = ("zarr", "npy")
    stores = Stores(*(tuple(str(folder / f"{name}.{kind}") for name in names) for kind in kinds))
    size = BLOCKS * BLOCK
    for which in (0, 1):
        blocks = BLOCK // (which + 1)
        store = zarr.open(stores.zarr[which], "w", shape=size, chunks=blocks, dtype="f8")
        file = np.lib.format.open_memmap(stores.npy[which], "w+", "f8", (size,))
        for start in range(0, size, BLOCK):
            values = np.full(BLOCK, 1.0 + start)
            values[:: BLOCK // 10] = np.nan
            if which == 1:
                values[BLOCK // 3 :: BLOCK // 4] *= 1 + 2.0 ** -(10 + start // BLOCK % 30)
                values[-1] = start // BLOCK % 7
            store[start : start + BLOCK] = values
            file[start : start + BLOCK] = values
    return stores


def peak_memory() -> int:
    """Of this process, in bytes."""
    lines = Path("/proc/self/status").read_text().splitlines()
    return 1024 * int(next(line.split()[1] for line in lines if line.startswith("VmHWM")))


# ---- Answers


def test_blocks_do_not_pile_up_in_workers(client: Any, stores: Stores) -> None:
    before = client.run(peak_memory)
    assert td.same(*(array[:BLOCK] for array in stores.lazy()), equal_nan=True).compute() is False
    assert td.compare(*stores.lazy()).compute().pairs == BLOCKS * BLOCK
    after = client.run(peak_memory)
    for when, peaks in (("before", before), ("after", after)):
        print(f"peak memory {when}, in MiB:", [peak >> 20 for peak in peaks.values()])
    assert len(after) == 2
    if IS_LARGE:
        assert sum(array.nbytes for array in stores.lazy()) > 4 * 2 * MEMORY_LIMIT
        assert max(after.values()) < MEMORY_LIMIT
        assert set(after) == set(before)  # none was replaced


# ---- Tasks that end early


def _logged(block: Any, path: str) -> Any:
    if block.size:
        with open(path, "a", encoding="ascii") as log:
            log.write("x")
    return block


def test_tasks_behind_a_difference_are_released(client: Any, tmp_path: Path) -> None:
    log = tmp_path / "log"
    zeros = da.zeros((200, 100), chunks=(1, 100))
    logged = zeros.map_blocks(_logged, str(log), dtype=float)
    other = da.concatenate([zeros[:1] + 1, zeros[1:]])
    waiting = client.compute(td.same(logged, other), retries=1)
    assert waiting.result(timeout=TIMEOUT) is False
    assert log.stat().st_size == 200
    log.unlink()
    del waiting
    assert td.same(logged, other).compute(retries=1, priority=2) is False
    assert 1 <= log.stat().st_size <= 100
    client.sync(_is_idle, client.cluster.scheduler)


async def _is_idle(scheduler: Any) -> None:
    import asyncio

    for _ in range(10 * TIMEOUT):
        if not scheduler.tasks:
            return
        await asyncio.sleep(0.1)
    raise AssertionError(f"{len(scheduler.tasks)} tasks are left")


def test_other_results_keep_the_tasks_they_need(client: Any, tmp_path: Path) -> None:
    zeros = da.zeros((200, 100), chunks=(1, 100))
    logged = zeros.map_blocks(_logged, str(tmp_path / "log"), dtype=float)
    same = td.same(logged, zeros + 1)
    kept = client.compute(same)
    assert same.compute() is False
    assert kept.result(timeout=TIMEOUT) is False


def test_answers_without_tasks(client: Any) -> None:
    zeros = da.zeros(10, chunks=3)
    assert td.same(zeros, zeros[1:]).compute() is False
    assert td.same(zeros, zeros.astype("f4"), strict_type=True).compute() is False
    assert td.same(zeros[:0], zeros[:0]).compute() is True
    assert td.same(zeros, zeros + 1).persist().compute() is False
    assert td.same(zeros, zeros).persist().compute() is True
    assert td.compare(zeros, zeros + 1).persist().compute().differing == 10
    assert td.same(zeros, zeros + 1).compute(scheduler="threads") is False
    assert td.same(zeros, zeros + 1).compute(optimize_graph=False) is False


def _fail(block: Any) -> Any:
    if block.size:
        raise OSError("a block cannot be read")
    return block


def test_errors_come_through(client: Any) -> None:
    broken = da.zeros(10, chunks=3).map_blocks(_fail, dtype=float)
    for lazy in (td.same(broken, broken), td.compare(broken, broken)):
        with pytest.raises(OSError, match="^a block cannot be read$"):
            lazy.compute()


def _fail_once(block: Any, flag: str) -> Any:
    if block.size and not os.path.exists(flag):
        Path(flag).touch()
        raise OSError("a block cannot be read")
    return block


def test_options_of_compute_reach_the_cluster(client: Any, tmp_path: Path) -> None:
    zeros = da.zeros(10, chunks=3)
    once = zeros.map_blocks(_fail_once, str(tmp_path / "failed"), dtype=float)
    assert td.same(once, zeros).compute(retries=2) is True
    assert (tmp_path / "failed").exists()


def test_assertions_are_computed_by_the_cluster(client: Any, stores: Stores) -> None:
    arrays = [array[:BLOCK] for array in stores.lazy()]
    whole = [array[:BLOCK] for array in stores.whole()]
    with pytest.raises(tna.NotSameError) as caught:
        td.assert_same(*arrays, relative=1e-9)
    assert str(caught.value) == tna.compare(*whole, relative=1e-9).text
    td.assert_same(arrays[0], arrays[0].rechunk(BLOCK // 3))


# ---- Deaths


def _die_once(block: Any, flag: str) -> Any:
    """Kills the process that runs this, unless one was killed before."""
    if block.size:
        try:
            os.close(os.open(flag, os.O_CREAT | os.O_EXCL))
        except FileExistsError:
            return block
        os.kill(os.getpid(), signal.SIGKILL)
    return block


def deadly(array: Any, where: int, flag: Path) -> Any:
    """The array, one block of which kills the first worker that loads it."""
    numbers = array.numblocks[0]
    blocks = [array.blocks[i] for i in range(numbers)]
    blocks[where] = blocks[where].map_blocks(_die_once, str(flag), dtype=array.dtype)
    return da.concatenate(blocks)


def answer_though_a_worker_dies(
    folder: Path, lazy_of: Callable[[Path], Any], compute: Callable[[Any, Any], Any]
) -> Any:
    """What `compute(client, lazy)` returns. Distributed 2022.12 itself may wait for ever for what a
    dead worker had, in one run of twenty: another cluster is tried then.
    """
    for attempt in range(4):
        flag = folder / f"died{attempt}"
        # Closed after the cluster, at whose end a call that hangs is cancelled.
        with ThreadPoolExecutor(1) as pool, two_workers(folder / f"workers{attempt}") as client:
            answer = pool.submit(compute, client, lazy_of(flag))
            with contextlib.suppress(FutureTimeout, TimeoutError):
                result = answer.result(TIMEOUT)
                assert flag.exists()
                return result
    return pytest.fail("no cluster answered")


def test_reports_are_those_for_whole_arrays_though_a_worker_dies(
    stores: Stores, tmp_path: Path
) -> None:
    options = {"tol": 20, "max_places": 30}
    expected = tna.compare(*stores.whole(), **options)
    assert expected.differing > 2 * BLOCKS
    assert expected.pairs == BLOCKS * BLOCK

    def lazy_of(flag: Path) -> Any:
        first, second = stores.lazy()
        lazy = td.compare(deadly(first, BLOCKS // 2, flag), second, **options)
        assert lazy.pairs_of_blocks == 2 * BLOCKS
        return lazy

    found = answer_though_a_worker_dies(
        tmp_path, lazy_of, lambda client, lazy: client.compute(lazy).result()
    )
    assert found.text == expected.text
    assert found == expected


def test_the_same_is_found_though_a_worker_dies(stores: Stores, tmp_path: Path) -> None:
    def lazy_of(flag: Path) -> Any:
        first, _ = stores.lazy()
        return td.same(deadly(first, 3, flag), first)

    is_same = answer_though_a_worker_dies(tmp_path, lazy_of, lambda _, lazy: lazy.compute())
    assert is_same is True
