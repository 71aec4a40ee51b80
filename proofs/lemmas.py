"""Proves what the files in formulas/ claim: the rule, and why a pair that passes a test is the same.

A file begins with what it proves and which code it is about. The lines after that say

    ; for: the families it is proved for, each of them a set of values for the names after "$"
    ; with: the files that come before it
    ; fault: TEXT => OTHER, a change somewhere in all this after which a claim must not hold

Every function whose name begins with "claim" is proved: the solver has to find nothing that
contradicts it. It also has to find something that agrees with it, as assumptions that contradict each
other would prove anything, and for every fault something that contradicts a claim.
"""

import pathlib
import re
import string
import sys
import time

from solver import solve

FORMULAS = pathlib.Path(__file__).parent / "formulas"


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
}


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
        preludes = [(FORMULAS / f"{name}.smt2").read_text() for name in self.preludes]
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


class Prover:
    """Runs the queries of proofs side by side and gathers what is wrong."""

    def __init__(self, pool):
        self.pool = pool
        self.wrong = []

    def prove(self, proof):
        jobs = []
        for family in proof.families:
            instances = FAMILIES[family]
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


def all_proofs():
    return [Proof(path) for path in sorted(FORMULAS.glob("*.smt2")) if "\n; for:" in path.read_text()]
