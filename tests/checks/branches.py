"""Fails where a branch of the module is taken in none of the functions that a template makes.

    branches.py BUILD_FOLDER SOURCE_FOLDER...

Reads what an instrumented build has counted. A branch of the source counts once, even if one
element type takes it and another cannot, or if its function is inlined in many places. Branches
that depend on the processor are left out.
"""

import json
import pathlib
import re
import subprocess
import sys

# Conditions that only another processor would decide otherwise.
OF_PROCESSOR = re.compile(r"supported\(\)|cpu_supports|ask\(type_tag")


def counted_lines(build, sources):
    """Yields file, line number, and the counts of its branches, for each function made of it."""
    for counts in sorted(build.rglob("*.gcda")):
        reports = subprocess.run(
            ["gcov", "--json-format", "--stdout", "--branch-probabilities", str(counts)],
            capture_output=True,
            check=True,
            cwd=build,
        ).stdout
        for report in reports.splitlines():
            for file in json.loads(report)["files"]:
                path = pathlib.Path(file["file"])
                if any(source in path.parents for source in sources):
                    for line in file["lines"]:
                        branches = [b["count"] for b in line["branches"] if not b["throw"]]
                        yield path, line["line_number"], branches


def decisions(text):
    """The number of conditions in a line of source that has at least one."""
    return len(re.findall(r"&&|\|\|", text)) + max(1, text.count("?"))


def of_source(text, counts):
    """Adds up the counts of a line that has been inlined several times."""
    width = 2 * decisions(text)
    if len(counts) % width != 0:
        return counts
    return [sum(counts[k::width]) for k in range(width)]


def main(build, *sources):
    sources = [pathlib.Path(source).resolve() for source in sources]
    texts = {}
    taken = {}
    for path, number, counts in counted_lines(pathlib.Path(build).resolve(), sources):
        text = texts.setdefault(path, path.read_text().splitlines())[number - 1].strip()
        if counts and not OF_PROCESSOR.search(text):
            counts = of_source(text, counts)
            key = (path.name, number, text, len(counts))
            before = taken.setdefault(key, [0] * len(counts))
            taken[key] = [old + new for old, new in zip(before, counts)]
    missing = [
        f"{name}:{number}: {counts.count(0)} of {len(counts)}: {text}"
        for (name, number, text, _), counts in sorted(taken.items())
        if 0 in counts
    ]
    total = sum(map(len, taken.values()))
    if not total:
        sys.exit("branches: nothing has been counted")
    if missing:
        sys.exit("\n".join(["branches: not taken:", *missing]))
    print(f"all {total} branches of the source are taken")


if __name__ == "__main__":
    if len(sys.argv) < 3:
        sys.exit(__doc__)
    main(*sys.argv[1:])
