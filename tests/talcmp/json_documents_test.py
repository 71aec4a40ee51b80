#!/usr/bin/env python3
"""Holds what talcmp --json prints, byte for byte, against the documents in the folder `documents`."""

import json
import os
import pathlib
import subprocess
import tempfile
import unittest

import jsonschema
import numpy as np

from support.talcmp_command import COMMAND, run_tests

TESTS = pathlib.Path(__file__).resolve().parent
SCHEMA = json.loads((TESTS.parents[1] / "tools" / "talcmp" / "talcmp.schema.json").read_text("utf-8"))


def nan(bits):
    return np.array([bits], dtype="u4").view("f4")[0]


class Documents(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = folder.name

    def save(self, name, array, dtype=None, order="C"):
        path = os.path.join(os.fsencode(self.folder), os.fsencode(name))
        os.makedirs(os.path.dirname(path), exist_ok=True)
        with open(path, "wb") as file:
            np.save(file, np.array(array, dtype=dtype, order=order))

    def run_in_folder(self, *arguments):
        done = subprocess.run([os.path.abspath(word) if os.path.exists(word) else word
                               for word in COMMAND] + list(arguments),
                              cwd=self.folder, capture_output=True, check=False, timeout=120)
        return done.returncode, done.stdout, done.stderr

    def check(self, name, arguments, status, errors=b""):
        version = self.run_in_folder("--version")[1].split()[1]
        expected = (TESTS / "documents" / (name + ".json")).read_bytes()
        found = self.run_in_folder("--json", *arguments)
        self.assertEqual(found[1].decode(), expected.replace(b"VERSION", version).decode())
        self.assertEqual(found, (status, expected.replace(b"VERSION", version), errors))
        document = json.loads(found[1])
        jsonschema.validate(document, SCHEMA)
        return document

    def test_same(self):
        self.save("a.npy", [1, 2], "i4")
        self.save("b.npy", [1, 2], "u1")
        self.check("same", ["a.npy", "b.npy"], 0)

    def test_several_places(self):
        self.save("a.npy", [[1, 2, 3], [4, 5, 6]], "f8")
        self.save("b.npy", [[1, 2 + 2**-50, -3], [0, 11, 6]], "f8")
        self.check("several_places", ["-n", "3", "--threads=1", "a.npy", "b.npy"], 1)

    def test_complex_singles(self):
        self.save("a.npy", [0.1 + 1j, 2 - 0j], "c8")
        self.save("b.npy", [0.1 + 1j, 2 + 0j], "c16")
        self.check("complex_singles", ["--tol", "2.5", "a.npy", "b.npy"], 1)

    def test_folders(self):
        for folder, number in (("one", 1), ("two", 2)):
            self.save(folder + "/both.npy", [1, number], "i8")
            self.save(f"{folder}/only_{folder}.npy", [1], "i8")
        np.savez(os.path.join(self.folder, "one", "more.npz"), x=np.uint8(1), y=np.uint8(2))
        np.savez(os.path.join(self.folder, "two", "more.npz"), x=np.uint8(1))
        pathlib.Path(self.folder, "one", "broken.npy").write_bytes(b"")
        self.save("two/broken.npy", [1])
        self.check("folders", ["one", "two"], 2,
                   b"talcmp: one/broken.npy: is empty; an .npy file was expected\n")

    def test_one_file_in_trouble(self):
        self.save("a.npy", [1])
        self.check("one_file_in_trouble", ["a.npy", "b.npy"], 2,
                   b"talcmp: b.npy: cannot be opened: No such file or directory\n")

    def test_empty_folders(self):
        os.mkdir(os.path.join(self.folder, "one"))
        os.mkdir(os.path.join(self.folder, "two"))
        self.check("empty_folders", ["one", "two"], 2,
                   b"talcmp: one: holds no .npy or .npz file to compare, nor does two\n")

    def test_pattern_without_a_match(self):
        self.save("a.npy", [1])
        self.check("pattern_without_a_match", ["a*.npy", "b*.npy"], 2,
                   b"talcmp: b*.npy: there is no such file, and no file matches it as a pattern\n")

    def test_pattern_and_file(self):
        self.save("a.npy", [1])
        self.check("pattern_and_file", ["b*.npy", "a.npy"], 2,
                   b"talcmp: b*.npy: there is no such file; a pattern can be compared with another "
                   b"one or with a folder\n")

    def test_archives_without_members(self):
        np.savez(os.path.join(self.folder, "a.npz"))
        self.check("archives_without_members", ["a.npz", "a.npz"], 0)

    def test_part_of_arrays_in_two_orders(self):
        values = np.arange(12).reshape(3, 4)
        self.save("a.npy", values, "i2", "F")
        values[1, 2] = values[2, 0] = 100
        self.save("b.npy", values, "i2")
        self.check("part_of_arrays_in_two_orders", ["--slice", "1:,2", "-n10", "a.npy", "b.npy"], 1)

    def test_special_values(self):
        infinity = np.inf
        self.save("a.npy", [nan(0x7FC00001), infinity, -0.0, 1, 1, infinity, 0], "f4")
        self.save("b.npy", [nan(0x7FC00002), infinity, 0, nan(0x7FC00001), 2, -infinity, -0.0],
                  "f4")
        self.check("special_values", ["-n10", "a.npy", "b.npy"], 1)

    def test_no_digit_in_common(self):
        self.save("a.npy", [0.709, 1])
        self.save("b.npy", [1.709, 1])
        self.check("no_digit_in_common", ["a.npy", "b.npy"], 1)

    def test_nans_that_are_the_same_under_zero_only(self):
        self.save("a.npy", [np.nan, 1])
        self.save("b.npy", [np.nan, 1 + 2**-52])
        self.check("nans_that_are_the_same_under_zero_only", ["a.npy", "b.npy"], 1)

    def test_infinite_tolerances(self):
        self.save("a.npy", [1.0, 0.0])
        self.save("b.npy", [2.0, -0.0])
        self.check("infinite_tolerance", ["--tol=inf", "a.npy", "b.npy"], 0)
        self.check("negative_infinite_tolerance", ["--tol=-inf", "a.npy", "b.npy"], 1)

    def test_shapes(self):
        self.save("a.npy", [[1, 2]], "f4", "F")
        self.save("b.npy", [1, 2], "f4")
        self.check("shapes", ["a.npy", "b.npy"], 1)

    def test_types(self):
        self.save("a.npy", 1, "f4")
        self.save("b.npy", 1, "f8")
        self.check("types", ["--strict-type", "a.npy", "b.npy"], 1)

    def test_no_elements(self):
        self.save("a.npy", np.zeros((0, 2)))
        self.check("no_elements", ["a.npy", "a.npy"], 0)

    def test_names(self):
        """Controls are written as their numbers, in which they read back; half a character is not."""
        name = b"a\n\x1b\x7f\xc2\x9b\xe2\x80\xae\xe2\x80\xa8\xc3\xb6.npy"
        self.save(name, [1])
        document = self.check("names", [name, name], 0)
        self.assertEqual(document["comparisons"][0]["first"]["name"].encode(), name)
        broken = b"a\x9b\xc3.npy"
        self.save(broken, [1])
        self.check("names_that_are_not_utf8", [broken, broken], 0)


if __name__ == "__main__":
    run_tests()
