#!/usr/bin/python3
"""Writes the named inputs of corpus/netcdf_files: make_netcdf_seeds.py [FOLDER].

An input is a netCDF file in a classic format, or something like it.
"""

import struct
import sys
from pathlib import Path

VERSIONS = 1, 2, 5
BYTE, CHAR, SHORT, INT, FLOAT, DOUBLE, UBYTE, USHORT, UINT, INT64, UINT64 = range(1, 12)
# Those of the module struct.
LETTERS = {BYTE: "b", CHAR: "c", SHORT: "h", INT: "i", FLOAT: "f", DOUBLE: "d", UBYTE: "B",
           USHORT: "H", UINT: "I", INT64: "q", UINT64: "Q"}
UNKNOWN = -1  # records


def padded(contents):
    return contents + bytes(-len(contents) % 4)


class File:
    """Dimensions by name and length, variables by name, dimensions, type and place after the
    header."""

    def __init__(self, version, records=0, dimensions=(), variables=(), attributes=b""):
        self.version, self.records = version, records
        self.dimensions, self.variables = dimensions, variables
        self.attributes = attributes or self.list(12, 0)

    def size(self, number):
        length = 8 if self.version == 5 else 4
        return (number % 2 ** (8 * length)).to_bytes(length, "big")

    def list(self, tag, length):
        return struct.pack(">i", tag if length else 0) + self.size(length)

    def name(self, text):
        return self.size(len(text)) + padded(text.encode())

    def header_ending_at(self, end):
        contents = b"CDF" + bytes([self.version]) + self.size(self.records)
        contents += self.list(10, len(self.dimensions))
        for name, length in self.dimensions:
            contents += self.name(name) + self.size(length)
        contents += self.attributes + self.list(11, len(self.variables))
        for name, dimensions, kind, place in self.variables:
            contents += self.name(name) + self.size(len(dimensions))
            contents += b"".join(map(self.size, dimensions)) + self.list(12, 0)
            contents += struct.pack(">i", kind) + self.size(0)
            contents += (end + place).to_bytes(4 if self.version == 1 else 8, "big")
        return contents

    def header(self):
        return self.header_ending_at(len(self.header_ending_at(0)))


def elements(kind, count):
    if kind == CHAR:
        return b"c" * count
    return struct.pack(f">{count}{LETTERS[kind]}", *range(1, count + 1))


def attribute(file, kind, count):
    return file.name("units") + struct.pack(">i", kind) + file.size(count) + padded(
        elements(kind, count))


def seeds():
    for version in VERSIONS:
        kinds = list(LETTERS) if version == 5 else list(LETTERS)[:6]
        yield f"empty_{version}", File(version).header()
        for kind in kinds:
            scalar = File(version, 0, (), [("v", [], kind, 0)])
            yield f"scalar_{version}_{kind}", scalar.header() + elements(kind, 1)
        row = File(version, 0, [("x", 3), ("y", 2)], [("v", [0, 1], SHORT, 0)])
        yield f"rows_{version}", row.header() + elements(SHORT, 6)
        one = [("t", 0), ("x", 3)], [("v", [0, 1], BYTE, 0)]
        yield f"unpadded_{version}", File(version, 4, *one).header() + elements(BYTE, 12)
        yield f"no_records_{version}", File(version, 0, *one).header()
        yield f"stream_{version}", File(version, UNKNOWN, *one).header() + elements(BYTE, 9)
        yield f"broken_stream_{version}", File(version, UNKNOWN, *one).header() + b"1234"
        two = [("x", 2), ("t", 0)], [("a", [1], BYTE, 8), ("b", [1, 0], FLOAT, 12),
                                     ("c", [0], INT, 0)]
        data = elements(INT, 2) + (padded(b"1") + elements(FLOAT, 2)) * 3
        yield f"records_{version}", File(version, 3, *two).header() + data
        yield f"stream_of_two_{version}", File(version, UNKNOWN, *two).header() + data
        yield f"less_data_{version}", File(version, 4, *two).header() + data
        with_attributes = File(version, 3, *two)
        with_attributes.attributes = with_attributes.list(12, len(kinds)) + b"".join(
            attribute(with_attributes, kind, 3) for kind in kinds)
        yield f"attributes_{version}", with_attributes.header() + data
        yield f"two_record_dimensions_{version}", File(version, 0, [("t", 0), ("u", 0)]).header()
        yield f"unknown_dimension_{version}", File(version, 0, (), [("v", [1], BYTE, 0)]).header()
        yield f"records_last_{version}", File(version, 0, [("x", 2), ("t", 0)],
                                              [("v", [0, 1], BYTE, 0)]).header()
        yield f"of_one_name_{version}", File(version, 0, (), [("v", [], BYTE, 0)] * 2).header()
    large = [("x", 2**32), ("y", 2**32)]
    yield "above_2_64", File(5, 0, large, [("v", [0, 1], BYTE, 0)]).header()
    yield "long_records", File(5, 2, [("t", 0), ("x", 2**63)],
                               [("v", [0, 1], BYTE, 0), ("w", [0, 1], BYTE, 0)]).header()
    yield "many_dimensions", File(1, 0, [("x", 1)], [("v", [0] * 100, BYTE, 0)]).header() + b"1"


def main():
    folder = Path(sys.argv[1] if len(sys.argv) > 1
                  else Path(__file__).parent / "corpus/netcdf_files")
    folder.mkdir(parents=True, exist_ok=True)
    for name, contents in seeds():
        (folder / name).write_bytes(contents)


if __name__ == "__main__":
    main()
