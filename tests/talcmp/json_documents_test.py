#!/usr/bin/env python3
"""Compares what talcmp --json prints, byte for byte, with the documents in the folder `documents`."""

import os
import pathlib

import numpy as np

from support.talcmp_command import Folder, document_of, read_bytes, run, run_tests

DOCUMENTS = pathlib.Path(__file__).resolve().parent / "documents"


def nan(bits):
    return np.array([bits], dtype="u4").view("f4")[0]


class Documents(Folder):
    def check(self, name, arguments, status, errors="", **texts):
        """Each name of `texts`, and VERSION, stands for its text in the document."""
        texts["VERSION"] = run("--version")[1].split()[1]
        expected = read_bytes(DOCUMENTS / f"{name}.json").decode()
        for placeholder, text in texts.items():
            expected = expected.replace(placeholder, text)
        found = run("--json", *arguments, cwd=self.folder)
        self.assertEqual(found[1], expected)
        self.assertEqual(found, (status, expected, errors))
        return document_of(found[1])

    def check_trouble(self, first, second, message):
        self.check("trouble", [first, second], 2, f"talcmp: {message}\n",
                   FIRST=first, SECOND=second, MESSAGE=message)

    def test_folders(self):
        def save_both(name, first, second, dtype=None):
            self.save(f"one/{name}", first, dtype)
            self.save(f"two/{name}", second, dtype)

        # Controls are written as their numbers, in which they read back; half a character is not.
        controls = "a\n\x1b\x7f\u009b\u202e\u2028\u00f6.npy"
        save_both(controls, np.array([1, 2], "i4"), np.array([1, 2], "u1"))
        self.write("one/broken.npy", b"")
        self.save("two/broken.npy", [1])
        self.save_archive("one/more.npz", x=np.zeros((0, 2)), y=np.uint8(2))
        self.save_archive("two/more.npz", x=np.zeros((0, 2)))
        save_both("nans_that_are_the_same_under_zero_only.npy", [np.nan, 1], [np.nan, 1 + 2**-52])
        self.save("one/only_one.npy", 1)
        self.save(os.fsdecode(b"two/only_two\x9b\xc3.npy"), 1)
        save_both("places.npy",
                  [[nan(0x7FC00001), np.inf, -0.0, 1, 1, np.inf], [0, 2, 3, 4, 5, 6]],
                  [[nan(0x7FC00002), np.inf, 0, nan(0x7FC00001), 2, -np.inf],
                   [-0.0, 2 + 2**-21, -3, 0, 11, 6]], "f4")
        save_both("shapes.npy", [[1, 2]], [1, 2], "f4")
        document = self.check("folders", ["-n", "9", "--threads=1", "one", "two"], 2,
                              "talcmp: one/broken.npy: is empty; an .npy file was expected\n")
        self.assertEqual(document["comparisons"][0]["first"]["name"], f"one/{controls}")

    def test_trouble(self):
        self.save("a.npy", [1])
        self.make_folder("one")
        self.make_folder("two")
        self.check_trouble("a.npy", "b.npy", "b.npy: cannot be opened: No such file or directory")
        self.check_trouble("one", "two",
                           "one: holds no file of arrays to compare, nor does two; in folders, these are "
                           "the files named *.npy, *.npz, *.h5, *.hdf5, *.he5, *.nc, *.nc4 and "
                           "*.cdf")
        self.check_trouble("a*.npy", "b*.npy",
                           "b*.npy: there is no such file, and no file matches it as a pattern")
        self.check_trouble("b*.npy", "a.npy", "b*.npy: there is no such file; a pattern can be "
                                              "compared with another one or with a folder")

    def test_archives_without_members(self):
        self.save_archive("a.npz")
        self.check("archives_without_members", ["a.npz", "a.npz"], 0)

    def test_complex_singles(self):
        self.save("a.npy", [0.1 + 1j, 2 - 0j], "c8")
        self.save("b.npy", [0.1 + 1j, 2 + 0j], "c16")
        self.check("complex_singles", ["--tol", "2.5", "a.npy", "b.npy"], 1)

    def test_part_of_arrays_in_two_orders(self):
        values = np.arange(12).reshape(3, 4)
        self.save("a.npy", values, "i2", "F")
        values[1, 2] = values[2, 0] = 100
        self.save("b.npy", values, "i2")
        self.check("part_of_arrays_in_two_orders", ["--slice", "1:,2", "-n10", "a.npy", "b.npy"], 1)

    def test_infinite_tolerances(self):
        self.save("a.npy", [0.709, 0.0])
        self.save("b.npy", [1.709, -0.0])
        self.check("infinite_tolerance", ["--tol=inf", "a.npy", "b.npy"], 0)
        self.check("negative_infinite_tolerance", ["--tol=-inf", "a.npy", "b.npy"], 1)

    def test_types(self):
        self.save("a.npy", 1, "f4")
        self.save("b.npy", 1, "f8")
        self.check("types", ["--strict-type", "a.npy", "b.npy"], 1)


if __name__ == "__main__":
    run_tests()
