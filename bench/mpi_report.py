#!/usr/bin/python3
"""Turns what was measured and computed of talcmp-mpi into the tables and the picture of
docs/mpi.md: mpi_report.py RESULTS DOCUMENTS. Prints each bar with what was measured.
"""

import sys
from pathlib import Path

from pictures import charts
from report import Measured, bars_table, print_bars, read, renew_blocks, table

# ---- The bars: the most that a value may be

TWO_RANKS_BAR = 0.6
OPERATION_BAR = 100  # bytes
MESSAGES_OF_RANK_BAR = 20
MEMORY_BAR = 64  # MiB

MIB = 1 << 20


# ---- What was measured


def commands(case):
    return {row["name"]: row for row in case["commands"]}


def seconds_of_ranks(case, name, of="seconds"):
    return commands(case)[name][f"inside_{of}"]


def bars_of_messages(row):
    """The program's own; Open MPI sends more when it starts."""
    kinds, run = row["kinds"], row["run"]
    sent = [kinds[kind] for kind in ("point to point", "broadcasts and reductions")]
    count = sum(one["messages"] for one in sent)
    handed_out = kinds["one-sided operations"]
    yield Measured(f"messages a rank, {run}", count / row["ranks"], MESSAGES_OF_RANK_BAR)
    yield Measured(f"one-sided operations a box, {run}", handed_out["messages"] / row["boxes"], 1)
    yield Measured(f"bytes of a one-sided operation, {run}",
                   handed_out["bytes"] / handed_out["messages"], OPERATION_BAR)


def bars_of(results):
    for case in results["cases"]:
        two, one = (seconds_of_ranks(case, name) for name in ("two ranks", "one rank"))
        yield Measured(f"{case['files']}, {case['workload']}, two ranks to one", two / one,
                       TWO_RANKS_BAR)
    for row in results["messages"]:
        if row["run"] != "tiny":
            yield from bars_of_messages(row)
    largest = max(results["memory"], key=lambda row: row["resident"])
    yield Measured(f"resident memory of a rank, MiB, most ({largest['files']}, "
                   f"{largest['ranks']} ranks)", largest["resident"] / MIB, MEMORY_BAR)


# ---- Tables


def run_table(results):
    before, after = results["load"]
    return table(("", "of this run"), [
        ("cores", results["processors"]),
        ("load before and after times were taken", f"{before:.1f} and {after:.1f} processes"),
    ])


def cases_table(results):
    rows = []
    for case in results["cases"]:
        by_name = commands(case)
        one, two, tcp = (seconds_of_ranks(case, name)
                         for name in ("one rank", "two ranks", "two ranks, TCP"))
        one_median, two_median = (seconds_of_ranks(case, name, "median")
                                  for name in ("one rank", "two ranks"))
        rows.append((f"{case['files']}, {case['workload']}", f"{case['bytes'] / MIB:.0f}",
                     f"{by_name['talcmp --threads 1']['seconds']:.3f}",
                     f"{by_name['talcmp']['seconds']:.3f}", f"{one:.3f}", f"{two:.3f}",
                     f"{two / one:.2f}", f"{two_median / one_median:.2f}", f"{tcp / one:.2f}"))
    return table(("files", "each, MiB", "`talcmp --threads 1`, s", "`talcmp`, s", "one rank, s",
                  "two ranks, s", "two to one", "of medians", "two to one, TCP"), rows)


def messages_table(results):
    rows = []
    for row in results["messages"]:
        of_run = "two tiny files" if row["run"] == "tiny" else f"{row['boxes']} boxes, {row['run']}"
        rows.extend((of_run, row["ranks"], kind, sent["messages"], sent["bytes"])
                    for kind, sent in row["kinds"].items())
    return table(("run", "ranks", "kind", "messages", "bytes"), rows)


def memory_table(results):
    return table(("files", "report", "ranks", "resident, MiB", "its own, MiB"), [
        (row["files"], "yes" if row["report"] else "no", row["ranks"],
         f"{row['resident'] / MIB:.0f}", f"{row['private'] / MIB:.0f}")
        for row in results["memory"]])


def start_table(results):
    return table(("command on two tiny files", "time, s", "median, s"), [
        (f"`{row['name']}`", f"{row['seconds']:.3f}", f"{row['median']:.3f}")
        for row in results["start"]])


def ends_table(results):
    return table(("ranks", "read by all ranks, MiB", "boxes"), [
        (row["ranks"], f"{row['bytes'] / MIB:.1f}", f"{row['boxes']:.0f}")
        for row in results["ends"]])


def cost_text(cost):
    value, unit = cost["value"], cost["unit"]
    for factor, prefix in ((1e9, "G"), (1e6, "M")):
        if unit == "bytes/s" and value >= factor:
            return f"{value / factor:g} {prefix}B/s"
    for factor, small in ((1e-6, "ns"), (1e-3, "µs"), (1, "ms")):
        if unit == "s" and value < factor:
            return f"{value / factor * 1000:.3g} {small}"
    return f"{value:.0f} {unit}".strip()


def costs_table(simulation):
    return table(("cost", "value", ""), [(cost["name"], cost_text(cost), cost["source"])
                                         for cost in simulation["costs"]])


def validation_table(simulation):
    return table(("files", "ranks", "measured, s", "computed, s", "computed to measured"), [
        (f"{row['files']}, {row['workload']}", row["name"], f"{row['measured']:.3f}",
         f"{row['simulated']:.3f}", f"{row['simulated'] / row['measured']:.2f}")
        for row in simulation["validation"]])


# ---- What was computed

RUNS = {
    ("32 ranks a node", "RDMA"): "32 ranks a node",
    ("32 ranks a node", "TCP"): "over TCP",
    ("a rank a node", "RDMA"): "a rank a node",
    ("ten times the bandwidth", "RDMA"): "ten times the bandwidth",
}


def runs_of(simulation, files):
    """The rows of each run, by its name."""
    return {name: [row for row in simulation["rows"]
                   if (row["files"], row["storage"], row["network"]) == (files, *run)]
            for run, name in RUNS.items()}


def files_of(simulation):
    return list(dict.fromkeys(row["files"] for row in simulation["rows"]))


def seconds_text(seconds):
    return f"{seconds:.0f}" if seconds >= 100 else f"{seconds:.3g}"


def computed_table(simulation):
    rows = []
    for files in files_of(simulation):
        runs = runs_of(simulation, files)
        first = runs["32 ranks a node"]
        for i, row in enumerate(first):
            times = [seconds_text(run[i]["seconds"]) for run in runs.values()]
            rows.append((files, row["ranks"], *times,
                         f"{row['start']:.1f}", f"{100 * row['efficiency']:.0f} %", row["limit"]))
    return table(("files", "ranks", *(f"{name}, s" for name in RUNS.values()), "start, s",
                  "efficiency", "what limits"), rows)


def differences_table(simulation):
    rows = [(row["files"], row["network"], row["ranks"], row["boxes"],
             f"{1000 * row['seconds']:.3g}") for row in simulation["difference"]
            if row["ranks"] in (2, 10, 100, 1000)]
    return table(("files", "network", "ranks", "boxes read", "time, ms"), rows)


LIMITS = {
    "processors": "limit of the processors",
    "bandwidth of the nodes": "of the nodes&#8217; bandwidth",
    "file system": "of the file system",
    "start": "starting the ranks",
}


def picture(simulation):
    all_charts = []
    for files in files_of(simulation):
        runs = runs_of(simulation, files)
        lines = [[(row["ranks"], row["seconds"]) for row in rows] for rows in runs.values()]
        limits = [[(row["ranks"], row["limits"][name]) for row in runs["32 ranks a node"]]
                  for name in LIMITS]
        all_charts.append((f"1 TB each, {files}", lines, limits))
    return charts("Time of a comparison, computed", RUNS.values(), all_charts, "ranks", "time, s",
                  LIMITS.values(), x_base=10)


# ---- The document


def main():
    if len(sys.argv) != 3:
        sys.exit("usage: mpi_report.py RESULTS DOCUMENTS")
    folder, documents = map(Path, sys.argv[1:])
    results = read(folder, "talcmp_mpi")
    if results["left_out"]:
        print(f"talcmp-mpi was left out: {results['left_out']}")
        return
    simulation = read(folder, "mpi_simulation")
    (documents / "mpi.svg").write_text(picture(simulation), encoding="utf-8")
    measured = list(bars_of(results))
    renew_blocks(documents / "mpi.md", {
        "run": run_table(results),
        "bars": bars_table(measured),
        "two ranks": cases_table(results),
        "messages": messages_table(results),
        "memory": memory_table(results),
        "start": start_table(results),
        "ends": ends_table(results),
        "computed": computed_table(simulation),
        "differences": differences_table(simulation),
        "costs": costs_table(simulation),
        "validation": validation_table(simulation),
    })
    print_bars(measured)


if __name__ == "__main__":
    main()
