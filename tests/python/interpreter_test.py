"""The package as a guest of the interpreter: references, threads, processes, signals, callbacks,
and the objects that it returns."""

import copy
import gc
import multiprocessing
import os
import pickle
import signal
import subprocess
import sys
import threading
import time
import tracemalloc

import numpy as np
import pytest

import talnumericarray as tna

SANITIZED = "TALNUMERICARRAY_SANITIZED" in os.environ
LARGE = 2 * 10**6 if SANITIZED else 10**7


# ---- References and leaks

class Failing(Exception):
    pass


def failing_progress(done, total):
    raise Failing


FIRST = np.arange(12.0).reshape(3, 4)
SECOND = FIRST + (FIRST == 5)
MASK = FIRST == 3
MASKED = np.ma.array(FIRST)
OBJECTS = np.array([None])
EXTENDED = np.zeros(3, "longdouble")
ROWS = FIRST.tolist()
STRIDED = np.repeat(FIRST, 2, axis=1)[:, ::2]
KEPT = [FIRST, SECOND, MASK, MASKED, OBJECTS, EXTENDED, ROWS, STRIDED, failing_progress, None, True,
        FIRST.dtype, MASK.dtype, tna.same, tna.compare, tna.Place]


def calls():
    """Calls of all kinds, with what they raise."""
    yield lambda: tna.same(FIRST, FIRST), None
    yield lambda: tna.same(FIRST, SECOND, tol=3, equal_nan=True, slices=np.s_[:, 1:]), None
    yield lambda: tna.same(STRIDED, ROWS, ignore=MASK, relative=1e-9), None
    yield lambda: tna.equivalent(FIRST, ROWS), None
    yield lambda: tna.compare(FIRST, SECOND, max_places=5, names=("a", "b")), None
    yield lambda: tna.compare(STRIDED, SECOND, ignore=MASK, threads=2, slices="...,:2"), None
    yield lambda: tna.compare(FIRST, ROWS, progress=lambda done, total: None), None
    yield lambda: tna.assert_same(FIRST, FIRST, max_places=2), None
    yield lambda: tna.assert_same(FIRST, SECOND), AssertionError
    yield lambda: tna.same(FIRST, SECOND, progress=failing_progress), Failing
    yield lambda: tna.compare(FIRST, SECOND, progress=failing_progress), Failing
    yield lambda: tna.same(MASKED, FIRST), TypeError
    yield lambda: tna.compare(FIRST, OBJECTS), TypeError
    yield lambda: tna.equivalent(FIRST, EXTENDED), TypeError
    yield lambda: tna.same(FIRST, SECOND, ignore=FIRST), TypeError
    yield lambda: tna.same(FIRST, SECOND, ignore=MASK[0]), ValueError
    yield lambda: tna.same(FIRST, SECOND, tol="x"), TypeError
    yield lambda: tna.same(FIRST, SECOND, tol=1, relative=0.5), ValueError
    yield lambda: tna.same(FIRST, SECOND, rtol=1), TypeError
    yield lambda: tna.compare(FIRST, SECOND, names="ab"), TypeError
    yield lambda: tna.same(FIRST, SECOND, slices=7), ValueError
    yield lambda: tna.same(FIRST, SECOND, slices=(..., ...)), ValueError
    yield lambda: tna.same(FIRST), TypeError


def call_all(times):
    for call, error in calls():
        for _ in range(times):
            if error is None:
                call()
            else:
                with pytest.raises(error):
                    call()


def test_references_are_given_back():
    call_all(2)
    gc.collect()
    before = [sys.getrefcount(each) for each in KEPT]
    call_all(100)
    gc.collect()
    after = [sys.getrefcount(each) for each in KEPT]
    assert [abs(one - other) < 20 for one, other in zip(before, after)] == [True] * len(KEPT)


@pytest.mark.parametrize("number", range(len(list(calls()))))
def test_nothing_leaks(number):
    call, error = list(calls())[number]

    def repeat(times):
        for _ in range(times):
            try:
                call()
            except Exception as raised:  # pylint: disable=broad-except
                assert error is not None and isinstance(raised, error)
        gc.collect()

    def grown():
        tracemalloc.start()
        repeat(50)
        before = tracemalloc.get_traced_memory()[0], sys.getallocatedblocks()
        repeat(300)
        after = tracemalloc.get_traced_memory()[0], sys.getallocatedblocks()
        tracemalloc.stop()
        return after[0] - before[0], after[1] - before[1]

    repeat(50)
    # A leak grows every time; caches and threads that end late may grow once.
    found = [grown() for _ in range(3)]
    assert min(size for size, _ in found) < 3000, found
    assert min(blocks for _, blocks in found) < 100, found


def test_arrays_outlive_the_caller():
    """The callback drops the only other references while the comparison runs."""
    held = [np.zeros(LARGE), np.zeros(LARGE)]
    arguments = held[0][::-1], held[1][::-1]

    def drop(done, total):
        held.clear()

    assert tna.compare(*arguments, progress=drop).same


# ---- Threads

def test_many_threads_at_once():
    pairs = []
    for number in range(8):
        first = np.random.default_rng(number).standard_normal((50, 400))
        second = first.copy("F" if number % 2 else "C")
        second[number, number * 7] += 1
        pairs.append((first, second))
    expected = [tna.compare(*pair) for pair in pairs]
    wrong = []

    def work(number):
        for turn in range(30):
            which = (number + turn) % len(pairs)
            found = tna.compare(*pairs[which], threads=1 + turn % 3)
            if found != expected[which] or tna.same(*pairs[which], tol=turn):
                wrong.append(which)

    threads = [threading.Thread(target=work, args=(number,)) for number in range(12)]
    for thread in threads:
        thread.start()
    for thread in threads:
        thread.join()
    assert not wrong


@pytest.mark.parametrize("call", [lambda first, second: tna.same(first, second, threads=1),
                                  lambda first, second: tna.compare(first, second, threads=1)])
def test_lock_is_released(call):
    """Another thread counts on meanwhile, and does not just get its turns of 5 ms."""
    first, second = np.zeros(4 * LARGE, "f4"), np.zeros(4 * LARGE)
    # This thread asks for the lock at most once during a call.
    sys.setswitchinterval(10)
    try:
        stop, counted, ready = threading.Event(), [0], threading.Event()

        def count():
            ready.set()
            while not stop.is_set():
                counted[0] += 1
                time.sleep(0)

        thread = threading.Thread(target=count)
        thread.start()
        ready.wait()
        before = counted[0]
        call(first, second)
        during = counted[0] - before
        stop.set()
        thread.join()
    finally:
        sys.setswitchinterval(0.005)
    assert during > 100


def test_same_at_once_releases_the_lock():
    """Also where a single call of the module answers."""
    first, second = np.zeros(2**20, "f4"), np.zeros(2**20)
    counted, stop = [0], threading.Event()

    def count():
        while not stop.is_set():
            counted[0] += 1
            time.sleep(0)

    sys.setswitchinterval(10)
    thread = threading.Thread(target=count)
    try:
        thread.start()
        before = counted[0]
        for _ in range(100):
            tna.same(first, second)
        during = counted[0] - before
    finally:
        sys.setswitchinterval(0.005)
        stop.set()
        thread.join()
    assert during > 100


# ---- Processes

def found_in_child(_):
    values = np.arange(300000.0).reshape(300, 1000)
    return tna.compare(values, values.copy("F") + (values == 7), threads=3)


def test_fork_after_threads():
    expected = found_in_child(None)
    child = os.fork()
    if child == 0:
        os._exit(0 if found_in_child(None) == expected else 1)
    assert os.waitstatus_to_exitcode(os.waitpid(child, 0)[1]) == 0
    assert found_in_child(None) == expected


@pytest.mark.parametrize("method", ["fork", "spawn"])
def test_processes_send_comparisons(method):
    with multiprocessing.get_context(method).Pool(2) as pool:
        assert pool.map(found_in_child, range(4)) == [found_in_child(None)] * 4


# ---- Callbacks and signals

def test_progress_ascends_to_the_total():
    first, second = np.zeros(LARGE, "f4"), np.zeros(LARGE)
    for call, options in ((tna.same, {}), (tna.compare, {}), (tna.compare, {"threads": 3})):
        numbers = []
        call(first, second, progress=lambda done, total: numbers.append((done, total)), **options)
        assert {total for _, total in numbers} == {first.nbytes + second.nbytes}
        done = [each for each, _ in numbers]
        assert done == sorted(done)
        assert done[-1] == first.nbytes + second.nbytes
        assert all(type(each) is int for pair in numbers for each in pair)


def test_progress_of_few_elements():
    numbers = []
    tna.same(FIRST, FIRST, progress=lambda done, total: numbers.append((done, total)))
    assert numbers == [(192, 192)]


def test_errors_of_the_callback():
    # To compare all of it would take hours.
    first = np.broadcast_to(np.float64(1), (10**6, 10**7))
    second = np.broadcast_to(np.float32(1), first.shape)
    error = Failing("mine")
    for threads in (1, 3):
        called = []

        def fail(done, total):
            called.append(done)
            raise error

        with pytest.raises(Failing) as raised:
            tna.compare(first, second, progress=fail, threads=threads)
        assert raised.value is error
        assert len(called) == 1
        assert 0 < called[0] < first.nbytes
        with pytest.raises(SystemExit):
            tna.same(FIRST, FIRST, progress=lambda done, total: sys.exit())
        assert tna.same(first[0, :1000], second[0, :1000])
        assert tna.compare(first[0, :1000], second[0, :1000]).pairs == 1000


def test_callback_that_compares():
    found = []
    tna.same(FIRST, FIRST, progress=lambda done, total: found.append(tna.compare(FIRST, SECOND)))
    assert found == [tna.compare(FIRST, SECOND)]


INTERRUPTED = """
import sys, time
sys.path[:0] = {path!r}
import numpy as np
import talnumericarray as tna

first = np.broadcast_to(np.float64(1), (10**6, 10**5))
second = np.broadcast_to(np.float32(1), first.shape)
print("begins", flush=True)
try:
    {call}
except KeyboardInterrupt:
    print(time.monotonic())
"""


@pytest.mark.parametrize("call", ["tna.same(first, second)",
                                  "tna.compare(first, second, threads=1)",
                                  "tna.compare(first, second, threads=2)",
                                  "tna.assert_same(first, second, threads=1)",
                                  "tna.same(first[::-1], second, progress=lambda *_: None)"])
def test_interrupt(call):
    # On a busy machine, a process may have to wait for its turn; not each time.
    assert min(seconds_to_end(call) for _ in range(3)) < (1 if SANITIZED else 0.1)


def seconds_to_end(call):
    with subprocess.Popen([sys.executable, "-c", INTERRUPTED.format(path=sys.path, call=call)],
                          stdout=subprocess.PIPE, text=True) as process:
        assert process.stdout.readline() == "begins\n"
        time.sleep(0.2)
        sent = time.monotonic()
        process.send_signal(signal.SIGINT)
        ended = float(process.stdout.readline())
    assert process.returncode == 0
    return ended - sent


# ---- What is returned

NAN_PAIR = [1.0, np.nan, -0.0, np.inf], [np.nan, 2.0, 0.0, -np.inf]


def comparisons():
    """Of each kind, none like another."""
    return [tna.compare(FIRST, FIRST), tna.compare(FIRST, SECOND), tna.compare(*NAN_PAIR),
            tna.compare(*NAN_PAIR, max_places=9), tna.compare([1j], [1]),
            tna.compare([1], [2], names=("a", "b")), tna.compare([2**63], [5]),
            tna.compare(FIRST, SECOND, tol=60, ignore=MASK), tna.compare(FIRST, FIRST[0]),
            tna.compare([1], [1.0], strict_type=True), tna.compare([], [])]


def test_equality_and_hash():
    ours, theirs = comparisons(), comparisons()
    for number, one in enumerate(ours):
        assert [one == other for other in theirs] == [i == number for i in range(len(theirs))]
        assert hash(one) == hash(theirs[number])
    assert len({*ours, *theirs}) == len(ours)
    assert ours[0] != "text"
    assert ours[2].places[0] == theirs[2].places[0] != ours[3].places[1]


def test_pickles_and_copies():
    for found in comparisons():
        copies = [copy.copy(found), copy.deepcopy(found)]
        copies += [pickle.loads(pickle.dumps(found, protocol))
                   for protocol in range(pickle.HIGHEST_PROTOCOL + 1)]
        for other in copies:
            assert other == found
            assert (repr(other), str(other), hash(other)) == (repr(found), str(found), hash(found))
            assert type(other) is tna.Comparison
            assert [type(place) for place in other.places] == [tna.Place] * len(found.places)
    error = tna.NotSameError(tna.compare(FIRST, SECOND))
    for protocol in range(pickle.HIGHEST_PROTOCOL + 1):
        other = pickle.loads(pickle.dumps(error, protocol))
        assert (type(other), str(other), other.comparison) \
            == (tna.NotSameError, str(error), error.comparison)


def test_nothing_can_be_changed():
    found = tna.compare(FIRST, SECOND)
    for each, name in ((found, "difference"), (found, "same"), (found, "new"),
                       (found.worst, "digits"), (found.places[0], "first"), (found.first, "name"),
                       (found.histogram[0], "pairs"), (found.first_values, "nans")):
        with pytest.raises(AttributeError):
            setattr(each, name, 1)
        with pytest.raises(AttributeError):
            delattr(each, name)
    for name in ("places", "histogram"):
        assert type(getattr(found, name)) is tuple
    hash(found)


def test_representation():
    found = tna.compare([1, 2], [1, 3])
    assert repr(found) == (
        "Comparison(difference='elements', first=ArrayFacts(name='first', type='int64', "
        "stored_type='int64', shape=(2,), selected_shape=(2,), fortran_order=False), "
        "second=ArrayFacts(name='second', type='int64', stored_type='int64', shape=(2,), "
        "selected_shape=(2,), fortran_order=False), tolerance=0.0, "
        "places=(Place(index=(1,), first=2, second=3, digits=None, "
        "reason='different integers'),), pairs=2, ignored=0, differing=1, "
        "worst=Place(index=(1,), first=2, second=3, digits=None, reason='different integers'), "
        "largest_absolute_difference=1.0, largest_relative_difference=0.3333333333333333, "
        "smallest_tolerance=None, why_no_tolerance='[1]: 2 and 3 (different integers)', "
        "first_values=ValueCounts(nans=0, infinities=0, negative_zeros=0), "
        "second_values=ValueCounts(nans=0, infinities=0, negative_zeros=0), "
        "histogram=(Bar(digits=0, pairs=1), Bar(digits=None, pairs=1)))")
    assert str(found) == found.text
    assert [each.__module__ for each in (type(found), type(found.worst), tna.NotSameError)] \
        == ["talnumericarray"] * 3
