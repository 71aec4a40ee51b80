#!/usr/bin/python3
"""Turns what the benchmarks wrote into tables and pictures: report.py RESULTS DOCUMENTS.

Reads the files of JSON in the folder RESULTS, writes performance_<size>.svg into the folder
DOCUMENTS, renews what stands between marks in its performance.md, and prints each bar with what
was measured.
"""

import json
import math
import re
import sys
from collections import defaultdict
from pathlib import Path

# The most that a time may be of the time it is measured against.
BARS = {"256KiB": {"mean": 1.6, "worst": 3.0}, "256MiB": {"mean": 1.1, "worst": 1.35}}
FRACTIONAL_BAR = 1.5
SMALL_BAR = 1.05
SMALL_LENGTHS = 64
PEER_BAR = 3.0  # the least
FILE_BAR = 1.3
REPORT_BAR = 3.0
ALLCLOSE_BAR = 10.0  # the least

WORKLOADS = {
    "identical": "identical",
    "near": "near",
    "near_fractional": "near, fractional tolerance",
    "first_differs": "first element differs",
    "last_differs": "last element differs",
}

# These answer another question than element by element under a tolerance.
NOT_ELEMENTWISE = {"Eigen_isApprox", "NumPy_array_equal"}


def mean(ratios):
    """The geometric mean."""
    return math.exp(sum(map(math.log, ratios)) / len(ratios))


def spaced(size):
    return re.sub(r"(?<=\d)(?=[KM]iB)", " ", size)


# ---- What was measured


def shortest_times(results):
    """The shortest time of a processor, in nanoseconds, of each benchmark by the parts of its name.

    That is what a wall clock shows on a machine with nothing else to do.
    """
    to_nanoseconds = {"ns": 1, "us": 1e3, "ms": 1e6, "s": 1e9}
    times = {}
    for run in results["benchmarks"]:
        if "error_message" in run:
            sys.exit(f"report: {run['name']}: {run['error_message']}")
        if run["run_type"] != "iteration":
            continue
        # Behind these parts stand settings, as iterations:1.
        name = tuple(part for part in run["name"].split("/") if ":" not in part)
        time = run["cpu_time"] * to_nanoseconds[run["time_unit"]]
        times[name] = min(time, times.get(name, math.inf))
    return times


class Loops:
    """Times of whole calls over long arrays, as multiples of memcmp's."""

    def __init__(self, results):
        self.context = results["context"]
        times = shortest_times(results)
        self.ratios = defaultdict(dict)  # by size and workload, then by pair
        for (routine, size, workload, *pair), time in times.items():
            if routine == "sameQ":
                reference = times["memcmp", size, workload, *pair]
                self.ratios[size, workload][tuple(pair)] = time / reference
        self.sizes = list(dict.fromkeys(size for size, _ in self.ratios))
        self.ratios = {
            (size, workload): self.ratios[size, workload]
            for size in self.sizes
            for workload in WORKLOADS
            if (size, workload) in self.ratios
        }
        self.types = list(dict.fromkeys(name[3] for name in times))
        self.check_pairs()

    def check_pairs(self):
        integers = sum("int" in name for name in self.types)
        if len(self.types) != 12 or integers != 8:
            sys.exit(f"report: these are not the twelve element types: {self.types}")
        for (size, workload), ratios in self.ratios.items():
            pairs = 144 - integers**2 if workload.startswith("near") else 144 - integers
            if len(ratios) != pairs:
                sys.exit(f"report: {size}, {workload}: {len(ratios)} pairs instead of {pairs}")

    def workloads(self, size):
        return [workload for other, workload in self.ratios if other == size]

    def worst_workload(self, size, pair):
        """The ratio and the workload."""
        ratios = ((self.ratios[size, w].get(pair, 0), w) for w in self.workloads(size))
        return max(ratios)

    def pairs(self, size):
        return list(self.ratios[size, "identical"])

    def all_pairs(self, size, workload):
        """With the integers, which know no tolerance, as they are when identical."""
        return {**self.ratios[size, "identical"], **self.ratios[size, workload]}

    def fractional(self, size):
        """Times under a fractional tolerance as multiples of those under a whole one."""
        near = self.ratios[size, "near"]
        return {pair: r / near[pair] for pair, r in self.ratios[size, "near_fractional"].items()}


class Peers:
    """Times of the same question to other libraries, by type and name."""

    def __init__(self, results, numpy_results):
        names = shortest_times(results)
        names.update(
            {tuple(name.split("/")): t for name, t in numpy_results["nanoseconds"].items()}
        )
        self.times = defaultdict(dict)
        for (element_type, name), time in names.items():
            self.times[element_type][name] = time

    def least_ratio(self, element_type):
        """The fastest elementwise one's time as a multiple of ours, and its name."""
        times = self.times[element_type]
        return min(
            (time / times["sameQ"], name)
            for name, time in times.items()
            if name != "sameQ" and name not in NOT_ELEMENTWISE
        )


# ---- Tables


def table(head, rows):
    lines = ["| " + " | ".join(map(str, line)) + " |\n" for line in (head, *rows)]
    return lines[0] + "|---" * len(head) + "|\n" + "".join(lines[1:])


def pair_text(pair):
    return " and ".join(pair)


def processor():
    for line in Path("/proc/cpuinfo").read_text(encoding="utf-8").splitlines():
        name, _, value = line.partition(":")
        if name.strip() == "model name":
            return value.strip()
    return "unknown"


def machine_table(context):
    rows = [
        ("processor", f"{processor()}, {context['mhz_per_cpu']} MHz, {context['num_cpus']} cores"),
        ("instruction set of the loops", context["instruction_set"]),
    ]
    for cache in context["caches"]:
        if cache["type"] != "Instruction":
            size = f"{cache['size'] // 1024} KiB"
            rows.append((f"cache, level {cache['level']}", size))
    rows.append(("compiler", context["compiler"].replace("GNU", "GCC")))
    rows.append(("load when it began", f"{context['load_avg'][0]:.1f} processes"))
    rows.append(("day", context["date"][:10]))
    return table(("", "of this run"), rows)


def loops_table(loops):
    rows = []
    for (size, workload), ratios in loops.ratios.items():
        worst = max(ratios, key=ratios.get)
        rows.append(
            (
                spaced(size),
                WORKLOADS[workload],
                f"{mean(loops.all_pairs(size, workload).values()):.2f}",
                len(ratios),
                f"{mean(ratios.values()):.2f}",
                f"{ratios[worst]:.2f}",
                pair_text(worst),
            )
        )
    return table(("size", "workload", "mean", "measured", "their mean", "worst", "worst pair"), rows)


def worst_pairs_table(loops, shown=5):
    rows = []
    for size in loops.sizes:
        pairs = sorted(
            loops.pairs(size), key=lambda p: loops.worst_workload(size, p), reverse=True
        )
        for pair in pairs[:shown]:
            ratio, workload = loops.worst_workload(size, pair)
            rows.append((spaced(size), pair_text(pair), WORKLOADS[workload], f"{ratio:.2f}"))
    return table(("size", "pair", "workload", "ratio"), rows)


def slowdown(row):
    return row["library"] / row["plain"]


def small_table(small):
    workloads = [name for name in WORKLOADS if any(row["workload"] == name for row in small)]
    by_length = defaultdict(list)
    for row in small:
        by_length[row["len"]].append(row)
    rows = []
    for length, measured in by_length.items():
        by_workload = defaultdict(list)
        for row in measured:
            by_workload[row["workload"]].append(slowdown(row))
        worst = max(measured, key=slowdown)
        rows.append(
            (
                length,
                *(f"{mean(by_workload[workload]):.2f}" for workload in workloads),
                f"{sum(slowdown(row) > SMALL_BAR for row in measured)} of {len(measured)}",
                f"{slowdown(worst):.2f}",
                f"{worst['library']:.1f} and {worst['plain']:.1f}",
                f"{worst['type1']} and {worst['type2']}, {WORKLOADS[worst['workload']]}",
            )
        )
    means = (f"mean, {WORKLOADS[workload]}" for workload in workloads)
    head = ("elements", *means, f"above {SMALL_BAR}", "worst", "its two times, ns", "where")
    return table(head, rows)


def peers_table(peers):
    rows = []
    for element_type, times in peers.times.items():
        for name, time in times.items():
            elementwise = "no" if name in NOT_ELEMENTWISE else "yes"
            rows.append(
                (
                    element_type,
                    name.replace("_", " "),
                    elementwise,
                    f"{time / 1000:.1f}",
                    f"{time / times['sameQ']:.1f}",
                )
            )
    return table(("elements", "function", "elementwise", "time, µs", "of ours"), rows)


def files_table(files):
    cmp_seconds = files["rows"][0]["seconds"]
    rows = [
        (
            row["name"],
            f"{row['seconds']:.2f}",
            f"{row['seconds'] / cmp_seconds:.2f}",
            f"{row['memory'] / 2**20:.0f}",
        )
        for row in files["rows"]
    ]
    return table(("command and files", "time, s", "of cmp", "memory, MiB"), rows)


# ---- Pictures


def colour(ratio):
    """From pale green, no slower than memcmp, to red, three times its time or more."""
    share = min(max(math.log(ratio) / math.log(3), 0), 1)
    pale, red = (229, 245, 224), (203, 24, 29)
    return "#" + "".join(f"{round(p + share * (r - p)):02x}" for p, r in zip(pale, red))


def heat_map(loops, size):
    cell_width, cell_height, left, top = 62, 24, 78, 58
    count = len(loops.types)
    width, height = left + count * cell_width + 8, top + count * cell_height + 8
    lines = [
        f'<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 {width} {height}" '
        'font-family="sans-serif" font-size="11" text-anchor="middle">',
        f'<rect width="{width}" height="{height}" fill="#ffffff"/>',
        f'<text x="{width // 2}" y="20" font-size="14">{spaced(size)}: time as a multiple of '
        "memcmp&#8217;s, the worst of the workloads</text>",
    ]
    for i, name in enumerate(loops.types):
        x, y = left + i * cell_width + cell_width // 2, top + i * cell_height + 16
        lines.append(f'<text x="{x}" y="{top - 8}">{name}</text>')
        lines.append(f'<text x="{left - 6}" y="{y}" text-anchor="end">{name}</text>')
    for type1, type2 in loops.pairs(size):
        ratio, _ = loops.worst_workload(size, (type1, type2))
        x = left + loops.types.index(type2) * cell_width
        y = top + loops.types.index(type1) * cell_height
        lines.append(
            f'<rect x="{x}" y="{y}" width="{cell_width - 1}" height="{cell_height - 1}" '
            f'fill="{colour(ratio)}"/>'
        )
        lines.append(f'<text x="{x + cell_width // 2}" y="{y + 16}">{ratio:.2f}</text>')
    return "\n".join([*lines, "</svg>", ""])


# ---- Bars


def bars(loops, small, peers, files):
    """What is measured, its value, the bar, and whether the value may not be below it."""
    for (size, workload), ratios in loops.ratios.items():
        all_mean = mean(loops.all_pairs(size, workload).values())
        for statistic, value in (("mean", all_mean), ("worst", max(ratios.values()))):
            bar = BARS.get(size, {}).get(statistic)
            yield f"{spaced(size)}, {WORKLOADS[workload]}, {statistic}", value, bar, False
    for size in loops.sizes:
        ratios = loops.fractional(size)
        worst = max(ratios, key=ratios.get)
        name = f"{spaced(size)}, fractional to whole tolerance, worst ({pair_text(worst)})"
        yield name, ratios[worst], FRACTIONAL_BAR, False
    ratios = [slowdown(row) for row in small if row["len"] <= SMALL_LENGTHS]
    name = f"up to {SMALL_LENGTHS} elements, library to plain loop"
    yield f"{name}, mean", mean(ratios), SMALL_BAR, False
    yield f"{name}, worst", max(ratios), SMALL_BAR, False
    for element_type in peers.times:
        ratio, peer = peers.least_ratio(element_type)
        yield f"{element_type}, {peer.replace('_', ' ')} to ours", ratio, PEER_BAR, True
    seconds = {row["name"]: row["seconds"] for row in files["rows"]}
    cmp_seconds, near = seconds["cmp, identical"], seconds["talcmp --tol 20, near"]
    yield "identical files, talcmp to cmp", seconds["talcmp, identical"] / cmp_seconds, FILE_BAR, False
    yield "near files, talcmp to cmp of identical ones", near / cmp_seconds, FILE_BAR, False
    report = seconds["talcmp --tol 20 --report, near"]
    yield "near files, talcmp with a report to without", report / near, REPORT_BAR, False
    allclose = seconds["NumPy allclose of loaded arrays, near"]
    yield "near files, NumPy allclose of loaded arrays to talcmp", allclose / near, ALLCLOSE_BAR, True


def print_bars(measured):
    for name, value, bar, at_least in measured:
        if bar is None:
            verdict = ""
        else:
            kept = value >= bar if at_least else value <= bar
            verdict = f"{'kept' if kept else 'MISSED':7}{'>=' if at_least else '<='} {bar}"
        print(f"{value:7.2f}  {verdict:16}{name}")


# ---- The documents


def renew(text, block, content):
    """`text` with `content` between the marks of `block`."""
    begin, end = f"<!-- measured: {block} -->\n", "<!-- end -->"
    head, mark, tail = text.partition(begin)
    if not mark or end not in tail:
        sys.exit(f"report: no marks for {block} in performance.md")
    return f"{head}{begin}{content}{tail[tail.index(end):]}"


def main():
    if len(sys.argv) != 3:
        sys.exit("usage: report.py RESULTS DOCUMENTS")
    results, documents = map(Path, sys.argv[1:])

    def read(name):
        return json.loads((results / f"{name}.json").read_text(encoding="utf-8"))

    loops = Loops(read("element_loops"))
    small = read("small_arrays")
    peers = Peers(read("peers"), read("numpy_peer"))
    files = read("talcmp_files")

    for size in loops.sizes:
        picture = documents / f"performance_{size}.svg"
        picture.write_text(heat_map(loops, size), encoding="utf-8")
    document = documents / "performance.md"
    text = document.read_text(encoding="utf-8")
    text = renew(text, "machine", machine_table(loops.context))
    text = renew(text, "long arrays", loops_table(loops))
    text = renew(text, "worst pairs", worst_pairs_table(loops))
    text = renew(text, "short arrays", small_table(small))
    text = renew(text, "peers", peers_table(peers))
    text = renew(text, "files", files_table(files))
    document.write_text(text, encoding="utf-8")
    print_bars(bars(loops, small, peers, files))


if __name__ == "__main__":
    main()
