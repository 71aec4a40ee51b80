#!/usr/bin/python3
"""Turns what python_calls.py and python_dask.py measured into tables: python_report.py RESULTS
DOCUMENTS. Renews what is between marks in performance.md and prints the bars.
"""

import sys
from pathlib import Path

from report import Measured, bars_table, print_bars, read, renew_blocks, table

COUNTS = {10: "10", 10**6: "10^6", 10**7: "10^7"}
CALL_BAR = 0.5  # microseconds
SHORT_ALLCLOSE_BAR = 0.1
CPP_BAR = 1.05
ALLCLOSE_BAR = 10  # the least
TRACED_BAR = 1  # KiB, for the answer and the call itself
GROWN_BAR = 0  # MiB
COMPARE_BAR = 3


class Calls:
    def __init__(self, results):
        self.numpy = results["numpy"]
        self.rows = results["rows"]
        self.by_call = {(row["count"], row["name"]): row for row in self.rows}

    def seconds(self, count, name):
        return self.by_call[count, name]["seconds"]

    def ratio(self, count, name, other):
        return self.seconds(count, name) / self.seconds(count, other)


def bars_of_calls(calls):
    yield Measured("same, 10 elements, µs", calls.seconds(10, "same") * 1e6, CALL_BAR)
    yield Measured("same to numpy.allclose, 10 elements",
                   calls.ratio(10, "same", "numpy.allclose"), SHORT_ALLCLOSE_BAR)
    yield Measured("same to the call in C++, 10^6 elements", calls.ratio(10**6, "same", "C++"),
                   CPP_BAR)
    yield Measured("numpy.allclose to same, 10^7 elements",
                   calls.ratio(10**7, "numpy.allclose", "same"), ALLCLOSE_BAR, True)
    yield Measured("numpy.testing.assert_allclose to assert_same, 10^7 elements",
                   calls.ratio(10**7, "numpy.testing.assert_allclose", "assert_same"))
    row = calls.by_call[10**7, "same"]
    yield Measured("same, 10^7 elements, allocated by Python, KiB", row["traced"] / 2**10,
                   TRACED_BAR)
    yield Measured("same, 10^7 elements, more memory of the process, MiB", row["grown"] / 2**20,
                   GROWN_BAR)
    yield Measured("compare to same, 10^7 elements, both by one thread",
                   calls.ratio(10**7, "compare", "same"), COMPARE_BAR)
    yield Measured("compare to same, 10^7 elements, both by all threads",
                   calls.ratio(10**7, "compare, all threads", "same, all threads"), COMPARE_BAR)
    yield Measured("compare to same, 10^6 elements, both by one thread",
                   calls.ratio(10**6, "compare", "same"))


def time_text(seconds):
    for unit, factor in (("s", 1), ("ms", 1e3), ("µs", 1e6)):
        if seconds * factor >= 1:
            return f"{seconds * factor:.3g} {unit}"
    return f"{seconds * 1e9:.3g} ns"


def calls_table(calls):
    """A row for each function, whatever the number of elements."""
    names = [row["name"] for row in calls.rows if row["count"] == 10]
    rows = []
    for name in names:
        times = [time_text(calls.seconds(count, name)) for count in COUNTS]
        grown = calls.by_call[10**7, name].get("grown")
        rows.append((f"`{name}`" if name != "C++" else "the call in C++", *times,
                     "" if grown is None else f"{grown / 2**20:.0f}"))
    return table(("function", *(f"{text} elements" for text in COUNTS.values()),
                  "memory at 10^7, MiB"), rows)


def views_table(calls):
    rows = [(f"`{row['name'].partition(',')[0]}`", row["name"].partition(", ")[2],
             time_text(row["seconds"]), f"{row['grown'] / 2**20:.0f}")
            for row in calls.rows if row["count"] not in COUNTS]
    return table(("function", "arrays", "time", "memory, MiB"), rows)


DASK = {
    "build": "building the graph of `compare`",
    "optimize": "optimising it",
    "compare, threads": "`compare` by two threads",
    "same, threads": "`same` by two threads",
    "sum, threads": "for comparison: Dask's own sum of one of the arrays",
}


def dask_table(rows):
    times = {row["name"]: row["microseconds_a_block"] for row in rows if "blocks" in row}
    return table(("what", "time a block, µs"),
                 [(text, f"{times[name]:.0f}") for name, text in DASK.items()])


def workers_table(rows):
    seconds = {row["name"]: row["seconds"] for row in rows if "seconds" in row}
    one, two = seconds["one worker"], seconds["two workers"]
    return table(("workers", "time, s", "of one"),
                 [("one", f"{one:.2f}", "1"), ("two", f"{two:.2f}", f"{two / one:.2f}")])


def main():
    if len(sys.argv) != 3:
        sys.exit("usage: python_report.py RESULTS DOCUMENTS")
    results, documents = map(Path, sys.argv[1:])
    calls = Calls(read(results, "python_calls"))
    dask_rows = read(results, "python_dask")
    measured = list(bars_of_calls(calls))
    renew_blocks(documents / "performance.md", {
        "bars of Python": bars_table(measured),
        "Python": calls_table(calls),
        "views in Python": views_table(calls),
        "Dask": dask_table(dask_rows),
        "workers": workers_table(dask_rows),
    })
    print_bars(measured)


if __name__ == "__main__":
    main()
