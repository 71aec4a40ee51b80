"""Damaged HDF5 files."""

import pathlib

import h5py
import numpy as np


def write_file_on_which_the_library_fails(path):
    """A file of an array x, and of a virtual array v that the library cannot open without a crash."""
    layout = h5py.VirtualLayout(shape=(2, 4), dtype="f8")
    layout[0] = h5py.VirtualSource(".", "x", shape=(4,))
    with h5py.File(path, "w", libver="latest") as file:
        file["x"] = np.arange(4.0)
        file.create_virtual_dataset("v", layout)
    contents = bytearray(pathlib.Path(path).read_bytes())
    # The size of an object, which is 8 bytes from its beginning, after the heap's 16.
    contents[contents.index(b"GCOL") + 16 + 8 + 2] ^= 0xFF
    pathlib.Path(path).write_bytes(contents)
