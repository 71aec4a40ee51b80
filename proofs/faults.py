"""Shows that the claims about the code can fail: faults in its headers have to contradict them.

    faults.py [NAME...]

faults.txt lists the faults. The code with a fault is compiled and translated, the solver looks for
inputs with which a claim does not hold, and on these inputs the compiled code has to give another
answer than the compiled code without the fault. So what is translated is what is compiled, and the
claims do not hold of everything.

A NAME is a part of the name of a fault; without one, every fault is shown.
"""

import argparse
import collections
import concurrent.futures
import ctypes
import os
import pathlib
import re
import shutil
import struct
import subprocess
import sys
import tempfile
import time

import claims
import compiled
import terms as t
import translate

HERE = pathlib.Path(__file__).parent
DIRECTION = "RNE"
SECONDS = 20

Fault = collections.namedtuple("Fault", "name file functions text replacement")


class Wrong(Exception):
    """A fault that is not noticed as it should be."""


# ---- The list


def read_faults(text):
    found = []
    file = None
    for entry in re.split(r"\n\n+", re.sub(r"^#.*\n", "", text, flags=re.MULTILINE).strip()):
        name, *lines = entry.split("\n")
        if name.startswith("== "):
            file = name[3:]
            name, *lines = lines
        parts = {key: [line[len(key):].removeprefix(" ") for line in lines
                       if line.split(" ", 1)[0] == key] for key in ("in", "-", "+")}
        if sum(map(len, parts.values())) != len(lines) or not all(parts.values()):
            raise Wrong(f"faults.txt: '{name}' is not a fault")
        found.append(Fault(name, file, parts["in"], "\n".join(parts["-"]), "\n".join(parts["+"])))
    return found


# ---- Compiling


def copy_headers(folder):
    """All headers in one folder, as one that includes another looks in its own folder first."""
    for included in compiled.INCLUDED:
        for path in (HERE.parent / included).glob("*.h"):
            if (folder / path.name).exists():
                raise Wrong(f"there are two headers {path.name}")
            shutil.copy(path, folder)
    shutil.copy(compiled.SOURCES / "code.cpp", folder)


def seed(fault, folder):
    path = folder / fault.file
    text = path.read_text()
    if text.count(fault.text) != 1:
        raise Wrong(f"{fault.file} has {text.count(fault.text)} places, not one, with the text\n"
                    f"{fault.text}")
    path.write_text(text.replace(fault.text, fault.replacement))


class Functions(claims.Functions):
    """These keep what they were translated to."""

    def __init__(self, *arguments):
        super().__init__(*arguments)
        self.results = {}

    def translated(self, name, *arguments, **options):
        outcome = super().translated(name, *arguments, **options)
        self.results[name] = outcome["result"]
        return outcome


class Code:
    """Functions of the headers in a folder: compiled, and as the solver is asked about them."""

    def __init__(self, folder, names):
        named = ", ".join(f"&{name}" for name in names)
        kept = [f"-DPROVED_FUNCTIONS={named}"] if names else []
        representation = folder / "code.ll"
        run("clang++", *compiled.FLAGS, "-O2", "-w", *kept, "-I", folder, "-S", "-emit-llvm",
            folder / "code.cpp", "-o", representation)
        self.text = representation.read_text()
        # There is room for the variables of threads of only a few libraries that are loaded early.
        representation.write_text(self.text.replace("thread_local(initialexec)", "thread_local"))
        path = folder / "code.so"
        run("clang++", "-O2", "-fPIC", "-w", "-shared", representation, "-o", path)
        self.library = ctypes.CDLL(str(path))
        symbols = compiled.defined_functions(path)
        self.symbols = dict(zip(map(compiled.name_of, compiled.demangled(symbols)), symbols))
        self.functions = Functions(translate.Module(self.text), self.symbols, "x86-64")

    def full(self, name):
        """The name as the symbols have it."""
        return next(n for n in self.symbols if written(n) == written(name))

    def claims(self, name):
        return claims.claims_of(self.functions, self.full(name))

    def function(self, name):
        return self.library[self.symbols[self.full(name)]]


def run(*command):
    done = subprocess.run(command, capture_output=True, text=True, check=False)
    if done.returncode != 0:
        raise Wrong(f"{command[0]} fails:\n{done.stderr}")


def written(name):
    """A function's name as in faults.txt, which names no namespace of ours."""
    return re.sub(r"\s|(?<=\d)ul\b|\(.*", "", name)


# ---- Asking

# What is remembered in the four slots: the factors of these tolerances.
REMEMBERED = (8.0, 23.5, 20.0, 0.0)

# The divisor of a test for nearness.
DIVISOR = 9.0

# Tolerances and states with which reals are compared, as a solver is quick when it knows them. The
# state is the slot, doubled, above a bit that says whether it is being written.
CASES = ((24.0, 0), (0.0, 0), (20.0, 12), (20.0, 13), (20.0, 2), (23.5, 0), (23.5, 2))


def solve(query):
    """The values of a model, or None if there is no model."""
    for command in (["cvc5", "--fp-exp", "--lang=smt2", "-"], ["z3", "-in"]):
        try:
            done = subprocess.run(command, input=query, text=True, capture_output=True,
                                  timeout=SECONDS, check=False)
        except subprocess.TimeoutExpired:
            continue
        answer, _, model = done.stdout.partition("\n")
        if answer == "sat":
            return {name: int(digits, 2 if base == "b" else 16) for name, base, digits
                    in re.findall(r"\((\w+) #([bx])([0-9a-f]+)\)", model)}
        if answer == "unsat":
            return None
        raise Wrong(f"{command[0]} says {done.stdout}{done.stderr}")
    raise Wrong(f"no solver answers in {SECONDS} s")


def conditions_of_calls(inputs, factors):
    """What has to hold of inputs with which the compiled code can be called, case by case.

    It makes the factors itself. What it remembers is chosen here, which spares the solver the
    search for a factor.
    """
    found = ["true"]
    if "state_read_2" in inputs:
        found.append("(= state_read_2 state)")
    if "control_word" in inputs:
        found.append("(= (bvand control_word #xffff7fbf) #x00001f80)")
    if "divisor" in inputs:
        found.append(is_real("divisor", DIVISOR, inputs["divisor"][1]))
    for slot, tol in enumerate(REMEMBERED):
        for name, value in ((f"lasttol{slot}", lambda width, tol=tol: tol),
                            (f"factor{slot}", lambda width, tol=tol: factors[width][tol])):
            if name in inputs:
                found.append(is_real(name, value(inputs[name][1]), inputs[name][1]))
    if "made_factor" not in inputs:
        return [found]
    width = inputs["made_factor"][1]
    found += [f"(= ((_ extract {width // 2 - 1} 0) {name}) (_ bv0 {width // 2}))"
              for name, (_, w) in inputs.items()
              if re.fullmatch(r"[xy]\d?(_converted)?", name) and w == width]
    name = "tol" if "tol" in inputs else "tol_converted"
    return [[*found, is_real(name, tol, inputs[name][1]),
             is_real("made_factor", factors[width][tol], width),
             f"(= state {literal(state, 32)})"] for tol, state in CASES]


def is_real(name, value, width):
    return f"(= {name} {literal(bits_of(value, width), width)})"


def literal(bits, width):
    return f"(_ bv{bits} {width})"


def bits_of(value, width):
    return int.from_bytes(struct.pack("<f" if width == 32 else "<d", value), "little")


def counterexample(original, faulty, name, factors):
    """A claim that the fault contradicts, its number, and inputs with which it does not hold."""
    before = {claim.query(DIRECTION) for claim in original.claims(name)}
    asked = set()
    places = 0
    for claim in faulty.claims(name):
        place = places
        places += "code" in claim.code
        query = claim.query(DIRECTION)
        if query in before or query in asked:
            continue
        asked.add(query)
        values = contradiction(claim, factors)
        if values is not None:
            return place, claim, values
    return None


def contradiction(claim, factors):
    """Inputs of calls with which a claim does not hold."""
    for conditions in conditions_of_calls(claim.inputs, factors):
        wanted = f"(and (not {{}}) {' '.join(conditions)})"
        values = solve(claim.query(DIRECTION, wanted, values=True))
        if values is not None:
            return values
    return None


# ---- Calling

INTEGER_TYPES = {(True, 8): ctypes.c_int8, (True, 16): ctypes.c_int16, (True, 32): ctypes.c_int32,
                 (True, 64): ctypes.c_int64, (False, 8): ctypes.c_uint8,
                 (False, 16): ctypes.c_uint16, (False, 32): ctypes.c_uint32,
                 (False, 64): ctypes.c_uint64}
REAL_TYPES = {"float": ctypes.c_float, "double": ctypes.c_double}


def ctype(name):
    part = claims.part_type(name)
    return REAL_TYPES.get(part) or INTEGER_TYPES[claims.INTEGERS[part]]


def value_of_bits(name, bits):
    kind = ctype(name)
    return kind.from_buffer_copy(bits.to_bytes(8, "little"))


def element_array(letter, name, values):
    """The elements, or parts of them, that are named in the values, and room after them."""
    count = 1 + max((int(key[1:]) for key in values if re.fullmatch(letter + r"\d+", key)),
                    default=-1)
    kind = ctype(name)
    data = b"".join(bytes(value_of_bits(name, values.get(f"{letter}{k}", 0))) for k in range(count))
    return (kind * (count + 64)).from_buffer_copy(data + bytes(64 * ctypes.sizeof(kind)))


def parameters(name):
    """The kind of a function; the names and types of its arguments; the type of its result."""
    kind, _, rest = name.partition("<")
    arguments = claims.template_arguments(rest[:-1])
    if kind == "compare_reals":
        return [(v, arguments[0]) for v in ("tol", "x", "y")], ctypes.c_int
    if kind == "compare_integers":
        return list(zip("xy", arguments)), ctypes.c_int
    if kind in ("divisor_of", "factor_of"):
        return [("tol", arguments[0])], REAL_TYPES[arguments[0]]
    if kind == "element_type":
        return [("id", "int")], ctypes.c_int
    pointers = [(letter + "*", part) for letter, part in zip("xy", arguments[-2:])]
    if kind == "same":
        return [("tol", "double"), *pointers], ctypes.c_bool
    bound = arguments[-3]
    return [("divisor", bound)] * (bound != "equal") + pointers, ctypes.c_bool


def answer(code, name, values):
    """What the function gives, and whether it made a factor."""
    arguments, result = parameters(name)
    function = code.function(name)
    function.restype = result
    given = [element_array(v[0], part, values) if v.endswith("*")
             else value_of_bits(part, values.get(v, 0)) for v, part in arguments]
    cache = put_in_cache(code.library, name, values)
    code.library.set_control_word(values.get("control_word", 0x1f80))
    found = function(*given)
    code.library.set_control_word(0x1f80)
    if cache is not None and cache.value != values["state"]:
        return f"{shown(found)}, and makes a factor"
    return shown(found)


def put_in_cache(library, name, values):
    """Makes the thread remember what the values say; the state it remembers then."""
    if "state" not in values:
        return None
    kind = real_of(name)
    library.remembered_by_thread.restype = ctypes.c_void_p
    address = library.remembered_by_thread(ctypes.c_bool(kind == "double"))
    size = ctypes.sizeof(REAL_TYPES[kind])
    state = ctypes.c_uint32.from_address(address)
    state.value = values["state"]
    for k in range(8):
        bits = values.get(("lasttol" if k % 2 == 0 else "factor") + str(k // 2), 0)
        ctypes.memmove(address + (k + 1) * size, bits.to_bytes(size, "little"), size)
    return state


def real_of(name):
    """The type in which the function compares, if it is a real."""
    arguments = claims.template_arguments(name.partition("<")[2][:-1])
    return claims.comparison_type(*arguments[-2:])


def shown(value):
    if isinstance(value, float):
        return value.hex()
    return str(value).lower() if isinstance(value, bool) else str(value)


def split_name(name):
    """A name's letters and its number, by which names are sorted."""
    letters = name.rstrip("0123456789")
    return letters, int(name[len(letters):] or 0)


def shown_inputs(name, values):
    """The inputs as values in C++."""
    types = {v[0] if v.endswith("*") else v: part for v, part in parameters(name)[0]}
    found = []
    for key, bits in sorted(values.items(), key=lambda item: split_name(item[0])):
        part = types.get(key) or types.get(key.rstrip("0123456789"))
        if re.fullmatch(r"(lasttol|factor)\d", key):
            if int(key[-1]) != values["state"] // 2 % 4:
                continue
            part = real_of(name)
        if part is not None:
            found.append(f"{key} = {shown(value_of_bits(part, bits).value)}")
        elif key in ("state", "control_word"):
            found.append(f"{key} = {bits:#x}")
    return ", ".join(found)


# ---- Showing


def show(fault, original, factors):
    """The text that shows that the fault is noticed."""
    with tempfile.TemporaryDirectory() as folder:
        folder = pathlib.Path(folder)
        copy_headers(folder)
        seed(fault, folder)
        faulty = Code(folder, fault.functions)
    for name in fault.functions:
        found = noticed(original, faulty, name, factors)
        if found is None:
            continue
        reason, values = found
        if values is None:
            raise Wrong(f"{reason}, but no inputs give another answer")
        if not compiled.is_supported(name):
            return f"{name}: {reason}, not shown: this processor does not have these vectors"
        answers = [answer(code, name, values) for code in (original, faulty)]
        if answers[0] == answers[1]:
            raise Wrong(f"{reason}, but the compiled code gives {answers[0]} both times"
                        f" with {shown_inputs(name, values)}")
        return (f"{name}: {reason}\n    {DIRECTION}, {shown_inputs(name, values)}:"
                f" {answers[0]}, with the fault {answers[1]}")
    raise Wrong("contradicts no claim")


def noticed(original, faulty, name, factors):
    """How a fault in a function is noticed, and inputs that may show it in the compiled code."""
    kind, _, _ = name.partition("<")
    try:
        found = counterexample(original, faulty, name, factors)
    except translate.Unknown as unknown:
        # The answer of a block is not one of all lanes.
        if kind != "block":
            raise Wrong(f"no translation: {unknown}") from None
        reason = str(unknown).partition("\n")[0]
        return f"no claims can be made, as {reason}", difference(original, faulty, name, factors)
    if found is None:
        return None
    place, claim, values = found
    reason = f"not {claim.statement}"
    reason = reason if len(reason) < 80 else reason[:76] + " ..."
    if kind == "block":
        reason += f" in lane {place}"
    # Claims about one lane, or about what elements are converted to, have other inputs.
    if kind in ("block", "certain", "same"):
        values = difference(original, faulty, name, factors)
    return reason, values


def difference(original, faulty, name, factors):
    """Inputs with which a function has another result than without the fault."""
    original.claims(name)
    results = {key: code.functions.results[code.full(name)]
               for key, code in (("code", faulty), ("original", original))}
    inputs = {part.arguments[0]: part.sort for part in t.all_terms(list(results.values()))
              if part.op == "variable"}
    real = real_of(name)
    return contradiction(claims.Claim(name, "(= code original)", results, inputs, real), factors)


def made_factors(original):
    """By the width of a real: the factors of the tolerances."""
    found = {}
    for kind, width in (("float", 32), ("double", 64)):
        function = original.function(f"factor_of<{kind}>")
        function.argtypes, function.restype = [REAL_TYPES[kind]], REAL_TYPES[kind]
        found[width] = {tol: function(tol)
                        for tol in {*REMEMBERED, *(tol for tol, _ in CASES)}}
    return found


def original_code(faults):
    names = sorted({name for fault in faults for name in fault.functions}
                   | {"factor_of<float>", "factor_of<double>"})
    with tempfile.TemporaryDirectory() as folder:
        folder = pathlib.Path(folder)
        copy_headers(folder)
        return Code(folder, names)


def check(names=()):
    """What is wrong, and what was done."""
    faults = [fault for fault in read_faults((HERE / "faults.txt").read_text())
              if not names or any(name in fault.name for name in names)]
    original = original_code(faults)
    factors = made_factors(original)
    wrong = []
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        jobs = {pool.submit(timed, show, fault, original, factors): fault for fault in faults}
        for done in concurrent.futures.as_completed(jobs):
            fault = jobs[done]
            label = f"{fault.file}: {fault.name}"
            try:
                text, seconds = done.result()
                print(f"{seconds:6.1f} s  {label}\n    {text}", flush=True)
            except Wrong as reason:
                wrong.append(f"{label}: the fault is not noticed: {reason}")
    return wrong, f"{len(faults)} faults in {len({fault.file for fault in faults})} headers"


def timed(function, *arguments):
    start = time.monotonic()
    return function(*arguments), time.monotonic() - start


def main():
    parser = argparse.ArgumentParser(description=__doc__.split("\n", maxsplit=1)[0])
    parser.add_argument("names", metavar="NAME", nargs="*", help="a part of the name of a fault")
    start = time.monotonic()
    wrong, done = check(parser.parse_args().names)
    print(f"{done}, {time.monotonic() - start:.0f} s")
    if wrong:
        sys.exit("\n".join(wrong))


if __name__ == "__main__":
    main()
