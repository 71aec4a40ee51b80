"""Asks the solver cvc5."""

import subprocess
import time

SECONDS = 600


def solve(query):
    """Returns "sat", "unsat" or what else the solver says, and the seconds that it took."""
    start = time.monotonic()
    try:
        # Reals other than singles and doubles are experimental in the solver.
        done = subprocess.run(["cvc5", "--fp-exp", "--lang=smt2", "-"], input=query, text=True,
                              capture_output=True, timeout=SECONDS, check=False)
    except subprocess.TimeoutExpired:
        return "time-out", SECONDS
    return (done.stdout + done.stderr).strip(), time.monotonic() - start
