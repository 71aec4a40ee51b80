#!/usr/bin/python3
"""Turns what the benchmarks wrote into tables and pictures: report.py [--arm] RESULTS DOCUMENTS.

Reads the JSON files in the folder RESULTS, writes pictures into the folder DOCUMENTS, renews what is
between marks in its performance.md, and prints each bar with what was measured. With --arm these are
the instructions on 32-bit ARM, otherwise everything else.
"""

import json
import math
import re
import sys
from collections import defaultdict
from dataclasses import dataclass
from pathlib import Path

from pictures import charts, heat_map

WORKLOADS = {
    "identical": "identical",
    "near": "near",
    "near_fractional": "near, fractional tolerance",
    "last_differs": "last element differs",
}

# ---- The bars: the most that a value may be, or the least where that is noted

USER_BAR = 5.0  # nanoseconds
USER_BARS_OF_REALS = {"AVX-512": {32: 1 / 2, 128: 1 / 4}, "AVX2": {128: 1 / 2}}
FIRST_BAR = 1.0  # nanoseconds
PLACES_BAR = 1.5
GROWTH_BAR = 1.1
# Of AVX-512.
MEMCMP_BARS = {
    **{("256KiB", workload): {"mean": 1.25, "worst": 2.5}
       for workload in ("near", "near_fractional")},
    **{("256MiB", workload): {"mean": 1.1, "worst": 1.35} for workload in WORKLOADS},
}
MEMCMP_BAR_OF_REALS = 1.6
MEMCMP_BAR_OF_DOUBLES = 1.0  # 1.7 where units of 512 bits are two halves
FRACTIONAL_BAR = 1.5
PEER_BAR = 3.0  # the least
SHORT_PEER_BAR = 1.0  # the least
FILE_BAR = 1.3
REPORT_BAR = 3.0
ALLCLOSE_BAR = 10.0  # the least
ARM_NEAR_BAR = 20
ARM_IDENTICAL_BARS = {("VFP", "float64"): 8, ("VFP", "float32"): 8,
                      ("NEON", "float64"): 4, ("NEON", "float32"): 3}

# ---- Names

REALS = ("float32", "float64", "complex64", "complex128")

# These do not compare element by element under a tolerance.
NOT_ELEMENTWISE = {"Eigen isApprox", "NumPy array_equal"}

# How calls over short arrays are drawn, and whether near.
CHARTS = [
    ("float64", "float64", "near"),
    ("float64", "float64", "identical"),
    ("float32", "float32", "near"),
    ("int8", "float64", "near"),
]
CONTENDERS = {
    "library": "the module",
    "user": "a plain loop, same flags",
    "user_native": "a plain loop, -O3 -march=native",
}


def mean(ratios):
    """The geometric mean."""
    ratios = list(ratios)
    return math.exp(sum(map(math.log, ratios)) / len(ratios))


def spaced(size):
    return re.sub(r"(?<=\d)(?=[KM]iB)", " ", size)


def pair_text(pair):
    return " and ".join(pair)


def pair_of(row):
    return row["type1"], row["type2"]


def types_of(rows):
    """All types, in the order in which they first begin a pair."""
    types = dict.fromkeys(row["type2"] for row in rows)
    return sorted(types, key=[row["type1"] for row in rows].index)


def where(row):
    """A row of calls over short arrays."""
    words = [pair_text(pair_of(row)), row.get("workload"), f"n = {row['len']}"]
    return ", ".join(word for word in words if word)


# ---- What was measured


def check_pairs(pairs, workload, place):
    """All pairs that have a loop or, if near, all of these except pairs of integers."""
    expected = 144 - 8 * 8 if workload.startswith("near") else 144 - 8
    if len(set(pairs)) != expected:
        sys.exit(f"report: {place}, {workload}: {len(set(pairs))} pairs instead of {expected}")


class Loops:
    """Times of whole calls over long arrays, as multiples of memcmp's."""

    def __init__(self, results):
        self.compiler = results["compiler"].replace("GNU", "GCC")
        self.instruction_set = results["instruction_set"]
        self.sizes = list(dict.fromkeys(row["size"] for row in results["rows"]))
        # By size and workload, then by pair.
        self.ratios = {(size, workload): {} for size in self.sizes for workload in WORKLOADS}
        for row in results["rows"]:
            ratio = row["sameQ"] / row["memcmp"]
            self.ratios[row["size"], row["workload"]][pair_of(row)] = ratio
        for (size, workload), ratios in self.ratios.items():
            check_pairs(ratios, workload, size)
        self.types = types_of(results["rows"])

    def worst_workload(self, size, pair):
        """The ratio and the workload."""
        return max((self.ratios[size, w].get(pair, 0), w) for w in WORKLOADS)

    def pairs(self, size):
        return list(self.ratios[size, "identical"])

    def all_pairs(self, size, workload):
        """Integers, which have no tolerance, have their times when identical."""
        return {**self.ratios[size, "identical"], **self.ratios[size, workload]}

    def fractional(self, size):
        """Times under a fractional tolerance as multiples of those under a whole one."""
        near = self.ratios[size, "near"]
        return {pair: r / near[pair] for pair, r in self.ratios[size, "near_fractional"].items()}


class ShortCalls:
    """Times of calls over short arrays."""

    def __init__(self, results):
        self.rows = results["lengths"]
        self.first_differs = results["first_differs"]
        self.places = results["places"]
        self.bytes = results["bytes"]
        self.by_call = defaultdict(list)  # by pair and workload
        for row in self.rows:
            self.by_call[(*pair_of(row), row["workload"])].append(row)
        for workload in ("identical", "near"):
            pairs = [pair_of(row) for row in self.rows if row["workload"] == workload]
            check_pairs(pairs, workload, "short arrays")
        for rows, name in ((self.first_differs, "first differs"), (self.places, "places")):
            check_pairs([pair_of(row) for row in rows], "identical", name)

    def line(self, call, contender):
        return [(row["len"], row[contender]) for row in self.by_call[call]]

    def of_one_real_type(self, length):
        return [row for row in self.rows
                if row["len"] == length and row["type1"] == row["type2"] and row["type1"] in REALS]

    def greatest_drop(self):
        """A call's time as a multiple of a longer call's, and both calls."""
        return max(
            ((row["library"] / longer["library"], row, longer)
             for rows in self.by_call.values()
             for i, row in enumerate(rows)
             for longer in rows[i + 1:]),
            key=lambda drop: drop[0],
        )


class Peers:
    """Times of the same question put to other libraries, by type and length, then by name."""

    def __init__(self, results, numpy_results):
        self.sizes = defaultdict(dict)
        self.lengths = defaultdict(dict)
        for times, rows in ((self.sizes, results["sizes"]), (self.lengths, results["lengths"])):
            for row in rows:
                times[row["type"], row["len"]][row["name"]] = row["nanoseconds"]
        for row in numpy_results["rows"]:
            self.sizes[row["type"], row["len"]][row["name"]] = row["nanoseconds"]

    @staticmethod
    def least_ratio(times):
        """The time of the fastest elementwise function as a multiple of ours, and its name."""
        return min(
            (time / times["sameQ"], name)
            for name, time in times.items()
            if name != "sameQ" and name not in NOT_ELEMENTWISE
        )


# ---- The bars with their values


@dataclass
class Measured:
    what: str
    value: float
    bar: float = None
    at_least: bool = False

    def met(self):
        return self.value >= self.bar if self.at_least else self.value <= self.bar

    def bar_text(self):
        return f"{'at least' if self.at_least else 'at most'} {self.bar:g}"


def worst_of(name, by_pair, bar):
    """The greatest value of all pairs of types."""
    worst = max(by_pair, key=by_pair.get)
    return Measured(f"{name}, worst ({pair_text(worst)})", by_pair[worst], bar)


def bars_of_short_calls(short, instruction_set):
    for contender in ("user", "user_native"):
        name = CONTENDERS[contender]
        worst = max(short.rows, key=lambda row, c=contender: row["library"] - row[c])
        slower = worst["library"] - worst[contender]
        yield Measured(f"slower than {name}, ns ({where(worst)})", slower, USER_BAR)
        for length in (32, 128):
            rows = short.of_one_real_type(length)
            worst = max(rows, key=lambda row, c=contender: row["library"] / row[c])
            bar = USER_BARS_OF_REALS.get(instruction_set, {}).get(length)
            yield Measured(f"reals of one type, to {name} ({where(worst)})",
                           worst["library"] / worst[contender], bar)
    worst = max(short.first_differs, key=lambda row: row["library"] - row["one_by_one"])
    yield Measured(f"first element differs, slower than the rule one by one, ns ({where(worst)})",
                   worst["library"] - worst["one_by_one"], FIRST_BAR)
    constants = sorted(row["library"] - row["memcmp"] for row in short.bytes)
    yield Measured("compared as bytes, slower than memcmp, ns, least", constants[0])
    yield Measured("compared as bytes, slower than memcmp, ns, most", constants[-1])
    for length in dict.fromkeys(row["len"] for row in short.places):
        rows = [row for row in short.places if row["len"] == length]
        worst = max(rows, key=lambda row: row["slowest"] / row["median"])
        yield Measured(f"slowest of 64 places to their median ({where(worst)})",
                       worst["slowest"] / worst["median"], PLACES_BAR)
    drop, row, longer = short.greatest_drop()
    yield Measured(f"time to that of more elements ({where(row)} to {longer['len']})",
                   drop, GROWTH_BAR)


def bars_of_long_calls(loops):
    has_bars = loops.instruction_set == "AVX-512"
    for (size, workload), ratios in loops.ratios.items():
        all_mean = mean(loops.all_pairs(size, workload).values())
        name = f"{spaced(size)}, {WORKLOADS[workload]}, to memcmp"
        bars = MEMCMP_BARS.get((size, workload), {}) if has_bars else {}
        yield Measured(f"{name}, mean", all_mean, bars.get("mean"))
        yield worst_of(name, ratios, bars.get("worst"))
    near = loops.ratios["32KiB", "near"]
    of_reals = [ratio for pair, ratio in near.items() if set(pair) <= set(REALS)]
    yield Measured("32 KiB, near, to memcmp, mean of the pairs of reals and complex numbers",
                   mean(of_reals), MEMCMP_BAR_OF_REALS if has_bars else None)
    yield Measured("32 KiB, near, to memcmp, float64", near["float64", "float64"],
                   MEMCMP_BAR_OF_DOUBLES if has_bars else None)
    for size in loops.sizes:
        yield worst_of(f"{spaced(size)}, fractional to whole tolerance", loops.fractional(size),
                       FRACTIONAL_BAR)


def bars_of_peers(peers):
    for (element_type, length), times in peers.sizes.items():
        ratio, peer = peers.least_ratio(times)
        yield Measured(f"{element_type}, n = {length}, {peer} to ours", ratio, PEER_BAR, True)
    for element_type in dict.fromkeys(name for name, _ in peers.lengths):
        least, length, peer = min(
            (ratio, length, peer)
            for (name, length), times in peers.lengths.items()
            if name == element_type
            for ratio, peer in [peers.least_ratio(times)]
        )
        yield Measured(f"{element_type}, n from 8 on, {peer} to ours (n = {length})", least,
                       SHORT_PEER_BAR, True)


def bars_of_files(files):
    seconds = {row["name"]: row["seconds"] for row in files["rows"]}
    cmp_seconds, near = seconds["cmp, identical"], seconds["talcmp --tol 20, near"]
    yield Measured("identical files, talcmp to cmp", seconds["talcmp, identical"] / cmp_seconds,
                   FILE_BAR)
    yield Measured("near files, talcmp to cmp of identical ones", near / cmp_seconds, FILE_BAR)
    report = seconds["talcmp --tol 20 --report, near"]
    yield Measured("near files, talcmp with a report to without", report / near, REPORT_BAR)
    allclose = seconds["NumPy allclose of loaded arrays, near"]
    yield Measured("near files, NumPy allclose of loaded arrays to talcmp", allclose / near,
                   ALLCLOSE_BAR, True)


def print_bars(measured):
    for one in measured:
        verdict = ""
        if one.bar is not None:
            sign = ">=" if one.at_least else "<="
            verdict = f"{'met' if one.met() else 'MISSED':7}{sign} {one.bar:g}"
        print(f"{one.value:8.2f}  {verdict:16}{one.what}")


# ---- Tables


def table(head, rows):
    lines = ["| " + " | ".join(map(str, line)) + " |\n" for line in (head, *rows)]
    return lines[0] + "|---" * len(head) + "|\n" + "".join(lines[1:])


def bars_table(measured):
    rows = [(one.what, f"{one.value:.2f}", one.bar_text(), "yes" if one.met() else "**no**")
            for one in measured if one.bar is not None]
    return table(("what", "measured", "bar", "met"), rows)


def processor():
    text = Path("/proc/cpuinfo").read_text(encoding="utf-8")
    model = re.search(r"^model name\s*:\s*(.+)$", text, re.MULTILINE)
    clock = re.search(r"^cpu MHz\s*:\s*(\d+)", text, re.MULTILINE)
    cores = len(re.findall(r"^processor\s*:", text, re.MULTILINE))
    words = [model.group(1) if model else "unknown", f"{clock.group(1)} MHz" if clock else "",
             f"{cores} cores"]
    return ", ".join(word for word in words if word)


def caches():
    for folder in sorted(Path("/sys/devices/system/cpu/cpu0/cache").glob("index*")):
        kind, level, size = ((folder / name).read_text(encoding="utf-8").strip()
                             for name in ("type", "level", "size"))
        if kind != "Instruction":
            yield f"cache, level {level}", size.replace("K", " KiB")


def machine_table(loops, start):
    day, load = start.split()
    return table(("", "of this run"), [
        ("processor", processor()),
        ("instruction set of the loops", loops.instruction_set),
        *caches(),
        ("compiler", loops.compiler),
        ("load when it began", f"{load} processes"),
        ("day", day),
    ])


def loops_table(loops):
    rows = []
    for (size, workload), ratios in loops.ratios.items():
        worst = max(ratios, key=ratios.get)
        rows.append((spaced(size), WORKLOADS[workload],
                     f"{mean(loops.all_pairs(size, workload).values()):.2f}", len(ratios),
                     f"{mean(ratios.values()):.2f}", f"{ratios[worst]:.2f}", pair_text(worst)))
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


def peers_table(peers):
    rows = []
    for (element_type, length), times in peers.sizes.items():
        for name, time in times.items():
            elementwise = "no" if name in NOT_ELEMENTWISE else "yes"
            rows.append((element_type, length, name, elementwise, f"{time / 1000:.2f}",
                         f"{time / times['sameQ']:.1f}"))
    return table(("elements", "n", "function", "elementwise", "time, µs", "of ours"), rows)


def files_table(files):
    cmp_seconds = files["rows"][0]["seconds"]
    rows = [(row["name"], f"{row['seconds']:.2f}", f"{row['seconds'] / cmp_seconds:.2f}",
             f"{row['memory'] / 2**20:.0f}") for row in files["rows"]]
    return table(("command and files", "time, s", "of cmp", "memory, MiB"), rows)


def files_of_peers_table(files):
    rows = []
    for row in files["rows"]:
        talcmp_seconds = row["commands"][0]["seconds"]
        for one in row["commands"]:
            rows.append((f"{row['files']}, {row['workload']}", f"{row['bytes'] / 2**20:.0f}",
                         one["name"], f"{one['seconds']:.2f}",
                         f"{one['seconds'] / talcmp_seconds:.2f}", f"{one['memory'] / 2**20:.0f}"))
    rows.extend((name, "", "left out, as talcmp was built without HDF5", "", "", "")
                for name in files["left_out"])
    return table(("files", "each, MiB", "command", "time, s", "of talcmp", "memory, MiB"), rows)


# ---- 32-bit ARM

ARM_COLUMNS = [("VFP", "identical"), ("VFP", "near"), ("NEON", "identical"), ("NEON", "near")]
ARM_ROWS = [("float64", "float64"), ("float32", "float32"), ("int32", "float64"),
            ("int8", "float64")]


def group_of(pair):
    """The group of pairs that take about as many instructions."""
    integers = [name for name in pair if "int" in name]
    complexes = [name for name in pair if name.startswith("complex")]
    if len(integers) == 2:
        return "two integers" + (", one of 64 bits" if any("64" in i for i in integers) else "")
    if integers:
        width = "an integer of 64 bits" if integers[0].endswith("64") else "a smaller integer"
        return f"{width} and a {'complex number' if complexes else 'real'}"
    return ("two reals", "a real and a complex number", "two complex numbers")[len(complexes)]


class Arm:
    """Instructions a pair of elements, by build and workload, then by pair of types."""

    def __init__(self, results):
        self.results = results
        self.counts = defaultdict(dict)
        for row in results["rows"]:
            self.counts[row["build"], row["workload"]][pair_of(row)] = row["a_pair"]
        for build, workload in ARM_COLUMNS:
            check_pairs(self.counts[build, workload], workload, build)
        self.types = types_of(results["rows"])

    def worst_workload(self, build):
        return {pair: max(count, self.counts[build, "near"].get(pair, 0))
                for pair, count in self.counts[build, "identical"].items()}


def arm_table(arm):
    def cells(pairs):
        for column in ARM_COLUMNS:
            counts = [arm.counts[column][pair] for pair in pairs if pair in arm.counts[column]]
            if len(counts) > 1:
                yield f"{mean(counts):.1f}, {max(counts):.1f}"
            else:
                yield f"{counts[0]:.1f}" if counts else ""

    groups = defaultdict(list)
    for pair in arm.counts["VFP", "identical"]:
        groups[group_of(pair)].append(pair)
    rows = [(pair_text(pair), 1, *cells([pair])) for pair in ARM_ROWS]
    rows += [(name, len(pairs), *cells(pairs)) for name, pairs in groups.items()]
    columns = (f"{build}, {workload}" for build, workload in ARM_COLUMNS)
    return table(("types", "pairs", *columns), rows)


def bars_of_arm(arm):
    for build in ("VFP", "NEON"):
        yield worst_of(f"{build}, near", arm.counts[build, "near"], ARM_NEAR_BAR)
    yield Measured("divisions a pair, worst",
                   max(row["divisions_a_pair"] for row in arm.results["rows"]), 0)
    for (build, name), bar in ARM_IDENTICAL_BARS.items():
        yield Measured(f"{build}, identical, {name}", arm.counts[build, "identical"][name, name], bar)
    more, pair, workload = max(
        (count - arm.counts["VFP", workload][pair], pair, workload)
        for workload in ("identical", "near")
        for pair, count in arm.counts["NEON", workload].items()
    )
    yield Measured(f"NEON, more than VFP ({pair_text(pair)}, {workload})", more, 0)
    beginnings = [row["beginning"] for row in arm.results["rows"]]
    yield Measured("beginning of a call, instructions, least", min(beginnings))
    yield Measured("beginning of a call, instructions, most", max(beginnings))


# ---- The documents


def renew_blocks(document, blocks):
    """Replaces what is between the marks of each block."""
    text = document.read_text(encoding="utf-8")
    for block, content in blocks.items():
        head, mark, tail = text.partition(f"<!-- measured: {block} -->\n")
        _, end, rest = tail.partition("<!-- end -->")
        if not mark or not end:
            sys.exit(f"report: no marks for {block} in {document.name}")
        text = "".join((head, mark, content, end, rest))
    document.write_text(text, encoding="utf-8")


def read(results, name):
    return json.loads((results / f"{name}.json").read_text(encoding="utf-8"))


def report_of_arm(results, documents):
    arm = Arm(read(results, "arm_instructions"))
    for build in ("VFP", "NEON"):
        title = f"{build}: instructions a pair, the worse of the workloads"
        picture = heat_map(title, arm.types, arm.worst_workload(build), (8, 48), 1)
        (documents / f"performance_arm_{build}.svg").write_text(picture, encoding="utf-8")
    measured = list(bars_of_arm(arm))
    renew_blocks(documents / "performance.md",
                 {"32-bit ARM": arm_table(arm), "bars of 32-bit ARM": bars_table(measured)})
    print_bars(measured)


def report_of_times(results, documents):
    loops = Loops(read(results, "element_loops"))
    short = ShortCalls(read(results, "small_arrays"))
    peers = Peers(read(results, "peers"), read(results, "numpy_peer"))
    files = read(results, "talcmp_files")

    for size in loops.sizes:
        title = f"{spaced(size)}: time as a multiple of memcmp&#8217;s, the worst of the workloads"
        worst = {pair: loops.worst_workload(size, pair)[0] for pair in loops.pairs(size)}
        picture = heat_map(title, loops.types, worst, (1, 3), 2)
        (documents / f"performance_{size}.svg").write_text(picture, encoding="utf-8")
    all_charts = [
        (f"{type1} and {type2}, {workload}",
         [short.line((type1, type2, workload), contender) for contender in CONTENDERS], [])
        for type1, type2, workload in CHARTS
    ]
    picture = charts("A call over short arrays", CONTENDERS.values(), all_charts, "elements",
                     "time, ns")
    (documents / "performance_short.svg").write_text(picture, encoding="utf-8")

    measured = [
        *bars_of_short_calls(short, loops.instruction_set),
        *bars_of_long_calls(loops),
        *bars_of_peers(peers),
        *bars_of_files(files),
    ]
    start = (results / "start").read_text(encoding="utf-8")
    renew_blocks(documents / "performance.md", {
        "machine": machine_table(loops, start),
        "bars": bars_table(measured),
        "long arrays": loops_table(loops),
        "worst pairs": worst_pairs_table(loops),
        "peers": peers_table(peers),
        "files": files_table(files),
        "files of peers": files_of_peers_table(read(results, "talcmp_peers")),
    })
    print_bars(measured)


def main():
    arguments = sys.argv[1:]
    report = report_of_times
    if arguments[:1] == ["--arm"]:
        report = report_of_arm
        arguments = arguments[1:]
    if len(arguments) != 2:
        sys.exit("usage: report.py [--arm] RESULTS DOCUMENTS")
    report(*map(Path, arguments))


if __name__ == "__main__":
    main()
