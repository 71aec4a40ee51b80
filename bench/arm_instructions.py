#!/usr/bin/python3
"""Counts what whole calls execute on 32-bit ARM: arm_instructions.py FOLDER.

Compiles the module and arm_instructions.cpp with -O2, for VFP and for NEON, in FOLDER, runs each
under QEMU, which logs the address of each instruction, and prints JSON: for each pair of types and
workload the instructions and divisions that a pair of elements takes beyond the first 256, and the
instructions of the call's beginning. The C library, called at the beginning, is left out.
"""

import json
import re
import subprocess
import sys
from pathlib import Path

ROOT = Path(__file__).resolve().parents[1]
TRIPLE = "arm-linux-gnueabihf"
INCLUDES = ["TalNumericArray", "Includes", "SystemConfiguration/Exports",
            "compilerruntime/src/scalar_op/utils", "compilerruntime/src/types", "bench",
            "tests/support"]
FLAGS = ["-std=c++17", "-O2", "-ffp-contract=off", "-fno-exceptions"]
BUILDS = {"VFP": ["-mfpu=vfpv3-d16"], "NEON": ["-mfpu=neon"]}
SHORT, LONG = 256, 512


def run(*command):
    return subprocess.run(command, check=True, stdout=subprocess.PIPE, text=True).stdout


def build(folder, flags):
    """The program and the linker's map of it."""
    includes = [f"-I{ROOT / include}" for include in INCLUDES]
    sources = {"module": "TalNumericArray/talnumericarray_compare.cpp",
               "calls": "bench/arm_instructions.cpp"}
    objects = []
    folder.mkdir(parents=True, exist_ok=True)
    for name, source in sources.items():
        objects.append(folder / f"{name}.o")
        run("ccache", f"{TRIPLE}-g++", *FLAGS, *flags, *includes, "-c", ROOT / source,
            "-o", objects[-1])
    program, map_file = folder / "program", folder / "map"
    run(f"{TRIPLE}-g++", *flags, "-static", f"-Wl,-Map={map_file}", *objects, "-o", program)
    return program, map_file.read_text(encoding="utf-8")


def symbols(program):
    lines = (line.split() for line in run(f"{TRIPLE}-nm", program).splitlines())
    return {line[2]: int(line[0], 16) & ~1 for line in lines if len(line) == 3}


def counted_ranges(program, map_text):
    """Where the code is: the module's, and that of the compiler's library, such as conversions."""
    section = r"^ \.text\S*\s+0x([0-9a-f]+)\s+0x([0-9a-f]+) \S*?(module\.o|libgcc\.a\(\S+\))$"
    known = symbols(program)
    needed = run(f"{TRIPLE}-nm", "-u", program.parent / "module.o").split()
    addresses = [known[name] for name in needed if name in known]
    for begin, size, file in re.findall(section, map_text, re.MULTILINE):
        begin, size = int(begin, 16), int(size, 16)
        end = begin + size
        if size and (file == "module.o" or any(begin <= a < end for a in addresses)):
            yield begin, size


def divisions(program):
    """The addresses of divisions."""
    code = run(f"{TRIPLE}-objdump", "-d", "--no-show-raw-insn", program)
    return {int(address, 16)
            for address in re.findall(r"^ *([0-9a-f]+):\s+(?:vdiv|sdiv|udiv)", code, re.MULTILINE)}


def executed(program, map_text):
    """Instructions and divisions of each call, by its types, workload and length."""
    known = symbols(program)
    begin_mark, end_mark = known["counting_begins"], known["counting_ends"]
    ranges = [*counted_ranges(program, map_text), (begin_mark, 2), (end_mark, 2)]
    dividing = divisions(program)
    calls = program.with_suffix(".calls")
    counts = []
    with calls.open("w", encoding="utf-8") as names, subprocess.Popen(
        ["qemu-arm", "-singlestep", "-d", "exec,nochain",
         "-dfilter", ",".join(f"{begin:#x}+{size:#x}" for begin, size in ranges), program],
        stdout=names, stderr=subprocess.PIPE,
    ) as process:
        counting, total, divided = False, 0, 0
        for line in process.stderr:
            address = int(line.split(b"/", 2)[1], 16)
            if address == begin_mark:
                counting, total, divided = True, 0, 0
            elif address == end_mark:
                counting = False
                counts.append((total, divided))
            elif counting:
                total += 1
                divided += address in dividing
    if process.returncode != 0:
        sys.exit(f"arm_instructions: the program failed: {calls.read_text(encoding='utf-8')[-200:]}")
    lines = calls.read_text(encoding="utf-8").splitlines()
    if len(lines) != len(counts):
        sys.exit(f"arm_instructions: {len(counts)} calls of {len(lines)} are in the log")
    return {tuple(line.split()): count for line, count in zip(lines, counts)}


def main():
    rows = []
    for name, flags in BUILDS.items():
        counts = executed(*build(Path(sys.argv[1]) / name, flags))
        for (type1, type2, workload, length), (total, divided) in counts.items():
            if length != str(SHORT):
                continue
            longer_total, longer_divided = counts[type1, type2, workload, str(LONG)]
            a_pair = (longer_total - total) / (LONG - SHORT)
            rows.append({"build": name, "type1": type1, "type2": type2, "workload": workload,
                         "a_pair": a_pair, "beginning": total - SHORT * a_pair,
                         "divisions_a_pair": (longer_divided - divided) / (LONG - SHORT)})
    versions = {"compiler": run(f"{TRIPLE}-g++", "-dumpfullversion").strip(),
                "emulator": run("qemu-arm", "--version").split()[2]}
    print(json.dumps({**versions, "rows": rows}, indent=0))


if __name__ == "__main__":
    main()
