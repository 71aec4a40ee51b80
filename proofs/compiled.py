"""Libraries that are compiled from the files of this folder, and their functions.

A function is known by its demangled name without the type of its result, its namespace and its
parameters: "certain<double, int, std::complex<double> >".
"""

import contextlib
import ctypes
import ctypes.util
import functools
import pathlib
import re
import subprocess
import sys
import tempfile

import numpy as np

HERE = pathlib.Path(__file__).parent
SOURCES = HERE / "code"
INCLUDED = ("TalNumericArray", "Includes", "SystemConfiguration/Exports",
            "compilerruntime/src/scalar_op/utils", "compilerruntime/src/types", "tests/support")
FLAGS = ("-std=c++17", "-ffp-contract=off", "-fno-exceptions", "-fPIC")

# ---- Rounding

# Of fesetround on the processors with these vectors.
MODES = {"RNE": 0, "RTN": 0x400, "RTP": 0x800, "RTZ": 0xc00}

libm = ctypes.CDLL(ctypes.util.find_library("m"))


@contextlib.contextmanager
def rounding(direction):
    """The direction is in force only while no other code of Python can depend on it."""
    before = libm.fegetround()
    if libm.fesetround(MODES[direction]) != 0:
        raise ValueError(direction)
    try:
        yield
    finally:
        libm.fesetround(before)


# ---- Compiling


def shared_library(compiler, flags, source, included=()):
    """The folders in `included` come before the library's own; each has to have all headers of the
    library that a header in it includes."""
    with tempfile.TemporaryDirectory() as folder:
        path = pathlib.Path(folder) / "library.so"
        subprocess.run([*command(compiler, flags, included), "-shared", SOURCES / source, "-o", path],
                       check=True)
        library = ctypes.CDLL(str(path))
        library.symbols = defined_functions(path)
        return library


def command(compiler, flags, included):
    folders = [*included, *(HERE.parent / name for name in INCLUDED)]
    return [compiler, *FLAGS, *flags, "-w", *(f"-I{name}" for name in folders)]


def representation(flags, source, included=()):
    """LLVM's representation of a file, as text."""
    return run(*command("clang++", flags, included), "-S", "-emit-llvm", SOURCES / source, "-o", "-")


def defined_functions(path):
    listed = run("nm", "-D", "--defined-only", str(path)).splitlines()
    return [name for *_, kind, name in map(str.split, listed) if kind in "TW"]


def run(*arguments, text=None):
    return subprocess.run(arguments, input=text, capture_output=True, text=True, check=True).stdout


def demangled(symbols):
    return run("c++filt", text="\n".join(symbols)).splitlines()


@functools.lru_cache
def features():
    """The names of instruction sets that this processor has, as the system lists them."""
    with open("/proc/cpuinfo", encoding="ascii") as file:
        return set(re.search(r"^flags\s*:(.*)", file.read(), re.MULTILINE)[1].split())


def is_supported(name):
    """Whether this processor has the instructions of a function."""
    if "<avx512" in name:
        return {"avx512f", "avx512bw", "avx512dq", "avx512vl"} <= features()
    return "<avx2" not in name or {"avx2", "fma"} <= features()


# ---- Reports


def end(wrong, count):
    """Ends a program that has compared so many results."""
    if wrong:
        sys.exit("\n".join(wrong))
    print(f"{count} results, all as they should be")


# ---- Functions of code.cpp

# Their types: the letter of NumPy, the number of parts, and whether they are reals.
ELEMENTS = {"signed char": "i1", "unsigned char": "u1", "short": "i2", "unsigned short": "u2",
            "int": "i4", "unsigned int": "u4", "long": "i8", "unsigned long": "u8",
            "float": "f4", "double": "f8", "std::complex<float>": "c8",
            "std::complex<double>": "c16"}


class Type:
    """An element type: that of its parts as `dtype`, and how many it has."""

    def __init__(self, name):
        found = np.dtype(ELEMENTS[name])
        self.name = name
        self.parts = 2 if found.kind == "c" else 1
        self.is_real = found.kind in "fc"
        self.dtype = np.dtype(f"f{found.itemsize // 2}") if found.kind == "c" else found
        self.bytes = self.dtype.itemsize
        self.width = 8 * self.bytes
        self.bits = np.dtype(f"u{self.bytes}")

    def __repr__(self):
        return self.name


VECTOR_BYTES = {"avx512": 64, "avx2": 32, "baseline": 16}


class Signature:
    """What the name of a function says about its inputs.

    `kind` is the name without what is in brackets; `bound` names the real that comes first, if
    there is one, and `bound_type` is its type; `x` and `y` are types, of `elements` elements each;
    `real` is the type in which these are compared.
    """

    def __init__(self, name):
        self.name = name
        self.kind, _, inside = name.partition("<")
        inner = re.split(r", (?![^<]*>)", inside.rpartition(">")[0])
        self.elements = 1
        self.bound = self.bound_type = self.x = self.y = self.set = None
        if self.kind in ("compare_reals", "divisor_of", "factor_of"):
            self.bound, self.bound_type = "tol", Type(inner[0])
            if self.kind == "compare_reals":
                self.x = self.y = self.bound_type
        elif self.kind == "element_type":
            self.x = Type("int")
        elif self.kind == "same":
            self.bound, self.bound_type = "tol", Type("double")
            self.x, self.y = map(Type, map(str.strip, inner))
        elif self.kind == "compare_integers":
            self.x, self.y = map(Type, inner)
        elif self.kind in ("certain", "block"):
            *sizes, bound, x, y = map(str.strip, inner)
            self.x, self.y = Type(x), Type(y)
            if bound != "equal":
                self.bound, self.bound_type = "divisor", Type(bound)
            if sizes:
                self.set = sizes[0]
                size = VECTOR_BYTES[sizes[0]] * int(sizes[1].rstrip("ul"))
                self.elements = size // self.common().itemsize // self.y.parts
        else:
            raise ValueError(name)
        self.real = self.common()

    def common(self):
        """The type in which elements are compared."""
        types = [type_.dtype for type_ in (self.x, self.y) if type_] or [self.bound_type.dtype]
        if any(type_ == np.float64 for type_ in types):
            return np.dtype(np.float64)
        if any(type_ == np.float32 for type_ in types):
            return np.dtype(np.float32)
        return max(types, key=lambda type_: type_.itemsize)

    @property
    def remembers(self):
        """Whether it asks for the remembered factor."""
        return self.kind in ("compare_reals", "divisor_of") or (
            self.kind == "same" and self.real.kind == "f")


class Rows(ctypes.Structure):
    """As in calls.cpp."""

    _fields_ = [("count", ctypes.c_size_t)] + [
        (name, ctypes.c_void_p) for name in ("function", "remember", "lasttol", "factor", "modes",
                                             "bound", "x", "y")] + [
        ("x_bytes", ctypes.c_size_t), ("y_bytes", ctypes.c_size_t)]


@functools.lru_cache
def calls():
    return shared_library("g++", ["-O1"], "calls.cpp")


NAMES_OF_REALS = {np.dtype(np.float32): "float", np.dtype(np.float64): "double"}


class Code:
    """code.cpp, compiled; `included` are folders with headers in place of the library's."""

    def __init__(self, compiler, level, included=()):
        self.label = f"{compiler} {level}"
        self.library = shared_library(compiler, [level], "code.cpp", included)
        symbols = self.library.symbols
        self.symbols = dict(zip(map(name_of, demangled(symbols)), symbols))
        self.names = [name for name in self.symbols if is_known(name) and is_supported(name)]

    def address(self, name):
        return ctypes.cast(self.library[self.symbols[name]], ctypes.c_void_p)

    def answers(self, signature, inputs, direction):
        """The bits of the result for each row of the inputs.

        The inputs are arrays of bits: `tol` or `divisor`, `x` and `y` with a column for each part,
        `lasttol` and `factor`, what is remembered before each call, and `modes` of the processor.
        """
        count = len(next(iter(inputs.values())))
        arrays = {name: np.ascontiguousarray(array) for name, array in inputs.items()}
        if signature.kind in ("compare_integers", "element_type"):
            arrays = {name: array.view(type_.dtype).astype(np.int64)
                      for name, type_, array in (("x", signature.x, arrays["x"]),
                                                 ("y", signature.y or signature.x,
                                                  arrays.get("y", arrays["x"])))}
        rows = Rows(count, self.address(signature.name))
        for name, array in arrays.items():
            setattr(rows, "bound" if name in ("tol", "divisor") else name, array.ctypes.data)
            if name in ("x", "y"):
                setattr(rows, f"{name}_bytes", array.strides[0])
        if signature.remembers:
            real = NAMES_OF_REALS[signature.real]
            rows.remember = self.address(f"remember<{real}>")
        caller, result = self.caller(signature)
        results = np.zeros(count, result)
        with rounding(direction):
            caller(ctypes.byref(rows), ctypes.c_void_p(results.ctypes.data))
        return results

    @staticmethod
    def caller(signature):
        real = NAMES_OF_REALS.get(signature.real)
        kind = {"certain": "tests", "block": "tests", "same": "elements",
                "compare_reals": "comparisons", "divisor_of": "reals",
                "factor_of": "reals"}.get(signature.kind, "integers")
        if kind == "tests":
            return calls()["tests" if signature.bound is None else f"tests_{real}"], np.uint8
        if kind == "elements":
            return calls()[f"elements_{real or 'float'}"], np.uint8
        if kind == "integers":
            return calls().integers, np.uint32
        result = np.uint32 if kind == "comparisons" else f"u{signature.real.itemsize}"
        return calls()[f"{kind}_{real}"], result

    def call(self, name, direction, **inputs):
        """The bits of the result for one row; `x` and `y` are lists of the bits of their parts."""
        signature = Signature(name)
        arrays = {"lasttol": [0], "factor": [0], **{
            key: [value] for key, value in inputs.items()}}
        types = {"x": signature.x, "y": signature.y, "tol": signature.bound_type,
                 "divisor": signature.bound_type}
        own = f"u{signature.real.itemsize}"
        bits = {key: np.array(value, types[key].bits if key in types else own)
                for key, value in arrays.items()}
        return int(self.answers(signature, bits, direction)[0])


def name_of(text):
    """The name from what c++filt makes of a symbol."""
    text = text[:text.rindex("(")] if text.endswith(")") else text
    return re.sub(r"^[\w ]+ (?=\w+<)", "", text.replace("proved::", ""))


def is_known(name):
    return re.match(r"(compare_reals|compare_integers|same|certain|block|divisor_of|factor_of)<|"
                    r"element_type$", name) is not None
