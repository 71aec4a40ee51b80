"""Proves that the code is what the formulas say, and the formulas what the contract says.

    prove.py [--all] [PART...]

The parts, all of them by default:

    lemmas    what the files of formulas claim; the name of a file stands for it alone
    code      that each function of code.cpp, as Clang makes it, is a formula of these (claims.py)
    tables    that the builds of GCC and Clang, and the terms made of the code, give the same answers
              to hard inputs, and that each operation on vectors does what its meaning says
    faults    that faults seeded into the C++ source are found

`--all` also proves the code at more levels of optimisation, and looks for what agrees with each claim.
"""

import collections
import concurrent.futures
import itertools
import os
import sys
import time

import claims
import faults
import lemmas
import modules
import tables
import translate
import vectors
from solver import solve

# The library is built at -O3 by CMake's build type Release.
COMPILATIONS = [("x86-64", "-O1"), ("x86-64", "-O2"), ("x86-64", "-O3"), ("arm", "-O2"),
                ("aarch64", "-O2")]
TESTS_OF_ELEMENTS = [("x86-64", "-O1"), ("x86-64", "-O2")]
MORE_COMPILATIONS = [("x86-64", "-Os"), ("arm", "-O1"), ("arm", "-O3"), ("aarch64", "-O1"),
                     ("aarch64", "-O3")]
# How many functions there have to be, so that none is lost before it is proved.
FUNCTIONS = {"compare_reals": 2, "compare_integers": 64, "same": 144, "divisor_of": 2, "factor_of": 2, "new_factor": 2,
             "remember": 2,
             "element_type": 1, "certain": 78}
SLOW = 5


def prove_lemmas(names):
    """Returns what is wrong, and what was done."""
    proofs = lemmas.all_proofs()
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        prover = lemmas.Prover(pool)
        jobs = [job for proof in proofs if not names or proof.name in names
                for job in prover.prove(proof)]
        for job in concurrent.futures.as_completed(jobs):
            print_if_slow(*job.result())
    return prover.wrong, f"{len(jobs)} claims and faults of lemmas"


def print_if_slow(label, seconds):
    if seconds > SLOW:
        print(f"{seconds:6.1f} s  {label}", flush=True)


# ---- Code


def queries_of(compilation, everything):
    """What has to be asked about one compilation: the functions and statements, by the query."""
    sys.setrecursionlimit(100_000)
    functions = modules.functions(*compilation)
    label = " ".join(compilation)
    found, wrong, count = {}, [], 0
    names = collections.Counter(name.partition("<")[0] for name in functions.names)
    wrong += [f"{label}: {names[kind]} functions {kind}, not {expected}"
              for kind, expected in FUNCTIONS.items() if names[kind] != expected]
    for name in functions.names:
        # The element test is the rule and conversions, on any platform.
        if name.startswith("same<") and compilation not in TESTS_OF_ELEMENTS and not everything:
            continue
        try:
            for claim in claims.claims_of(functions, name):
                count += 1
                found.setdefault(claim.query(), (f"{label} {name}: {claim.statement}",
                                                 claim.query(wanted="{}") if claim.assumes else None))
        except translate.Unknown as unknown:
            wrong.append(f"{label} {name}: {unknown}")
    return found, wrong, len(functions.names), count, functions.used


def prove_code(everything):
    compilations = COMPILATIONS + MORE_COMPILATIONS * everything
    queries, wrong, used = {}, [], {}
    functions = statements = 0
    with concurrent.futures.ProcessPoolExecutor(os.cpu_count()) as pool:
        for found, unknown, names, count, instructions in pool.map(
                queries_of, compilations, itertools.repeat(everything)):
            queries = {**found, **queries}
            wrong += unknown
            functions += names
            statements += count
            used.update(instructions)
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        for problem in pool.map(lambda item: check_query(*item), queries.items()):
            wrong += problem
    print(f"known to the translation: {', '.join(sorted(used))}")
    return wrong, (f"{functions} functions of {len(compilations)} compilations,"
                   f" {statements} claims, {len(queries)} of them different")


def check_query(query, known):
    label, agreeing = known
    answer, seconds = solve(query)
    wrong = [] if answer == "unsat" else [f"{label}: not proved: {answer}"]
    if agreeing is not None:
        answer, more_seconds = solve(agreeing)
        seconds += more_seconds
        if answer != "sat":
            wrong.append(f"{label}: the assumptions may contradict each other: {answer}")
    print_if_slow(label[:150], seconds)
    return wrong


def check_tables():
    codes = tables.all_codes()
    levels = [modules.functions("x86-64", level) for level in ("-O1", "-O2")]
    wrong, count = tables.check([level.module for level in levels], codes)
    more_wrong, operations = vectors.check()
    return wrong + more_wrong, f"{count} answers and {operations} of operations on vectors compared"


def main(*arguments):
    everything = "--all" in arguments
    wanted = [name for name in arguments if name != "--all"]
    files = {proof.name for proof in lemmas.all_proofs()}
    parts = {"lemmas": lambda: prove_lemmas([name for name in wanted if name in files]),
             "code": lambda: prove_code(everything), "tables": check_tables, "faults": faults.check}
    unknown = set(wanted) - files - set(parts)
    if unknown:
        sys.exit(f"prove: no part or file of the name {', '.join(sorted(unknown))}")
    wrong = []
    for name, part in parts.items():
        if not wanted or name in wanted or (name == "lemmas" and files & set(wanted)):
            start = time.monotonic()
            found, done = part()
            wrong += found
            print(f"{name}: {done}, in {time.monotonic() - start:.0f} s", flush=True)
    if wrong:
        sys.exit("\n".join(["prove:", *wrong]))
    print("all as it should be")


if __name__ == "__main__":
    main(*sys.argv[1:])
