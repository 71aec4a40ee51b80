"""What is taken for an array, and that nothing is copied that need not be."""

import array
import ctypes
import resource
import subprocess
import sys
import time
import tracemalloc

import numpy as np
import pytest

import talnumericarray as tna

VALUES = [[1.0, 2.0, 3.0], [4.0, 5.0, 6.5]]


class Interface:
    """Has nothing but the array interface, of an array that it keeps."""

    def __init__(self, values):
        self.__array_interface__ = values.__array_interface__
        self.kept = values


class Struct:
    """Has nothing but the C structure of the array interface."""

    def __init__(self, values):
        self.__array_struct__ = values.__array_struct__
        self.kept = values


class Convertible:
    def __init__(self, values):
        self.values = values

    def __array__(self, dtype=None):
        return np.array(self.values, dtype)


class Sequence:
    def __len__(self):
        return len(VALUES)

    def __getitem__(self, index):
        return VALUES[index]


def ctypes_array():
    return ((ctypes.c_double * 3) * 2)(*map(tuple, VALUES))


OBJECTS = {
    "list": VALUES,
    "tuple": tuple(map(tuple, VALUES)),
    "sequence": Sequence(),
    "list of arrays": [np.array(row) for row in VALUES],
    "memoryview": memoryview(np.array(VALUES)),
    "read-only memoryview": memoryview(np.array(VALUES).tobytes()).cast("d", (2, 3)),
    "memoryview with a step": memoryview(np.repeat(np.array(VALUES), 2, axis=0))[::2],
    "ctypes": ctypes_array(),
    "array interface": Interface(np.array(VALUES)),
    "array interface, strided": Interface(np.repeat(np.array(VALUES), 2, axis=1)[:, ::2]),
    "array structure": Struct(np.array(VALUES)),
    "__array__": Convertible(VALUES),
    "matrix": np.array(VALUES).view(np.matrix),
    "Fortran order": np.array(VALUES, order="F"),
    "field": np.array(VALUES).view([("x", "f8")])["x"],
    "reversed": np.array(VALUES)[::-1, ::-1].copy()[::-1, ::-1],
    "unaligned": np.frombuffer(b"-" + np.array(VALUES).tobytes(), "f8", 6, 1).reshape(2, 3),
}


@pytest.mark.parametrize("name", OBJECTS)
def test_kinds_of_objects(name):
    values = OBJECTS[name]
    other = np.array(VALUES)
    other[1, 2] = 7
    for first, second in ((values, VALUES), (VALUES, values)):
        assert tna.same(first, second) is True
        assert tna.equivalent(first, second) is True
        assert tna.compare(first, second).same is True
    assert tna.same(values, other) is False
    found = tna.compare(values, other)
    assert [(place.index, place.first, place.second) for place in found.places] \
        == [((1, 2), 6.5, 7.0)]
    assert found.first.shape == (2, 3) and found.first.stored_type == "float64"


@pytest.mark.parametrize("flat, dtype", [
    (array.array("i", [1, 2, 250]), "int32"),
    (array.array("f", [1, 2, 250]), "float32"),
    (bytearray([1, 2, 250]), "uint8"),
    (memoryview(bytes([1, 2, 250])), "uint8"),
    (memoryview(bytearray([9, 1, 2, 250]))[1:], "uint8"),
    ((ctypes.c_uint16 * 3)(1, 2, 250), "uint16"),
    ((ctypes.c_uint16.__ctype_be__ * 3)(1, 2, 250), "uint16"),
])
def test_flat_objects(flat, dtype):
    assert tna.same(flat, [1, 2, 250])
    found = tna.compare(flat, np.array([1, 3, 250]))
    assert found.first.stored_type == dtype
    assert (found.places[0].index, found.differing) == ((1,), 1)


@pytest.mark.parametrize("scalar", [5, 5.0, 5 + 0j, np.int8(5), np.float16(5), np.float32(5),
                                    np.complex64(5), np.uint64(5), np.array(5), np.bool_(True)])
def test_scalars(scalar):
    other = 1 if isinstance(scalar, np.bool_) else 5
    assert tna.same(scalar, other)
    assert tna.same(other, scalar)
    found = tna.compare(scalar, other + 1)
    assert (found.places[0].index, found.pairs, found.first.shape) == ((), 1, ())


def test_memory_map(tmp_path):
    path = tmp_path / "map"
    mapped = np.memmap(path, "f8", "w+", shape=(1000, 10))
    mapped[...] = np.arange(10000).reshape(1000, 10)
    again = np.memmap(path, "f8", "r", shape=(1000, 10))
    assert tna.same(mapped, again)
    mapped[500, 3] = -1
    assert tna.compare(np.arange(10000.0).reshape(1000, 10), again).places[0].index == (500, 3)


# ---- Large arrays

MANY = 2**31 + 10


def test_more_than_31_bits_of_broadcast_elements():
    began = time.process_time()
    first = np.broadcast_to(np.int8(3), MANY)
    assert tna.same(first, first) is True
    found = tna.compare(first[::-1], np.broadcast_to(np.int8(4), MANY), slices=np.s_[-5:],
                        max_places=2)
    assert [place.index for place in found.places] == [(MANY - 5,), (MANY - 4,)]
    assert (found.differing, found.first.shape) == (5, (MANY,))
    assert time.process_time() - began < 60


def test_places_behind_31_bits():
    """Of memory that is never written, and so takes none."""
    zeros = np.zeros((2, MANY // 2), "i1")
    zeros[1, -3] = 2
    tracemalloc.start()
    zero = np.broadcast_to(np.int8(0), zeros.shape)
    assert tna.same(zero, zeros) is False
    found = tna.compare(zero, zeros)
    assert tracemalloc.get_traced_memory()[1] < 100_000
    tracemalloc.stop()
    place = (1, MANY // 2 - 3)
    assert found.pairs == MANY
    assert found.places[0].index == found.worst.index == place
    assert found.histogram == ((0, MANY - 1), (None, 1))


# ---- Memory

def views():
    """Pairs of large arrays that are not in one order, by names."""
    values = np.random.default_rng(1).standard_normal((2000, 2000))
    return {"C and C": (values, values.copy()),
            "C and Fortran": (values, values.copy("F")),
            "gaps": (values[:, ::2], values[:, ::2].copy()),
            "reversed": (values[::-1], values[::-1].copy()),
            "transposed": (values.T, values.T.copy()),
            "other byte order": (values, values.astype(">f8")),
            "other type": (values.astype("f2"), values.astype("f2").astype("f4")),
            "unaligned": (np.frombuffer(b"-" + values.tobytes(), "f8", values.size, 1),
                          values.ravel()),
            "mask in another order": (values, values.copy())}


@pytest.mark.parametrize("name", views())
def test_nothing_large_is_allocated(name):
    """Neither by NumPy, which tracemalloc follows, nor at all, by the most memory ever used."""
    program = f"""
import resource, sys, tracemalloc
sys.path[:0] = {sys.path!r}
import numpy as np
import objects_test
import talnumericarray as tna

first, second = objects_test.views()[{name!r}]
options = {{}}
if {name!r}.startswith("mask"):
    options["ignore"] = np.zeros(first.shape, bool, "F")
tna.compare(first[:10], second[:10])
ballast = np.ones(5 * 2**20)
del ballast
before = resource.getrusage(resource.RUSAGE_SELF).ru_maxrss
tracemalloc.start()
assert tna.same(first, second, **options)
assert tna.compare(first, second, threads=2, **options).same
print(tracemalloc.get_traced_memory()[1])
print(resource.getrusage(resource.RUSAGE_SELF).ru_maxrss - before)
"""
    output = subprocess.run([sys.executable, "-c", program], check=True, capture_output=True,
                            text=True).stdout
    traced, resident = map(int, output.split())
    assert traced < 200_000
    assert resident < 14_000  # KiB; the smaller arrays have 16 MB
