#!/usr/bin/env python3
"""Compares netCDF files of the classic formats, which netCDF's own library writes, with each other
and with .npy files of the same values.

Draws a new seed in every run and prints it; the environment variable TALNUMERICARRAY_SEED sets it.
"""

import itertools
import os
import random
import sys

import numpy as np

from support.talcmp_command import EMULATED, Folder, read_bytes, run_tests, some, summary

try:
    import netCDF4
except ImportError:
    print("NOT TESTED: netCDF files, as this machine lacks the module netCDF4")
    sys.exit(77)  # which CTest reports as skipped

SEED = int(os.environ.get("TALNUMERICARRAY_SEED", random.randrange(2**32)))
OLD_TYPES = ["i1", "i2", "i4", "f4", "f8"]
TYPES = {"NETCDF3_CLASSIC": OLD_TYPES, "NETCDF3_64BIT_OFFSET": OLD_TYPES,
         "NETCDF3_64BIT_DATA": OLD_TYPES + ["u1", "u2", "u4", "i8", "u8"]}
# Emulation is slow.
ROUNDS = 1 if EMULATED else 3
print(f"seed {SEED}", file=sys.stderr)


def member(path, name):
    """What messages call a variable."""
    return f"{path}[/{name}]"


def different(index, ours, theirs):
    """How talcmp describes a pair of which one number is the negative of the other, or of
    integers."""
    reason = "different integers" if ours.dtype.kind in "iu" else "opposite signs"
    return f"{list(map(int, index))}: {ours:g} and {theirs:g} ({reason})"


class NetcdfFiles(Folder):
    def setUp(self):
        super().setUp()
        self.rng = np.random.default_rng(SEED)

    def random_values(self, dtype, shape):
        """Of any bits: infinities, NaNs and subnormal numbers as well."""
        dtype = np.dtype(dtype)
        size = int(np.prod(shape)) * dtype.itemsize
        return np.frombuffer(self.rng.bytes(size), dtype=dtype).reshape(shape)

    def add_attributes(self, dataset, types):
        """Of every type and of lengths that need padding or none."""
        dataset.setncattr("text", "t" * int(self.rng.integers(0, 6)))
        for dtype in types:
            dataset.setncattr(f"numbers_{dtype}",
                              self.random_values(dtype, (int(self.rng.integers(1, 6)),)))

    def write_netcdf(self, name, file_format, arrays, in_records=(), attributes=True):
        """Writes arrays, of which the first dimension is that of the records for those named."""
        path = self.path(name)
        with netCDF4.Dataset(path, "w", format=file_format) as dataset:
            dataset.set_fill_off()
            if in_records:
                dataset.createDimension("time", None)
            if attributes:
                self.add_attributes(dataset, TYPES[file_format])
            for array_name, values in arrays.items():
                self.add_variable(dataset, array_name, values, array_name in in_records)
                if attributes and self.rng.random() < 0.5:
                    self.add_attributes(dataset.variables[array_name], TYPES[file_format])
            for array_name, values in arrays.items():
                dataset.variables[array_name][...] = values
        return path

    def add_variable(self, dataset, name, values, in_records):
        dimensions = ["time"] if in_records else []
        for length in values.shape[len(dimensions):]:
            dimensions.append(f"of_{length}")
            if dimensions[-1] not in dataset.dimensions:
                dataset.createDimension(dimensions[-1], length)
        variable = dataset.createVariable(name, values.dtype, dimensions)
        variable.set_auto_maskandscale(False)

    def check_variable(self, path, name, values, *options):
        ours, npy = member(path, name), self.save("a.npy", values)
        answer = "are the same" if values.size else "are the same (no elements)"
        options += f"--include={name}", "-v"
        self.expect(0, f"{ours} {npy} {answer}\n", "", *options, path, npy)
        self.expect(0, f"{npy} {ours} {answer}\n", "", *options, npy, path)

    def check_difference(self, path, name, values, index, *options):
        """The value at the index is 100."""
        changed = values.copy()
        changed[index] = 99 if values.dtype.kind in "iu" else -100
        ours, npy = member(path, name), self.save("b.npy", changed)
        options += (f"--include={name}",)
        self.expect(1, f"{ours} {npy} differ: {different(index, values[index], changed[index])}\n",
                    "", *options, path, npy)
        self.expect(1, f"{npy} {ours} differ: {different(index, changed[index], values[index])}\n",
                    "", *options, npy, path)


# ---- What netCDF's library writes

class RandomFiles(NetcdfFiles):
    def random_array(self, dtype, records):
        shape = tuple(map(int, self.rng.integers(1, 6, size=self.rng.integers(0, 4))))
        shape = shape if records is None else (records, *shape)
        values = self.random_values(dtype, shape).copy()
        index = tuple(int(self.rng.integers(length)) for length in shape) if values.size else None
        if index is not None:
            values[index] = 100
        return values, index

    def check_file(self, file_format, fixed, in_records, records):
        """Writes as many variables of each kind, and checks each of them."""
        arrays, places = {}, {}
        kinds = [None] * fixed + [records] * in_records
        self.rng.shuffle(kinds)
        for i, kind in enumerate(kinds):
            dtype = str(self.rng.choice(TYPES[file_format]))
            arrays[f"v{i}"], places[f"v{i}"] = self.random_array(dtype, kind)
        names = {f"v{i}" for i, kind in enumerate(kinds) if kind is not None}
        path = self.write_netcdf("a.nc", file_format, arrays, names)
        for name, values in arrays.items():
            with self.subTest(format=file_format, variable=name, dtype=values.dtype,
                              shape=values.shape, seed=SEED):
                self.check_variable(path, name, values)
                if places[name] is not None:
                    self.check_difference(path, name, values, places[name])

    def test_variables_outside_records(self):
        for file_format in TYPES:
            for count in (1, 4):
                self.check_file(file_format, count, 0, 0)

    def test_one_variable_in_records(self):
        for file_format in TYPES:
            for records in (0, 1, 7):
                for _ in range(ROUNDS):
                    self.check_file(file_format, 1, 1, records)

    def test_several_variables_in_records(self):
        for file_format in TYPES:
            for records in (0, 1, 50):
                for _ in range(ROUNDS):
                    self.check_file(file_format, 2, int(self.rng.integers(2, 5)), records)


class EveryType(NetcdfFiles):
    def test_in_records_and_outside(self):
        for file_format, types in TYPES.items():
            arrays = {f"{dtype}_{place}": self.random_values(dtype, (5, 3)).copy()
                      for dtype in types for place in ("in", "out")}
            for values in arrays.values():
                values[3, 1] = 100
            path = self.write_netcdf("a.nc", file_format, arrays,
                                     {name for name in arrays if name.endswith("in")})
            for name, values in some(self.rng, arrays.items()):
                with self.subTest(format=file_format, name=name, seed=SEED):
                    self.check_variable(path, name, values)
                    self.check_difference(path, name, values, (3, 1))

    def test_alone_in_records_that_are_not_padded(self):
        for file_format, types in TYPES.items():
            for dtype, length in some(self.rng, itertools.product(types, (1, 3, 5))):
                with self.subTest(format=file_format, dtype=dtype, length=length, seed=SEED):
                    values = self.random_values(dtype, (11, length)).copy()
                    values[7, length - 1] = 100
                    path = self.write_netcdf("a.nc", file_format, {"v": values}, {"v"},
                                             attributes=False)
                    self.check_variable(path, "v", values)
                    self.check_difference(path, "v", values, (7, length - 1))


class LargeFiles(NetcdfFiles):
    """Variables of several pieces, which are read by several threads."""

    def check_large(self, shape, other_shape):
        values = self.rng.integers(-30000, 30000, size=shape, dtype="i2")
        index = tuple(int(self.rng.integers(length)) for length in shape)
        values[index] = 100
        arrays = {"other": np.zeros(other_shape, "i1"), "v": values}
        path = self.write_netcdf("a.nc", "NETCDF3_64BIT_OFFSET", arrays, arrays)
        for threads in (1, 2, 5):
            with self.subTest(shape=shape, threads=threads, seed=SEED):
                self.check_variable(path, "v", values, "--threads", threads)
                self.check_difference(path, "v", values, index, "--threads", threads)
        changed = values.copy()
        changed[::7, :, -1] -= 1
        npy = self.save("b.npy", changed)
        for part, outcome in ("1::7,:,-1", 0), ("::2,:,:-1", 0), ("6:8,:2,-1:", 1):
            with self.subTest(shape=shape, part=part, seed=SEED):
                output = (f"{member(path, 'v')} {npy} differ: "
                          + different((7, 0, shape[2] - 1), values[7, 0, -1], changed[7, 0, -1])
                          + "\n") if outcome else ""
                self.expect(outcome, output, "", f"--slice={part}", "--include=v", path, npy)

    def test_short_records(self):
        self.check_large((200001, 3, 5), (200001, 7))

    def test_long_records(self):
        self.check_large((200, 100, 151), (200, 3))

    def test_short_pieces_of_long_records(self):
        self.check_large((300, 2, 3), (300, 20001))


# ---- As archives

class Archives(NetcdfFiles):
    def setUp(self):
        super().setUp()
        self.arrays = {"temp": np.arange(6.0).reshape(2, 3), "b": np.arange(3, dtype="i1"),
                       "time": np.arange(2, dtype="i4")}

    def write_arrays(self, name, file_format):
        return self.write_netcdf(name, file_format, self.arrays, {"temp", "time"})

    def answers(self, path1, path2, names="b temp time"):
        return "".join(f"{member(path1, name)} {member(path2, name)} are the same\n"
                       for name in names.split())

    def test_of_all_formats_are_the_same(self):
        paths = [self.write_arrays(f"{file_format}.nc", file_format) for file_format in TYPES]
        self.assertEqual([read_bytes(path)[:4] for path in paths],
                         [b"CDF\x01", b"CDF\x02", b"CDF\x05"])
        for path1 in paths:
            for path2 in paths:
                self.expect(0, self.answers(path1, path2) + summary(same=3), "", "-v", path1, path2)

    def test_without_a_variable(self):
        path1 = self.write_arrays("a.nc", "NETCDF3_CLASSIC")
        del self.arrays["b"]
        path2 = self.write_arrays("b.nc", "NETCDF3_CLASSIC")
        self.expect(1, f"{path1} {path2} differ: only in {path1}: /b\n"
                    + self.answers(path1, path2, "temp time") + summary(same=2, only_in_first=1),
                    "", "-v", path1, path2)

    def test_of_shorter_records(self):
        path1 = self.write_arrays("a.nc", "NETCDF3_CLASSIC")
        self.arrays["time"] = np.arange(3, dtype="i4")
        self.arrays["temp"] = np.arange(9.0).reshape(3, 3)
        path2 = self.write_arrays("b.nc", "NETCDF3_CLASSIC")
        self.expect(1, f"{member(path1, 'temp')} {member(path2, 'temp')} differ: shape (2, 3) and "
                    f"(3, 3)\n" + summary(different=1), "", "--include=temp", path1, path2)

    def test_with_text(self):
        path = self.path("a.nc")
        with netCDF4.Dataset(path, "w", format="NETCDF3_CLASSIC") as dataset:
            dataset.createDimension("length", 5)
            dataset.createVariable("name", "S1", ("length",))[:] = list("north")
            dataset.createVariable("x", "f8", ())[...] = 1.5
        self.expect(2, self.answers(path, path, "x") + summary(same=1, trouble=1),
                    f"talcmp: {path}[/name]: has elements of type char (text), which is not "
                    "supported; save them as integers of 8 to 64 bits, float or double\n",
                    "-v", path, path)
        self.expect(0, self.answers(path, path, "x") + summary(same=1), "", "-v", "--exclude=name",
                    path, path)

    def test_cut_short(self):
        path = self.write_arrays("a.nc", "NETCDF3_CLASSIC")
        contents = read_bytes(path)
        self.write("a.nc", contents[:-1])
        self.expect(2, self.answers(path, path, "b temp") + summary(same=2, trouble=1),
                    f"talcmp: {path}[/time]: has less data than its shape says (its elements end "
                    f"at byte {len(contents)}, the file at byte {len(contents) - 1}); is the file "
                    "complete?\n", "-v", path, path)
        self.write("a.nc", contents[:10])
        self.expect(2, "", f"talcmp: {path}: ends inside its header (bytes of a number expected: "
                    "4, bytes there: 2); is the file complete?\n", path, path)


if __name__ == "__main__":
    run_tests()
