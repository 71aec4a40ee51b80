#!/usr/bin/env python3
"""What ranks share is read once by all of them together, and by none of them alone; and not to its
end where the answer is known before."""

import pathlib

import numpy as np

from ranks import Folder, MarkedRun, mpirun, run_tests, talcmp_mpi, write_zeros

try:
    import h5py
except ImportError:
    h5py = None

RANKS = 4
MIB = 2**20
GIB = 2**30
# A shell counts the bytes of the processes that it has waited for. Its own status is 0, or mpirun
# would end the others.
COUNTING = '"$@"; (echo $?; cat /proc/$$/io) >"counts.$OMPI_COMM_WORLD_RANK"'


class BytesRead(Folder):
    def bytes_read(self, status, output, *arguments):
        """By each rank."""
        words = mpirun(RANKS, "sh", "-c", COUNTING, "sh", talcmp_mpi(), *arguments)
        self.assertEqual(MarkedRun(words, cwd=self.folder).finish(), (0, output.encode(), b""))
        counts = [pathlib.Path(self.path(f"counts.{rank}")).read_text("ascii").split()
                  for rank in range(RANKS)]
        self.assertEqual(int(counts[0][0]), status)
        self.assertEqual([count[1] for count in counts], ["rchar:"] * RANKS)
        return [int(count[2]) for count in counts]

    def check(self, write, size, share=0.9):
        """Compares large files and small ones, which `write` writes for a path and a size in bytes.
        No rank may read more than its share."""
        counts = []
        for one in size, size // 1024 // MIB * MIB + MIB:
            paths = [write(self.path(name), one) for name in ("a", "b")]
            counts.append(self.bytes_read(0, "", *paths))
        large, small = counts
        read = sum(large) - sum(small)
        self.assertGreater(read, 2 * 0.99 * (size - MIB))
        self.assertLess(read, 2 * 1.01 * size + MIB)
        self.assertLess(max(large) - max(small), share * 2 * size)


class SharedFiles(BytesRead):
    def test_numpy(self):
        self.check(lambda path, size: write_zeros(path + ".npy", size), GIB)

    def test_stored_archive(self):
        def write(path, size):
            np.savez(path + ".npz", x=np.zeros(size // 8))
            return path + ".npz[x]"

        self.check(write, 128 * MIB)

    def write_hdf5(self, path, size, **options):
        with h5py.File(path + ".h5", "w") as file:
            file.create_dataset("x", data=np.zeros(size // 8).reshape(-1, 1024), **options)
        return path + ".h5[x]"

    def test_hdf5(self):
        if h5py is None:
            self.skipTest("NOT TESTED: HDF5 files, as this machine lacks the module h5py")
        self.check(self.write_hdf5, 128 * MIB)
        self.check(lambda path, size: self.write_hdf5(path, size, chunks=(128, 512)), 128 * MIB)
        # The library reads them.
        self.check(lambda path, size: self.write_hdf5(path, size, chunks=(128, 512),
                                                      fletcher32=True), 128 * MIB)


class Folders(BytesRead):
    def test_of_files(self):
        for i in range(64):
            for folder in "one", "two":
                write_zeros(self.path(f"{folder}/{i}.npy"), 8 * MIB)
        counts = self.bytes_read(0, "64 the same, 0 different, 0 only in the first, 0 only in the "
                                    "second, 0 in trouble\n", "one", "two")
        self.assertGreater(sum(counts), 64 * 16 * MIB)
        self.assertLess(sum(counts), 64 * 17 * MIB)
        self.assertLess(max(counts), 0.9 * 64 * 16 * MIB)


class FirstDifference(BytesRead):
    def test_ends_the_run(self):
        a = write_zeros(self.path("a.npy"), 16 * GIB)
        b = write_zeros(self.path("b.npy"), 16 * GIB)
        with open(b, "r+b") as file:
            file.seek(128 + 8 * 5)
            file.write(np.float64(1).tobytes())
        line = f"{a} {b} differ: [5]: 0 and 1 (zero is the same only as zero)\n"
        self.assertLess(sum(self.bytes_read(1, line, a, b)), GIB)
        self.assertLess(sum(self.bytes_read(1, "", "-q", a, b)), GIB)


if __name__ == "__main__":
    run_tests()
