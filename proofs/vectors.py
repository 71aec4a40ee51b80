"""Holds the meaning that vector operations have in translations against the processor.

vector_operations.cpp applies each operation that the library's headers use to memory. Its
translation by Clang is evaluated for rows of hard values, which come to every lane, and has to give
what the builds of it by each compiler give.
"""

import ctypes
import re

import numpy as np

import compiled
import evaluate
import tables
import terms as t
import translate

SOURCE = "vector_operations.cpp"
BUILDS = (("clang++", "-O2"), ("g++", "-O2"))
ROWS = 150
# Where a row begins; no value is longer.
STRIDE = 64

DTYPES = {"float": "f4", "double": "f8", "long long": "i8", "unsigned long": "u8",
          "unsigned int": "u4", "unsigned short": "u2", "unsigned char": "u1", "int": "i4"}

# ---- The operations


class Operation:
    """A function of the file; `types` are the kind and number of lanes of each parameter."""

    def __init__(self, symbol, text):
        self.symbol = symbol
        self.name, _, parameters = text.partition("(")
        self.types = [lane_type(parameter) for parameter in parameters.rstrip(")").split(", ")]
        self.inputs = "abc"[:len(self.types) - 1]

    def is_supported(self):
        return compiled.is_supported(self.name.replace("with_", "<"))


def lane_type(parameter):
    name, lanes = re.match(r"([a-z ]+?)(?: __vector\((\d+)\))?(?: const)?\*$", parameter).groups()
    return np.dtype(DTYPES[name]), int(lanes or 1)


def operations(library):
    found = [Operation(*pair) for pair in zip(library.symbols, compiled.demangled(library.symbols))]
    return [operation for operation in found if operation.is_supported()]


def forgotten():
    """The intrinsics in the headers that are not tried."""
    tried = set(re.findall(r"\b_mm\d*_\w+(?=\()", (compiled.SOURCES / SOURCE).read_text()))
    wrong = []
    for path in sorted((compiled.HERE.parent / "TalNumericArray").glob("*.h")):
        for name in sorted(set(re.findall(r"\b_mm\d*_\w+", path.read_text())) - tried):
            wrong.append(f"{SOURCE} does not try {name} of {path.name}")
    return wrong


# ---- Hard values in every lane


def drawn(random, dtype, count):
    """The same ones in each run."""
    if dtype.kind == "f":
        hard = tables.real_numbers(dtype)
        # Numbers beside which products and differences are rounded.
        hard = np.concatenate([hard, np.array([1.1, -1.3, 3.7e7, 1e-30, 0.1], dtype)])
        return random.choice(hard.view(f"u{dtype.itemsize}"), count)
    return random.choice(tables.integers(dtype).view(f"u{dtype.itemsize}"), count)


def table(operation):
    """An array of bytes for each input, with a row for each call."""
    random = np.random.default_rng(1)
    found = []
    for dtype, lanes in operation.types[:-1]:
        size = dtype.itemsize * lanes
        rows = np.zeros((ROWS, STRIDE), np.uint8)
        for k, row in enumerate(rows):
            # Vectors of integers have lanes of any width.
            lane = np.dtype(f"i{1 << k % 4}") if dtype.kind == "i" else dtype
            count = size // lane.itemsize
            row[:size] = drawn(random, lane, count).view(np.uint8) if count else 0
        special_rows(rows, size)
        found.append(rows)
    if len(found) > 1:
        # Operands that are alike.
        found[-1][::3] = found[-2][::3]
    return found


def special_rows(rows, size):
    """Zeros, ones, and all but one byte or bit of them; the rest stays as it is."""
    rows[0, :size] = 0
    rows[1, :size] = 0xff
    for byte in range(min(size, 64)):
        rows[2 + byte, :size] = 0xff if byte % 2 else 0
        rows[2 + byte, byte] = 0x7f if byte % 2 else 0x80 if byte % 4 else 1


# ---- The processor's results and those of the terms


def aligned(rows):
    """A copy at an address that any vector may have."""
    buffer = np.zeros(rows.size + STRIDE, np.uint8)
    begin = -buffer.ctypes.data % STRIDE
    copy = buffer[begin:begin + rows.size].reshape(rows.shape)
    copy[:] = rows
    return copy


def applied(library, operation, inputs, direction):
    function = library[operation.symbol]
    function.argtypes = [ctypes.c_void_p] * len(operation.types)
    function.restype = None
    arrays = [aligned(rows) for rows in [*inputs, np.zeros((ROWS, STRIDE), np.uint8)]]
    addresses = [array.ctypes.data for array in arrays]
    with compiled.rounding(direction):
        for offset in range(0, ROWS * STRIDE, STRIDE):
            function(*(address + offset for address in addresses))
    return lanes_of(arrays[-1], operation)


def lanes_of(rows, operation):
    """The bits of the results, all NaNs alike."""
    dtype, lanes = operation.types[-1]
    bits = rows[:, :dtype.itemsize * lanes].view(f"u{dtype.itemsize}")
    return tables.canonical(bits.astype(np.uint64),
                            t.real_sort(8 * dtype.itemsize) if dtype.kind == "f" else t.BOOL)


class Translation(translate.Translation):
    """Of functions that store their results."""

    def do_load(self, path, frame, reader, instruction):
        start = reader.position
        kind = reader.type()
        if kind[0] == "vector" and kind[2] == ("int", 1):
            pointer = self.typed_operand(frame, reader)
            return translate.from_bits(self.load(path, pointer, ("int", kind[1])), kind)
        reader.position = start
        return super().do_load(path, frame, reader, instruction)

    def do_store(self, path, frame, reader, instruction):
        value = self.typed_operand(frame, reader)
        pointer = self.typed_operand(frame, reader)
        if pointer.object != "result" or pointer.offset is not t.constant(0, 64):
            raise translate.Unknown(f"a store to {pointer.object}")
        del instruction
        path.done["stored"] = translate.as_bits(value)


def stored(module, operation):
    memory = {}
    for name, (dtype, lanes) in zip(operation.inputs, operation.types):
        memory[name] = translate.array_memory(name, 8 * dtype.itemsize, lanes)
    pointers = [translate.Pointer(name, t.constant(0, 64))
                for name in (*operation.inputs, "result")]
    return Translation(module).outcome(operation.symbol, pointers, memory)["stored"]


def evaluated(result, operation, inputs, evaluation):
    columns = {}
    for name, rows, (dtype, lanes) in zip(operation.inputs, inputs, operation.types):
        bits = rows[:, :dtype.itemsize * lanes].view(f"u{dtype.itemsize}")
        columns.update({f"{name}{k}": bits[:, k].tolist() for k in range(lanes)})
    values = evaluation.columns([result], lambda variable: columns[variable.arguments[0]], ROWS)[0]
    size = t.width_of(result.sort) // 8
    joined = b"".join(value.to_bytes(size, "little").ljust(STRIDE, b"\0") for value in values)
    return lanes_of(np.frombuffer(joined, np.uint8).reshape(ROWS, STRIDE), operation)


# ---- The check


def report(operation, inputs, label, direction, places, mine, theirs):
    row, lane = places[0]
    values = []
    for name, rows, (dtype, lanes) in zip(operation.inputs, inputs, operation.types):
        bits = rows[row, :dtype.itemsize * lanes].view(f"u{dtype.itemsize}")
        values.append(f"{name} = {{{', '.join(f'{int(x):#x}' for x in bits)}}}")
    return (f"{operation.name}: lane {lane} of its term is {int(mine[row, lane]):#x} and not "
            f"{int(theirs[row, lane]):#x}, as {label} has it in {direction} for"
            f" {', '.join(values)} ({len(places)} results)")


def check_operation(operation, module, libraries, evaluations):
    try:
        result = stored(module, operation)
    except translate.Unknown as unknown:
        return [f"{operation.name}: {unknown}"]
    inputs = table(operation)
    for evaluation in evaluations:
        mine = evaluated(result, operation, inputs, evaluation)
        for label, library in libraries.items():
            theirs = applied(library, operation, inputs, evaluation.direction)
            places = np.argwhere(mine != theirs)
            if len(places):
                return [report(operation, inputs, label, evaluation.direction, places, mine,
                               theirs)]
    return []


def check():
    """What is wrong, as lines of text, and how many results were compared."""
    libraries = {" ".join(build): compiled.shared_library(build[0], [build[1]], SOURCE)
                 for build in BUILDS}
    module = translate.Module(compiled.representation(["-O2"], SOURCE))
    evaluations = [evaluate.Evaluation(direction) for direction in evaluate.DIRECTIONS]
    wrong, count = forgotten(), 0
    for operation in operations(next(iter(libraries.values()))):
        wrong += check_operation(operation, module, libraries, evaluations)
        count += ROWS * operation.types[-1][1] * len(evaluations) * len(libraries)
    return wrong, count


if __name__ == "__main__":
    compiled.end(*check())
