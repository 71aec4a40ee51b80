#!/usr/bin/env python3
"""Runs the tests against mutants of the module and of talcmp.

    mutate.py           all; writes the tables of docs/testing.md
    mutate.py TEXT      those with TEXT in their paths or names
    mutate.py --quick   those of quick.txt

A mutant is a source with one small change in its text. Each has to make a test fail, or to be
listed in equivalent.txt with the reason why no test can distinguish it from the source. The run
fails where one does neither, or both. Everything is built below build/mutation. What a step finds
is kept there, and is found anew only where the code or the sources of the step have changed.
"""

import json
import resource
import sys
import threading
from collections import Counter, defaultdict
from concurrent.futures import ThreadPoolExecutor
from dataclasses import dataclass

import mutants
import steps
from module_steps import Module
from steps import BROKEN, KILLED, ROOT, SURVIVES, TIME_OUT, WORK, Broken, Killed
from talcmp_steps import Talcmp

TARGETS = (Module, Talcmp)
LISTS = ROOT / "tests" / "mutation"
DOCUMENT = ROOT / "docs" / "testing.md"
REPORT = WORK / "report.txt"
WORKERS = 2
ELSEWHERE = "not compiled here"

# ---- The lists

def read_list(name):
    """The names in a list, each with the indented lines after it as one text."""
    reasons, current = {}, None
    for line in (LISTS / name).read_text(encoding="utf-8").splitlines():
        if line.startswith("    "):
            reasons[current] = f"{reasons[current]} {line.strip()}".strip()
        elif line and not line.startswith("#"):
            current = line
            reasons[current] = ""
    return reasons


# ---- What becomes of a mutant

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
    """The mutants of one target, and as many copies of it as there are workers."""

    def __init__(self, target, memory):
        self.memory = memory
        self.bench = target.bench(memory)
        self.codes = {path: mutants.code_of(text) for path, text in self.bench.tree.texts.items()}
        self.trees = [self.bench.tree_of(WORK / f"{target.__name__.lower()}{i}")
                      for i in range(WORKERS)]

    def outcome(self, mutant):
        if not self.bench.is_compiled(mutant):
            return Outcome(ELSEWHERE)
        tree = self.trees.pop()
        try:
            tree.put(mutant.path, mutant.applied(tree.texts[mutant.path]))
            return self._outcome(mutant, tree)
        finally:
            tree.restore(mutant.path)
            self.trees.append(tree)

    def _outcome(self, mutant, tree):
        mutated = mutants.code_of(mutant.applied(tree.texts[mutant.path]))
        codes = {**self.codes, mutant.path: mutated}
        code = steps.digest(*(codes[path] for path in sorted(codes)))
        for name, sources, find in self.bench.steps(mutant, tree):
            key = steps.digest(code, name, sources)
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


def outcomes_of(target, found, memory):
    run = Run(target, memory)
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


def column(target, outcome):
    return target.group(outcome.step) if outcome.kind == KILLED else outcome.kind


def row(cells):
    return f"| {' | '.join(map(str, cells))} |\n"


def table(target, outcomes):
    """By file or folder, how many were killed and by what, and how many are equivalent."""
    by_row, total = defaultdict(Counter), Counter()
    for mutant, outcome in outcomes.items():
        by_row[f"`{target.row(mutant.path)}`"][column(target, outcome)] += 1
        total[column(target, outcome)] += 1
    by_row["all"] = total
    text = row([target.row_title, "mutants", *target.columns.values()])
    text += "|---" * (2 + len(target.columns)) + "|\n"
    for name, counts in by_row.items():
        cells = [counts[key] for key in target.columns]
        text += row([name, sum(cells), *cells]) if sum(cells) else ""
    elsewhere = (f", and {total[ELSEWHERE]} are in lines for other platforms or compilers"
                 if total[ELSEWHERE] else "")
    return f"{text}\nAnother {total[BROKEN]} do not compile{elsewhere}.\n"


def renew_document(target, outcomes):
    text = DOCUMENT.read_text(encoding="utf-8")
    head, mark, tail = text.partition(f"<!-- measured: {target.mark} -->\n")
    _, end, rest = tail.partition("<!-- end -->")
    if not mark or not end:
        sys.exit(f"mutate: no marks for the {target.mark} in docs/testing.md")
    text = "".join((head, mark, table(target, outcomes), end, rest))
    DOCUMENT.write_text(text, encoding="utf-8")


# ---- Everything

def is_wanted(argument, mutant, quick):
    if argument == "--quick":
        return mutant.name in quick
    return argument in mutant.path or argument in mutant.name


def main():
    argument = sys.argv[1] if len(sys.argv) > 1 else ""
    if len(sys.argv) > 2 or (argument.startswith("-") and argument != "--quick"):
        sys.exit("usage: mutate.py [--quick | TEXT]")
    WORK.mkdir(parents=True, exist_ok=True)
    memory = Memory()
    reasons, quick = read_list("equivalent.txt"), read_list("quick.txt")
    mutants = {target: list(target.mutants()) for target in TARGETS}
    names = {mutant.name for there in mutants.values() for mutant in there}
    # At once, as what is listed in vain would otherwise be told after hours.
    if stale := [f"listed, but no mutant: {name}" for name in (*reasons, *quick)
                 if name not in names]:
        sys.exit("\n".join(stale))
    outcomes = {}
    for target, there in mutants.items():
        wanted = [mutant for mutant in there if is_wanted(argument, mutant, quick)]
        if wanted:
            found = outcomes_of(target, wanted, memory)
            outcomes.update(found)
            if len(wanted) == len(there):
                renew_document(target, found)
    wrong = list(complaints(outcomes, reasons))
    if argument == "":
        REPORT.write_text("".join(f"{line_of(*item)}\n" for item in outcomes.items()),
                          encoding="utf-8")
    if not outcomes:
        wrong.append(f"no mutant has '{argument}' in its path or name")
    print_sum(outcomes)
    print(*wrong, sep="\n")
    sys.exit(1 if wrong else 0)


def print_sum(outcomes):
    usage = resource.getrusage(resource.RUSAGE_CHILDREN)
    minutes = (usage.ru_utime + usage.ru_stime) / 60
    kinds = Counter(outcome.kind for outcome in outcomes.values())
    print(f"{len(outcomes)} mutants, {minutes:.1f} minutes of a core:",
          ", ".join(f"{count} {kind}" for kind, count in kinds.items()))


if __name__ == "__main__":
    main()
