#!/usr/bin/env python3
"""Runs the tests against mutants of the module.

    mutate.py           all; writes the table of docs/testing.md
    mutate.py TEXT      those with TEXT in their names
    mutate.py --quick   those of quick.txt

A mutant is the module with one small change in its text. Each has to make a test fail, or to stand
in equivalent.txt with the reason why none can tell it from the module; the run fails where one does
neither, or both. Everything is built below build/mutation. What a step finds is kept there, and is
looked for again only where the code of the module or the sources of the step have changed.
"""

import hashlib
import json
import resource
import sys
import threading
from collections import Counter, defaultdict
from concurrent.futures import ThreadPoolExecutor
from dataclasses import dataclass

import mutants
import steps
from steps import (ARRAYS, BLOCKS, BLOCKS_OF_SETS, PARTS, READING, ROOT, SCALARS, SIGNALS, SMALL,
                   WORK, Broken, Killed)

FILES = ["Includes/taldata_array_element_types.h", "Includes/talnumericarray.h",
         "Includes/taltensor.h", "TalNumericArray/*.cpp", "TalNumericArray/*.h",
         "compilerruntime/src/scalar_op/utils/*.h", "compilerruntime/src/types/*.h"]
LISTS = ROOT / "tests" / "mutation"
DOCUMENT = ROOT / "docs" / "testing.md"
REPORT = WORK / "report.txt"
WORKERS = 2

# ---- The mutants to try

BOUNDS = {"<": "<=", "<=": "<", ">": ">=", ">=": ">"}


def rank(mutant):
    """Bounds before other operators and numbers, names last; among equals, a choice that stays."""
    before, _, behind = mutant.name[mutant.name.rindex("[") + 1 : -1].partition(" -> ")
    by_name = before[0].isalpha() and before not in ("true", "false")
    chance = hashlib.sha256(mutant.name.encode()).hexdigest()
    return by_name, BOUNDS.get(before, "") != behind.split(" (")[0], chance


def chosen(found):
    """One mutant of each line, and all that change the order of two statements."""
    by_line = defaultdict(list)
    for mutant in found:
        by_line[mutant.line].append(mutant)
    for _, line in sorted(by_line.items()):
        best = min((mutant for mutant in line if not mutant.change.swaps), key=rank, default=None)
        yield from (mutant for mutant in line if mutant is best or mutant.change.swaps)


def all_mutants():
    for path in sorted(path for pattern in FILES for path in ROOT.glob(pattern)):
        name = str(path.relative_to(ROOT))
        yield from chosen(mutants.mutants_of(name, path.read_text(encoding="utf-8")))


def read_list(name):
    """The names in a list, each with the indented lines behind it as one text."""
    reasons, current = {}, None
    for line in (LISTS / name).read_text(encoding="utf-8").splitlines():
        if line.startswith("    "):
            reasons[current] = f"{reasons[current]} {line.strip()}".strip()
        elif line and not line.startswith("#"):
            current = line
            reasons[current] = ""
    return reasons


# ---- What becomes of a mutant

KILLED, TIME_OUT, SURVIVES = "killed", "time-out", "survives"
BROKEN, ELSEWHERE = "does not compile", "not compiled here"


@dataclass(frozen=True)
class Outcome:
    kind: str
    step: str = ""
    by: str = ""


class Memory:
    """What each step found of each text, between runs."""

    def __init__(self):
        self.path = WORK / "found.json"
        self.found = json.loads(self.path.read_text()) if self.path.exists() else {}
        self.lock = threading.Lock()

    def ask(self, key, find):
        with self.lock:
            if key in self.found:
                return self.found[key]
        result = find()
        with self.lock:
            self.found[key] = result
            self.path.write_text(json.dumps(self.found, indent=0))
        return result


class Run:
    def __init__(self):
        WORK.mkdir(parents=True, exist_ok=True)
        self.memory = Memory()
        self.bench = steps.Bench(self.memory)
        self.compiled = self.bench.lines_compiled()
        self.needs = {part: self.bench.dependencies(part.mutated)
                      for part in (*SCALARS, *PARTS, BLOCKS)}
        self.suite = None
        self.suite_lock = threading.Lock()
        self.trees = [steps.Tree(WORK / f"worker{i}") for i in range(WORKERS)]

    def outcome(self, mutant):
        if (mutant.path, mutant.line) not in self.compiled:
            return Outcome(ELSEWHERE)
        tree = self.trees.pop()
        try:
            tree.put(mutant.path, mutant.applied(tree.texts[mutant.path]))
            return self._outcome(mutant, tree)
        finally:
            tree.restore(mutant.path)
            self.trees.append(tree)

    def _outcome(self, mutant, tree):
        texts = {**tree.texts, mutant.path: mutant.applied(tree.texts[mutant.path])}
        module = steps.digest(*(mutants.code_of(texts[path]) for path in sorted(texts)))
        for name, sources, find in self._steps(mutant, tree):
            key = steps.digest(module, name, sources)
            kind, by = self.memory.ask(key, lambda find=find: self._found(find))
            if kind:
                return Outcome(kind, name, by)
        return Outcome(SURVIVES)

    @staticmethod
    def _found(find):
        try:
            return find() or ("", "")
        except Broken as broken:
            return BROKEN, str(broken)
        except Killed as killed:
            return (TIME_OUT if str(killed) == TIME_OUT else KILLED), str(killed)

    def _steps(self, mutant, tree):
        """Name, sources and action of each step, those that take long last."""
        def step(program):
            return (program.name, self.bench.sources(program),
                    lambda: self.bench.run(program, tree, self.bench.limit(program)))

        def steps_of(parts):
            return (step(part) for part in parts
                    if mutant.path in self.needs[part] or mutant.path == steps.MODULE)

        yield from steps_of(SCALARS)
        yield step(ARRAYS)
        of_sets = "instruction_sets" in mutant.path
        if "TalNumericArray" in mutant.path and not of_sets:
            yield from steps_of([BLOCKS])
            yield step(SMALL)
        yield "same code", "", lambda: self._same_code(tree)
        yield from steps_of(PARTS)
        if "/compare.h" in mutant.path:
            yield step(SIGNALS)
        yield step(READING)
        if of_sets:
            yield step(BLOCKS_OF_SETS)
        if mutant.change.text == "":
            # An attribute, say, of which nothing but the built files tells.
            yield "release build", steps.checked_sources(), lambda: self._release(mutant, tree)

    def _same_code(self, tree):
        """No test of what is compiled can tell them apart."""
        return (SURVIVES, "same machine code") if self.bench.same_code(tree) else None

    def _release(self, mutant, tree):
        with self.suite_lock:
            self.suite = self.suite or steps.Suite()
            self.suite.run_with(mutant.path, mutant.applied(tree.texts[mutant.path]))


def outcomes_of(found):
    run = Run()
    lock = threading.Lock()
    outcomes = {}

    def find(mutant):
        outcome = run.outcome(mutant)
        with lock:
            outcomes[mutant] = outcome
            print(f"{len(outcomes)} of {len(found)}: {line_of(mutant, outcome)}", flush=True)

    with ThreadPoolExecutor(WORKERS) as pool:
        list(pool.map(find, found))
    return {mutant: outcomes[mutant] for mutant in found}


# ---- The report

def line_of(mutant, outcome):
    by = ", ".join(filter(None, (outcome.step, outcome.by)))
    return f"{outcome.kind}{f' ({by})' if by else ''}: line {mutant.line} of {mutant.name}"


def complaints(outcomes, reasons):
    for mutant, outcome in outcomes.items():
        listed = mutant.name in reasons
        if outcome.kind == SURVIVES and not listed:
            yield f"survives and is not listed as equivalent: {mutant.name}"
        if outcome.kind != SURVIVES and listed:
            yield f"{outcome.kind}, but is listed as equivalent: {mutant.name}"


GROUPS = {**{part.name: "parts" for part in (*SCALARS, *PARTS, SIGNALS)}, ARRAYS.name: "arrays",
          SMALL.name: "arrays", READING.name: "reading", BLOCKS.name: "blocks",
          "release build": "release"}
COLUMNS = {"arrays": "whole arrays", "parts": "tests of parts", "reading": "`reading_test`",
           "blocks": "`blocks_test`", "release": "release build", TIME_OUT: "time-out",
           SURVIVES: "equivalent"}


def column(outcome):
    return GROUPS[outcome.step] if outcome.kind == KILLED else outcome.kind


def row(cells):
    return f"| {' | '.join(map(str, cells))} |\n"


def table(outcomes):
    """By file, how many were killed and by what, and how many are equivalent."""
    by_file, total = defaultdict(Counter), Counter(map(column, outcomes.values()))
    for mutant, outcome in outcomes.items():
        by_file[f"`{mutant.path.split('/')[-1]}`"][column(outcome)] += 1
    by_file["all"] = total
    text = row(["file", "mutants", *COLUMNS.values()]) + "|---" * (2 + len(COLUMNS)) + "|\n"
    for name, counts in by_file.items():
        cells = [counts[key] for key in COLUMNS]
        text += row([name, sum(cells), *cells]) if sum(cells) else ""
    elsewhere = (f", and {total[ELSEWHERE]} lie in lines for other platforms or compilers"
                 if total[ELSEWHERE] else "")
    return f"{text}\nAnother {total[BROKEN]} do not compile{elsewhere}.\n"


def renew_document(outcomes):
    begin, end = "<!-- measured: mutants -->\n", "<!-- end -->"
    head, mark, tail = DOCUMENT.read_text(encoding="utf-8").partition(begin)
    if not mark or end not in tail:
        sys.exit("mutate: no marks for the mutants in docs/testing.md")
    DOCUMENT.write_text(f"{head}{begin}{table(outcomes)}{tail[tail.index(end):]}", encoding="utf-8")


def wanted_mutants(argument):
    found = list(all_mutants())
    if argument != "--quick":
        return [mutant for mutant in found if argument in mutant.name]
    quick = read_list("quick.txt")
    return [mutant for mutant in found if mutant.name in quick]


def main():
    argument = sys.argv[1] if len(sys.argv) > 1 else ""
    if len(sys.argv) > 2 or (argument.startswith("-") and argument != "--quick"):
        sys.exit("usage: mutate.py [--quick | TEXT]")
    found = wanted_mutants(argument)
    reasons = read_list("equivalent.txt")
    outcomes = outcomes_of(found)
    wrong = list(complaints(outcomes, reasons))
    names = {mutant.name for mutant in found}
    if argument == "":
        wrong += [f"listed as equivalent, but no mutant: {name}" for name in reasons
                  if name not in names]
        REPORT.write_text("".join(f"{line_of(*item)}\n" for item in outcomes.items()),
                          encoding="utf-8")
        renew_document(outcomes)
    if argument == "--quick":
        wrong += [f"of quick.txt, but no mutant: {name}" for name in read_list("quick.txt")
                  if name not in names]
    usage = resource.getrusage(resource.RUSAGE_CHILDREN)
    minutes = (usage.ru_utime + usage.ru_stime) / 60
    kinds = Counter(outcome.kind for outcome in outcomes.values())
    print(f"{len(found)} mutants, {minutes:.0f} minutes of a core:",
          ", ".join(f"{count} {kind}" for kind, count in kinds.items()))
    if not found:
        wrong.append(f"no mutant has '{argument}' in its name")
    print(*wrong, sep="\n")
    sys.exit(1 if wrong else 0)


if __name__ == "__main__":
    main()
