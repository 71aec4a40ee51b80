#!/usr/bin/python3
"""Writes the named inputs of corpus/npy_files: make_npy_seeds.py [FOLDER].

An input is an .npy file, two of them, one after the other, or an .npz archive.
"""

import io
import struct
import sys
import zipfile
from pathlib import Path

# By the letters of .npy files and those of the module struct.
TYPES = {"i1": "b", "u1": "B", "i2": "h", "u2": "H", "i4": "i", "u4": "I", "i8": "q", "u8": "Q",
         "f4": "f", "f8": "d", "c8": "ff", "c16": "dd"}


def npy(descr, shape, elements, version=1, order=False, spaces=""):
    entries = f"{{'descr': {descr}, 'fortran_order': {order}, 'shape': {shape}, }}{spaces}\n"
    length = struct.pack("<H" if version == 1 else "<I", len(entries))
    return b"\x93NUMPY" + bytes([version, 0]) + length + entries.encode() + elements


def row(code, values, byte_order="<"):
    """An array of rank 1; a complex number has its real part's number in both parts."""
    letters = TYPES[code]
    elements = b"".join(struct.pack(byte_order + letters, *[value] * len(letters))
                        for value in values)
    return npy(f"'{byte_order}{code}'", f"({len(values)},)", elements)


def archive(compression, members):
    contents = io.BytesIO()
    with zipfile.ZipFile(contents, "w", compression) as file:
        for name, member in members.items():
            # With a fixed date, so that the bytes are the same each time.
            file.writestr(zipfile.ZipInfo(name, (2000, 1, 1, 0, 0, 0)), member, compression)
    return contents.getvalue()


def seeds():
    for code in TYPES:
        yield f"row_{code}", row(code, [0, 1, 100])
        yield f"row_{code}_and_row_f8", row(code, [1, 2]) + row("f8", [1, 2])
        yield f"row_f4_and_swapped_{code}", row("f4", [1, 2]) + row(code, [1, 3], ">")
    two = struct.pack("<dd", 1, 2)
    yield "version_2", npy("'<f8'", "(2,)", two, version=2)
    yield "version_3", npy("'<f8'", "(2,)", two, version=3)
    yield "misaligned", npy("'<f8'", "(2,)", two, spaces=" ") + npy("'<f8'", "(2,)", two)
    yield "rank_0", npy("'<f8'", "()", two[:8]) + npy("'<f8'", "()", two[8:])
    yield "rank_4", npy("'|i1'", "(1, 2, 3, 1)", b"123456") + npy("'|u1'", "(1, 2, 3, 1)", b"123457")
    yield "rank_65", npy("'|i1'", "(" + "1, " * 65 + ")", b"1")
    yield "shapes", npy("'|i1'", "(2, 3)", b"123456") + npy("'|i1'", "(3, 2)", b"123456")
    yield "empty", npy("'<f8'", "(2, 0)", b"") + npy("'|i1'", "(2, 0)", b"")
    yield "empty_and_long", npy("'<f8'", f"({2**63}, {2**63}, 0)", b"")
    yield "product_above_2_64", npy("'<f8'", f"({2**32}, {2**32})", b"")
    yield "bytes_above_2_64", npy("'<f8'", f"({2**61 + 2},)", two)
    yield "dimension_above_2_64", npy("'<f8'", f"({2**64 + 2},)", two)
    yield "less_data", npy("'<f8'", "(3,)", two)
    yield "more_data", npy("'<f8'", "(1,)", two)
    yield "part_of_an_element", npy("'<f8'", "(2,)", two + b"1")
    yield "fortran_order", npy("'<f8'", "(2,)", two, order=True)
    yield "two_orders", (npy("'|i1'", "(2, 3)", b"123456")
                         + npy("'|i1'", "(2, 3)", b"142536", order=True))
    yield "both_in_fortran_order", (npy("'|i1'", "(2, 3)", b"123456", order=True)
                                    + npy("'|u1'", "(2, 3)", b"123467", order=True))
    yield "order_of_rank_3", (npy("'<i2'", "(2, 2, 3)", bytes(range(24)))
                              + npy("'<i2'", "(2, 2, 3)", bytes(range(24)), order=True))
    for name, compression in ("stored", zipfile.ZIP_STORED), ("compressed", zipfile.ZIP_DEFLATED):
        yield f"archive_{name}", archive(compression, {"x.npy": row("f8", [1, 2]),
                                                       "y.npy": row("i1", [1] * 50)})
    yield "archive_of_text", archive(zipfile.ZIP_STORED, {"notes.txt": b"no array"})
    yield "archive_without_members", archive(zipfile.ZIP_STORED, {})
    yield "structured", npy("[('a', '<f8')]", "(2,)", two)
    yield "text", npy("'<U4'", "(1,)", two)
    yield "nan", row("f8", [float("nan"), 1]) + row("f8", [float("nan"), 2])
    yield "infinity", row("f4", [float("inf")]) + row("f8", [-1e300])
    yield "one_digit_left", row("f8", [1, 1]) + row("f8", [1 - 2.0**-3, 1 - 0.6])


def main():
    folder = Path(sys.argv[1] if len(sys.argv) > 1 else Path(__file__).parent / "corpus/npy_files")
    folder.mkdir(parents=True, exist_ok=True)
    for name, contents in seeds():
        (folder / name).write_bytes(contents)


if __name__ == "__main__":
    main()
