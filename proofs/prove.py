"""Proves what the proofs in this folder claim, with cvc5, and that each of them can fail.

    prove.py INPUTS [NAME...]

INPUTS is the program that is built from inputs.cpp. A proof is a file that begins with what it
proves and which code it models. The lines after that say

    ; for: the families it is proved for, each of them a set of values for the names after "$"
    ; with: the files that come before it
    ; fault: TEXT => OTHER, a change somewhere in all this after which a claim must not hold

Every function whose name begins with "claim" is proved: cvc5 has to find nothing that contradicts
it. It also has to find something that agrees with it, as assumptions that contradict each other would
prove anything, and for every fault something that contradicts a claim. Finally the formulas are
evaluated on the table of inputs that INPUTS prints with the answers of the code.
"""

import concurrent.futures
import itertools
import os
import pathlib
import re
import string
import subprocess
import sys
import time

HERE = pathlib.Path(__file__).parent
SECONDS = 900


def real_family(exponent_bits, significand_bits):
    return {
        "exponent_bits": exponent_bits,
        "significand_bits": significand_bits,
        "width": exponent_bits + significand_bits,
        "epsilon": f"(/ 1.0 {2 ** (significand_bits - 1)}.0)",
        "half_epsilon": f"(/ 1.0 {2 ** significand_bits}.0)",
        "eight_epsilon": f"(/ 1.0 {2 ** (significand_bits - 4)}.0)",
    }


def rounded_family(name, values):
    """An instance for each direction of rounding."""
    return {
        f"{name} {direction}": {**values, "direction": direction}
        for direction in ("RTP", "RTN", "RTZ", "RNE")
    }


def integer_family(x, y):
    (x_signed, x_width), (y_signed, y_width) = x, y
    width = max(x_width, y_width)
    unsigned = [w for signed, w in (x, y) if not signed]
    values = {
        "x_width": x_width,
        "y_width": y_width,
        "width": width,
        "x_signed": str(x_signed).lower(),
        "y_signed": str(y_signed).lower(),
        "sign_position": width - 1,
        "unsigned_is_widest": str(unsigned == [width]).lower(),
    }
    for name, (signed, bits) in (("x", x), ("y", y)):
        values[f"{name}_extend"] = "sign_extend" if signed else "zero_extend"
        values[f"{name}_to_width"] = width - bits
        values[f"{name}_to_72"] = 72 - bits
    return values


INTEGERS = {
    f"{'' if signed else 'u'}int{width}": (signed, width)
    for width in (8, 16, 32, 64)
    for signed in (True, False)
}

SINGLE = real_family(8, 24)
DOUBLE = real_family(11, 53)

# The instances of each family. A fault has to show in one of them.
FAMILIES = {
    "single": {"single": SINGLE},
    "double": {"double": DOUBLE},
    "rounded single": rounded_family("single", SINGLE),
    "rounded double": rounded_family("double", DOUBLE),
    # With so few digits that a solver can multiply and divide them.
    "rounded small": rounded_family("small", real_family(4, 6)),
    "directions": rounded_family("any", {}),
    "any": {"any": {}},
    "integers": {
        f"{x} {y}": integer_family(INTEGERS[x], INTEGERS[y])
        for x, y in itertools.product(INTEGERS, repeat=2)
    },
}


def solve(text):
    """Returns "sat", "unsat" or what else cvc5 says, and the seconds that it took."""
    start = time.monotonic()
    try:
        # Reals other than singles and doubles are experimental in the solver.
        done = subprocess.run(["cvc5", "--fp-exp", "--lang=smt2", "-"], input=text, text=True,
                              capture_output=True, timeout=SECONDS, check=False)
    except subprocess.TimeoutExpired:
        return "time-out", SECONDS
    return (done.stdout + done.stderr).strip(), time.monotonic() - start


class Proof:
    def __init__(self, path):
        self.name = path.stem
        self.text = path.read_text()
        self.families = self.header("for")[0].split(", ")
        self.preludes = self.header("with")[0].split()
        self.faults = [re.split(r" => ?", fault, maxsplit=1) for fault in self.header("fault")]
        self.claims = re.findall(r"define-fun (claim\w*)", self.text)

    def header(self, key):
        values = re.findall(rf"^; {key}:(.*)$", self.text, re.MULTILINE)
        if not values:
            sys.exit(f"prove: {self.name}.smt2 has no line '; {key}:'")
        return [value.strip() for value in values]

    def assembled(self):
        preludes = [(HERE / f"{name}.smt2").read_text() for name in self.preludes]
        return without_comments("\n".join([*preludes, self.text]))

    def with_fault(self, fault):
        text, replacement = fault
        assembled = self.assembled()
        if text not in assembled:
            sys.exit(f"prove: {self.name}.smt2: there is no '{text}' to be a fault")
        return assembled.replace(text, replacement)


def without_comments(text):
    return re.sub(r"^;.*\n", "", text, flags=re.MULTILINE)


def query(assembled, values, goal):
    text = string.Template(assembled).substitute(values)
    return f"(set-logic ALL)\n{text}\n(assert {goal})\n(check-sat)\n"


def tables(inputs):
    """The rows of the program's table, by their instance."""
    rows = {}
    for line in subprocess.run([inputs], capture_output=True, text=True, check=True).stdout.splitlines():
        instance, row = line.split("\t")
        rows.setdefault(instance, {})[row] = None
    return {instance: "\n".join(found) for instance, found in rows.items()}


class Prover:
    """Runs the queries of proofs side by side and gathers what is wrong."""

    def __init__(self, pool, rows):
        self.pool = pool
        self.rows = rows
        self.wrong = []

    def prove(self, proof):
        jobs = []
        for family in proof.families:
            instances = {
                name: {**values, "table": self.rows.get(name, "")}
                for name, values in FAMILIES[family].items()
            }
            for name, values in instances.items():
                for claim in proof.claims:
                    label = f"{proof.name} ({name}) {claim}"
                    jobs.append(self.pool.submit(self.check_claim, label, proof, values, claim))
            for fault in proof.faults:
                jobs.append(self.pool.submit(self.check_fault, family, proof, instances, fault))
        return jobs

    def check_claim(self, label, proof, values, claim):
        assembled = proof.assembled()
        answer, seconds = solve(query(assembled, values, f"(not {claim})"))
        if answer != "unsat":
            self.wrong.append(f"{label}: not proved: {answer}")
        agreeing, more_seconds = solve(query(assembled, values, claim))
        if agreeing != "sat":
            self.wrong.append(f"{label}: the assumptions may contradict each other: {agreeing}")
        return label, seconds + more_seconds

    def check_fault(self, family, proof, instances, fault):
        label = f"{proof.name} ({family}) with {fault[1]} for {fault[0]}"
        assembled = proof.with_fault(fault)
        start = time.monotonic()
        if not any(
            solve(query(assembled, values, f"(not {claim})"))[0] == "sat"
            for values in instances.values()
            for claim in proof.claims
        ):
            self.wrong.append(f"{label}: the fault is not noticed")
        return label, time.monotonic() - start


def main(inputs, *names):
    proofs = [Proof(path) for path in sorted(HERE.glob("*.smt2")) if "\n; for:" in path.read_text()]
    unknown = set(names) - {proof.name for proof in proofs}
    if unknown:
        sys.exit(f"prove: no proof of the name {', '.join(sorted(unknown))}")
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        prover = Prover(pool, tables(inputs))
        jobs = []
        for proof in proofs:
            if not names or proof.name in names:
                jobs += prover.prove(proof)
        for job in concurrent.futures.as_completed(jobs):
            label, seconds = job.result()
            if seconds > 5:
                print(f"{seconds:6.1f} s  {label}", flush=True)
    if prover.wrong:
        sys.exit("\n".join(["prove:", *prover.wrong]))
    print(f"{len(jobs)} claims and faults, all as they should be")


if __name__ == "__main__":
    if len(sys.argv) < 2:
        sys.exit(__doc__)
    main(*sys.argv[1:])
