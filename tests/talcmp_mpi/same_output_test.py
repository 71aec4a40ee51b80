#!/usr/bin/env python3
"""However many ranks compare, standard output, standard error and the exit status are talcmp's own,
byte for byte, and so are pictures.

Draws a new seed in every run and prints it; the environment variable TALNUMERICARRAY_SEED sets it.
"""

import os
import random
import sys
import unittest

import numpy as np

from ranks import SETTINGS, Folder, MarkedRun, read_bytes, run_alone, run_ranks, run_tests, talcmp_mpi

try:
    import h5py
    from support.damaged_hdf5 import write_file_on_which_the_library_fails
except ImportError:
    h5py = None

SEED = int(os.environ.get("TALNUMERICARRAY_SEED", random.randrange(2**32)))
print(f"seed {SEED}", file=sys.stderr)
MIB = 2**20
# Open MPI need not look for fast networks here, which takes longer than most runs; other tests of
# talcmp-mpi let it.
SETTINGS["OMPI_MCA_pml"] = "ob1"
SOME_RANKS = 3  # most of what is compared is compared by so many
# Of many pairs those up to 32 MiB are compared by one rank each; all ranks share what is larger.
LARGE = 40 * MIB
LONG_LIST = ("-n", "100")


def near(rng, values, count=300):
    """A copy in which some numbers, the first and the last among them, have other last digits, or
    other digits everywhere."""
    other = values.copy(order="K")
    flat = other.reshape(-1, order="A")
    places = np.concatenate(([0, flat.size - 1], rng.integers(0, flat.size, size=count)))
    flat[places] = np.where(rng.random(places.size) < 0.5, flat[places] * 3 + 1,
                            np.nextafter(flat[places], 10) if values.dtype.kind == "f"
                            else flat[places] + 1)
    return other


def write_hdf5(path, arrays, **options):
    """The options are those of the arrays of two dimensions or more."""
    with h5py.File(path, "w") as file:
        for name, values in arrays.items():
            fitting = dict(options if np.ndim(values) > 1 else {})
            if "chunks" in fitting:
                fitting["chunks"] = tuple(map(min, options["chunks"], values.shape))
            file.create_dataset(name, data=values, **fitting)


def readable(answer):
    return answer[0], *(text.decode(errors="backslashreplace") for text in answer[1:])


class SameOutput(Folder):
    def setUp(self):
        super().setUp()
        self.rng = np.random.default_rng([SEED, *self.id().encode()])

    def check(self, status, *arguments, ranks=SOME_RANKS, **options):
        """The status is what talcmp has to answer, so that no case is another than it says."""
        with self.subTest(arguments=arguments, ranks=ranks, seed=SEED):
            expected = run_alone(*arguments, **options)
            self.assertEqual(expected[0], status, readable(expected))
            self.assertEqual(readable(run_ranks(ranks, *arguments, **options)),
                             readable(expected))
            return expected

    def check_each(self, status, lists_of_options, *operands):
        for options in lists_of_options:
            self.check(status, *options, *operands)

    def reals(self, *shape, dtype="f8"):
        return self.rng.standard_normal(shape).astype(dtype)

    def save_pair(self, name, size, dtype="f8"):
        """Two files of so many bytes, whose numbers differ in a few places."""
        values = self.reals(size // np.dtype(dtype).itemsize // 1024, 1024, dtype=dtype)
        return (self.save(f"{name}1.npy", values),
                self.save(f"{name}2.npy", near(self.rng, values)))


# ---- Two folders that hold pairs of every kind

class EveryKind(SameOutput):
    def setUp(self):
        super().setUp()
        self.one, self.two = self.make_folder("one"), self.make_folder("two")

    def save_both(self, name, first, second, dtype1=None, dtype2=None, order1=None, order2=None):
        self.save(f"one/{name}.npy", first, dtype1, order1)
        self.save(f"two/{name}.npy", second, dtype2 or dtype1, order2 or order1)

    def add_numpy_files(self):
        for rows in (100, 5500):  # the second has 42 MiB
            values = self.reals(rows, 1000)
            other = near(self.rng, values)
            self.save_both(f"rows{rows}", values, other)
            self.save_both(f"columns{rows}", values, other, order1="F")
            self.save_both(f"orders{rows}", values, other, order2="F")
            self.save_both(f"same{rows}", values, values, order1="F", order2="C")
            self.save_both(f"swapped{rows}", values, other, "<f4", ">f8")
        integers = self.rng.integers(0, 100, size=(300, 1500))
        types = (("i2", "f8"), ("i1", ">i8"), ("f2", "c16"), ("c8", "f4"), ("u1", "u1"), ("?", "?"),
                 (">c16", "c16"))
        for i, (type1, type2) in enumerate(types):
            self.save_both(f"types{i}", integers, near(self.rng, integers), type1, type2)
        self.save_both("shapes", integers, integers.T)
        self.save_both("ranks", integers, integers[:, None])
        self.save_both("numbers", 1.5, 2)
        self.save_both("nothing", np.zeros((0, 5)), np.zeros((0, 5)))
        odd = self.reals(700, 300)
        odd[self.rng.random(odd.shape) < 0.1] = np.nan
        odd[self.rng.random(odd.shape) < 0.1] = -np.inf
        self.save_both("odd", odd, np.where(self.rng.random(odd.shape) < 0.1, -0.0, odd))
        for i in range(30):
            values = self.reals(int(self.rng.integers(1, 50000)))
            other = near(self.rng, values) if i % 5 == 0 else values
            self.save_both(f"sub{i % 4}/{i}", values, other)

    def add_other_formats(self):
        large = np.round(self.reals(5000, 1000), 1)
        first = {"large": large, "middle": large[:100], "small": np.arange(5), "only1": 1,
                 "text": np.array(["a"])}
        second = {**first, "large": near(self.rng, large), "middle": near(self.rng, large[:100])}
        second["only2"] = second.pop("only1")
        self.save_archive("one/stored.npz", **first)
        self.save_archive("two/stored.npz", **second)
        first["large"], second["large"] = first["middle"], second["middle"]
        self.save_archive("one/compressed.npz", np.savez_compressed, **first)
        self.save_archive("two/compressed.npz", np.savez_compressed, **second)
        if h5py:
            options = {"chunks": (100, 300), "compression": "gzip", "compression_opts": 1}
            write_hdf5(self.path("one/a.h5"), {"g/x": large, "y": large[:30]}, **options)
            write_hdf5(self.path("two/a.h5"), {"g/x": large, "y": large[:30] + 1}, **options)

    def add_trouble(self):
        for name in ("empty", "broken", "short", "text", "lost"):
            self.save(f"one/{name}.npy", np.arange(9))
        self.write("two/empty.npy", b"")
        self.write("two/broken.npy", b"no array at all")
        self.write("two/short.npy", read_bytes(f"{self.one}/short.npy")[:-1])
        self.save("two/text.npy", np.array(["a"]))
        os.symlink("nowhere", f"{self.two}/lost.npy")
        os.symlink("..", self.path("two/sub3/up"))
        os.mkfifo(f"{self.one}/pipe.npy")
        self.write("one/notes.txt", b"")
        self.save("one/only1.npy", 1)
        self.save("two/sub1/only2.npy", 1)

    def test_of_files(self):
        self.add_numpy_files()
        self.check_each(1, (("-v",), ("--report", *LONG_LIST), ("--json",), ("-q",),
                            ("--relative=1e-9", "--absolute=0.1", "--equal-nan", "--json"),
                            ("--tol=10.5",), ("--strict-type",), ("--squeeze", "-v")),
                        self.one, self.two)
        self.check(2, "--slice=...,::-3", *LONG_LIST, self.one, self.two)
        self.check(0, "-v", self.one, self.one)

    def test_of_archives_and_trouble(self):
        self.add_other_formats()
        self.add_trouble()
        self.check_each(2, (("-v", "--skip-others"), ("--json",), ("-q",), ("--exclude=sub*",)),
                        self.one, self.two)
        self.check(1, "--first", self.one, self.two)

    def test_by_any_number_of_ranks(self):
        self.add_numpy_files()
        self.add_other_formats()
        self.add_trouble()
        for ranks in (1, 2, 5, 16):
            self.check(2, "-v", self.one, self.two, ranks=ranks)
        self.check(2, "--json", *LONG_LIST, self.one, self.two, ranks=5)

    def test_first_differences(self):
        """Whichever rank finds one first, the first in order ends the run."""
        for i in range(300):
            self.save_both(f"{i:03}", i, i)
        for i in (299, 150, 100):
            self.save_both(f"{i:03}", i, -1)
            self.check(1, "--first", "-v", self.one, self.two)
        self.write("one/200.npy", b"")
        self.check(1, "--first", self.one, self.two)
        self.write("one/050.npy", b"")
        self.check(2, "--first", "-q", self.one, self.two, ranks=5)

    def test_many_files(self):
        for i in range(2000):
            self.save_both(i, i, i + (i % 100 == 0))
        self.check(1, "-v", self.one, self.two)


# ---- Two arrays

class AnyNumberOfRanks(SameOutput):
    def test_share_an_array(self):
        a, b = self.save_pair("a", LARGE)
        for ranks in (1, 2, 5, 16):
            self.check(1, "--report", *LONG_LIST, a, b, ranks=ranks)
            self.check(0, "-v", a, a, ranks=ranks)

    def test_may_have_no_work(self):
        a = self.save("a.npy", 1)
        for ranks in (1, 16):
            self.check(0, "-v", a, a, ranks=ranks)
            self.check(2, a, self.path("b.npy"), ranks=ranks)

    def test_without_mpirun(self):
        a, b = self.save_pair("a", 3 * MIB)
        for arguments in (("--report", a, b), ("-v", a, a), (a, self.path("c.npy"))):
            self.assertEqual(readable(MarkedRun([talcmp_mpi(), *arguments]).finish()),
                             readable(run_alone(*arguments)))


class TwoFiles(SameOutput):
    def test_of_several_sizes(self):
        for size in 3 * MIB, LARGE:
            a, b = self.save_pair(str(size), size)
            self.check_each(1, ((), LONG_LIST, ("--json", "--threads=1"), ("-q",)), a, b)

    def test_one_difference_anywhere(self):
        values = self.reals(5 * MIB)
        a = self.save("a.npy", values)
        for place in (0, int(self.rng.integers(values.size)), values.size - 1):
            changed = values.copy()
            changed[place] += 1
            b = self.save("b.npy", changed)
            self.check_each(1, ((), ("-q",)), a, b)

    def test_differences_everywhere(self):
        """The list is longer than a pipe or a message holds."""
        a, b = (self.save(name, self.reals(5 * MIB)) for name in ("a.npy", "b.npy"))
        self.check(1, "-n", 200000, "--report", a, b)
        self.check(1, "-n", 50000, "--json", a, b)

    def test_tolerances(self):
        values = self.reals(5 * MIB)
        a = self.save("a.npy", values)
        b = self.save("b.npy", values * (1 + self.rng.standard_normal(values.size) * 1e-12))
        for tolerance in (("--tol=10.5",), ("--tol=0.5",),
                          ("--absolute=1e-13", "--relative=1e-14")):
            self.check(1, *tolerance, "--report", a, b)
        self.check(0, "--relative", 1e-10, a, b)

    def test_in_other_orders(self):
        values = self.reals(5500, 1000)
        rows = self.save("a.npy", values)
        columns = self.save("b.npy", near(self.rng, values), order="F")
        self.check_each(1, (LONG_LIST, ("-q",)), rows, columns)
        self.check(1, *LONG_LIST, columns, self.save("c.npy", values, order="F"))


class PartsOfArrays(SameOutput):
    def setUp(self):
        super().setUp()
        values = self.reals(50, 400, 300)
        self.a = self.save("a.npy", values)
        self.b = self.save("b.npy", near(self.rng, values, 30000))
        self.columns = self.save("c.npy", near(self.rng, values, 30000), order="F")

    def test_slices(self):
        for chosen in ("::3,5:-5", "..., 7", "::-1,::2", "10:40,:,::-7"):
            self.check(1, "--slice", chosen, *LONG_LIST, self.a, self.b)
        self.check(1, "--slice=::3,5:-5", "--report", self.b, self.columns)
        self.check(0, "--slice=3:3", "-v", self.a, self.b)
        self.check(2, "--slice=50", self.a, self.b)

    def test_masks(self):
        ignored = self.rng.random((50, 400, 300)) < 0.9
        mask = self.save("mask.npy", ignored)
        for options in (LONG_LIST, ("--report", "--slice=::2,::3")):
            self.check(1, "--ignore", mask, *options, self.a, self.b)
        everything = self.save("everything.npy", np.ones((50, 400, 300), "?"))
        for options in ((), ("--report",)):
            self.check(0, "-v", "--ignore", everything, *options, self.a, self.b)
        archive = self.save_archive("masks.npz", np.savez_compressed, x=ignored, y=~ignored)
        self.check(1, "--ignore", f"{archive}[y]", "--report", self.a, self.columns)
        for wrong in (self.path("missing.npy"), self.save("wrong.npy", np.zeros(3, "?")), self.a):
            self.check(2, "--ignore", wrong, self.a, self.b)

    def test_pictures(self):
        self.check_picture(self.path("a.png"), "--report")
        self.check_picture(self.path("a.svg"), "--slice=:,0,0", "--tol=20")

    def check_picture(self, picture, *options):
        arguments = ("--picture", picture, *options, self.a, self.b)
        expected = run_alone(*arguments)
        drawn = read_bytes(picture)
        os.remove(picture)
        self.assertEqual(readable(run_ranks(SOME_RANKS, *arguments)), readable(expected))
        self.assertTrue(read_bytes(picture) == drawn, f"another picture, seed {SEED}")

    def test_pictures_that_cannot_be_drawn(self):
        for options in ((), ("--first", "-q")):
            self.check(2, "--picture", f"{self.folder}/missing/a.png", *options, self.a, self.b)
        empty = self.save("empty.npy", np.zeros((0, 3)))
        self.check(0, "--picture", self.path("a.svg"), empty, empty)
        self.check(2, "--picture", self.path("a.png"), self.make_folder("one"), self.folder)


class Archives(SameOutput):
    def setUp(self):
        super().setUp()
        self.values = self.reals(4500000)  # 34 MiB
        self.other = near(self.rng, self.values)

    def test_members(self):
        few = self.values[:300000]
        a = self.save_archive("a.npz", x=self.values, y=self.values, z=np.zeros(3))
        b = self.save_archive("b.npz", np.savez_compressed, x=few, y=np.zeros(4500000), w=1)
        c = self.save_archive("c.npz", x=self.other)
        self.check(1, *LONG_LIST, f"{a}[y]", b)
        self.check(1, "--report", f"{a}[y]", c)
        self.check(1, "-v", "--include=y", a, b)
        self.check(1, "-v", "--exclude=z", a, b)
        self.check(0, "-v", f"{a}[y]", f"{a}[x]")
        self.check(2, f"{a}[none]", b)
        self.check(2, a, self.save("a.npy", 1))
        self.check(1, c, self.save("x.npy", self.values))

    def test_damaged(self):
        for save, count in (np.savez_compressed, 300000), (np.savez, 4500000):
            good = self.save_archive("good.npz", save, large=self.values[:count], x=np.arange(4))
            damaged = bytearray(read_bytes(good))
            damaged[len(damaged) // 3] ^= 1
            bad = self.write("bad.npz", damaged)
            self.check(2, good, bad)
            self.check(2, "-q", f"{good}[large]", f"{bad}[large]")
        self.check(2, good, self.write("short.npz", read_bytes(good)[:MIB]))


@unittest.skipIf(h5py is None, "NOT TESTED: HDF5 files, as this machine lacks the module h5py")
class Hdf5Files(SameOutput):
    def setUp(self):
        super().setUp()
        self.values = np.round(self.reals(43, 1000, 100), 1)  # 33 MiB
        self.other = near(self.rng, self.values)

    def write_pair(self, options1, options2):
        write_hdf5(self.path("a.h5"), {"g/x": self.values, "y": np.arange(5)}, **options1)
        write_hdf5(self.path("b.h5"), {"g/x": self.other, "y": np.arange(5)}, **options2)
        return f"{self.folder}/a.h5[g/x]", f"{self.folder}/b.h5[/g/x]"

    def check_layouts(self, options1, options2, *more):
        pair = self.write_pair(options1, options2)
        self.check_each(1, (("--report", *LONG_LIST), *more), *pair)

    def test_contiguous(self):
        self.check_layouts({}, {}, ("--slice=::2,0",))

    def test_chunked(self):
        chunks = {"chunks": (4, 100, 30)}
        self.check_layouts(chunks, chunks, ("-q",), ("--slice=::2,0",))

    def test_compressed(self):
        gzip = {"chunks": (5, 250, 100), "compression": "gzip", "compression_opts": 1,
                "shuffle": True}
        self.check_layouts(gzip, gzip, ("--slice=::2,0",))

    def test_other_filters(self):
        chunks = {"chunks": (10, 100, 100)}
        self.check_layouts({**chunks, "compression": "szip"}, {**chunks, "fletcher32": True})
        pair = self.write_pair({**chunks, "compression": "lzf"}, chunks)
        without = {**os.environ, "HDF5_PLUGIN_PATH": self.folder}
        expected = run_alone(*pair, env=without)
        self.assertIn(b"lacks the filter lzf", expected[2])
        self.assertEqual(readable(run_ranks(SOME_RANKS, *pair, variables=without)),
                         readable(expected))

    def test_in_chunks_of_other_shapes(self):
        self.check_layouts({"chunks": (43, 10, 10)}, {"chunks": (1, 1000, 100)})
        self.check_layouts({"chunks": (7, 300, 33)}, {})

    def test_beside_files(self):
        a = self.write_pair({"chunks": (4, 100, 30)}, {})[0]
        self.check(1, "--report", a, self.save("b.npy", self.other))
        self.check(1, *LONG_LIST, a, self.save("c.npy", self.other, order="F"))

    def test_as_masks(self):
        mask = self.path("mask.h5")
        write_hdf5(mask, {"m": self.rng.random(self.values.shape) < 0.5}, chunks=(7, 100, 30),
                   compression="gzip")
        self.check(1, "--ignore", mask, "--report", *self.write_pair({"chunks": (4, 100, 30)}, {}))
        self.check(1, "--ignore", mask, self.save("a.npy", self.values),
                   self.save("b.npy", self.other))

    def test_damaged(self):
        good, _ = self.write_pair({"chunks": (1, 1000, 100), "fletcher32": True}, {})
        contents = bytearray(read_bytes(f"{self.folder}/a.h5"))
        contents[contents.index(self.values[30, 500].tobytes())] ^= 1
        bad = self.write("bad.h5", contents)
        self.check(2, good, bad)
        self.check(2, bad, self.write("short.h5", contents[:20 * MIB]))

    def test_with_an_array_on_which_the_library_fails(self):
        path = self.path("a.h5")
        write_file_on_which_the_library_fails(path)
        self.check(0, "-v", f"{path}[x]", f"{path}[x]")
        self.check(0, "-v", "--exclude=v", path, path)
        if b"AddressSanitizer" not in run_alone(path, path)[2]:  # which ends the process before
            self.check(2, path, path)

    def test_with_files_that_are_missing(self):
        path = self.path("a.h5")
        layout = h5py.VirtualLayout(shape=(4,), dtype="f8")
        layout[:] = h5py.VirtualSource("missing.h5", "x", shape=(4,))
        with h5py.File(path, "w", libver="latest") as file:
            file["x"] = np.arange(3.0)
            file.create_virtual_dataset("v", layout)
            file.create_dataset("e", shape=(4,), dtype="f8",
                                external=[(self.path("missing"), 0, h5py.h5f.UNLIMITED)])
        self.check(0, "-v", f"{path}[x]", f"{path}[x]")
        self.check(2, "-v", path, path)


class NetcdfFiles(SameOutput):
    def check_format(self, file_format, **options):
        try:
            import netCDF4
        except ImportError as error:
            self.skipTest(f"NOT TESTED: {error}")
        values = self.reals(40, 2000, 60)  # 37 MiB
        paths = []
        for name, contents in (("a.nc", values), ("b.nc", near(self.rng, values))):
            paths.append(self.path(name))
            with netCDF4.Dataset(paths[-1], "w", format=file_format) as dataset:
                for dimension, length in (("time", None), ("y", 2000), ("x", 60)):
                    dataset.createDimension(dimension, length)
                dataset.createVariable("v", "f8", ("time", "y", "x"), **options)[:] = contents
                dataset.createVariable("time", "i4", ("time",))[:] = np.arange(40)
        self.check(1, "--report", *LONG_LIST, *paths)
        self.check(1, "--slice=::2", f"{paths[0]}[v]", f"{paths[1]}[v]")
        self.check(2, paths[0], self.write("short.nc", read_bytes(paths[0])[:10 * MIB]))

    def test_classic(self):
        self.check_format("NETCDF3_64BIT_OFFSET")

    def test_as_hdf5(self):
        self.check_format("NETCDF4", zlib=True, complevel=1, shuffle=True)


# ---- Operands, trouble, and other command lines

class Operands(SameOutput):
    def test_patterns_and_folders(self):
        for i in range(12):
            self.save(f"one/{i}.npy", i)
            self.save(f"two/{i}.npy", -i)
        one, two = self.path("one"), self.path("two")
        self.check(1, "-v", f"{one}/*.npy", f"{two}/1*.npy")
        self.check(0, "-v", f"{one}/?.npy", one + "/[0-9].npy")
        self.check(1, "-v", one, f"{two}/*0.npy")
        self.check(2, f"{one}/none*.npy", f"{two}/*.npy")
        self.check(1, f"{one}/1.npy", two)
        self.check(2, one, self.save("three/x.npy", 1))
        self.check(2, self.make_folder("empty"), self.path("empty"))

    def test_trouble(self):
        a, b = self.save_pair("a", LARGE)
        for second in (self.write("short.npy", read_bytes(b)[:35 * MIB]),
                       self.write("long.npy", read_bytes(b) + b"x"),
                       self.write("text.npy", b"text"), self.save("letter.npy", np.array(["a"])),
                       "/dev/null", f"{a}[x]"):
            self.check(2, a, second)
        self.check(2, "--json", self.path("missing.npy"), a)

    def test_files_that_may_not_be_read(self):
        if os.geteuid() == 0:
            self.skipTest("NOT TESTED: root may read every file")
        a, b = self.save_pair("a", 3 * MIB)
        os.chmod(b, 0)
        self.check(2, a, b)

    def test_names(self):
        """Control characters are shown as their numbers."""
        odd = self.save("a\n\x1b[31m\x7f\u009b \udcff.npy", 1)
        self.check(0, "-v", odd, odd)
        self.check(2, "--json", odd, self.path("c\r\n\t\b.npy"))

    def test_command_lines(self):
        a = self.save("a.npy", 1)
        for arguments in ((), (a,), ("--tol=x", a, a), ("--no\n", a, a)):
            self.check(2, *arguments)
        for arguments in (("--help",), ("--version",)):
            self.check(0, *arguments)


class WhatOneProcessOnlyCanRead(SameOutput):
    def refuse(self, name, *arguments, ranks=SOME_RANKS):
        with self.subTest(arguments=arguments, ranks=ranks):
            self.assertEqual(
                readable(run_ranks(ranks, *arguments)),
                (2, "", f"talcmp: {name}: can be read by one process only; save it to a file "
                        "first\n"))

    def test_standard_input(self):
        a = self.save("a.npy", np.arange(3))
        for operands in (("-", a), (a, "-[x]"), ("--ignore=-[x]", a, a), ("-q", a, "-")):
            self.refuse("standard input", *operands)
        self.refuse("standard input", "-", a, ranks=1)

    def test_pipes(self):
        """Nobody ever writes to it."""
        a, pipe = self.save("a.npy", np.arange(3)), self.path("pipe.npy")
        os.mkfifo(pipe)
        for operands in ((pipe, a), (f"{pipe}[x]", a), ("--ignore", pipe, a, a)):
            self.refuse(pipe, *operands)
        self.refuse(pipe, a, pipe, ranks=1)

    def test_without_mpirun(self):
        a = self.save("a.npy", np.arange(3))
        self.assertEqual(
            readable(MarkedRun([talcmp_mpi(), "-", a]).finish()),
            (2, "", "talcmp: standard input: can be read by one process only; save it to a file "
                    "first\n"))


if __name__ == "__main__":
    run_tests()
