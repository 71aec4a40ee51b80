"""talcmp as a target: its mutants, and the tests that are run with one after the other."""

import hashlib
import re
from dataclasses import dataclass
from pathlib import Path

import module_steps
import mutants
import steps
from statements import WholeSource
from steps import ROOT, SURVIVES, TIME_OUT, WORK, command, precompile, run_test

TOOL = "tools/talcmp"
FOLDERS = [*module_steps.FOLDERS, TOOL]
INCLUDES = [*FOLDERS, *(f"{TOOL}/{name}" for name in ("arrays", "comparison", "formats", "picture",
                                                      "text"))]
LIBRARIES = ["-lzip", "-ldeflate", "-lz", "-lpng", "-lhdf5_serial"]
SETTINGS = ["-isystem", "/usr/include/hdf5/serial", "-DTALCMP_HAS_HDF5", "-DTALCMP_HAS_PNG",
            "-DH5_USE_18_API"]
# Parts of builds that lack a library.
OTHER_BUILDS = {f"{TOOL}/picture/png_picture_missing.cpp", "tests/talcmp/hdf5_absent_test.cpp"}
MAIN = f"{TOOL}/main.cpp"
TESTS = "tests/talcmp"
RUN_TALCMP = f"{TESTS}/support/run_talcmp.cpp"
# Counts calls by an option of the linker, and so is no part of the program that has the other tests.
COUNTED = f"{TESTS}/questions_test.cpp"
MODULE = [module_steps.MODULE, module_steps.TABLE]
# The part of the module's test support that draws numbers.
ORACLE = [f"tests/support/{name}.cpp" for name in ("oracle", "random_arrays")]
STANDARD_HEADERS = ["algorithm", "array", "atomic", "charconv", "cmath", "complex", "filesystem",
                    "functional", "future", "map", "memory", "mutex", "numeric", "optional",
                    "string", "string_view", "thread", "vector"]

# ---- The mutants to try

def is_condition(change):
    return change.whole and (change.text in ("true", "false") or change.text.startswith("!("))


def rank(mutant):
    return not is_condition(mutant.change), not mutant.change.whole, mutant.chance


def share(change):
    """How large a part is tried: all conditions, and some of the many other lines."""
    return 1 if is_condition(change) else 1 / 4 if change.whole else 1 / 12


def chosen(found):
    """At most one mutant of each line."""
    for line in mutants.by_line(found):
        best = min(line, key=rank)
        if hashlib.sha256(best.name[::-1].encode()).digest()[0] < 256 * share(best.change):
            yield best


# ---- Copies of talcmp, and what is built from them

class Tree(steps.Tree):
    """A copy of talcmp in which one file at a time is changed."""

    folders, includes = FOLDERS, INCLUDES

    @property
    def command(self):
        return self.folder / "talcmp"

    def sees(self, source):
        """Which talcmp to start differs between copies."""
        return source == RUN_TALCMP or super().sees(source)

    def _options(self, source, flags):
        if source.startswith("tests/"):
            return ["-O1" if source in ORACLE else "-O0", "-include", str(WORK / "gtest.h"),
                    f"-I{ROOT}/tests", f"-I{ROOT}/{TESTS}", *SETTINGS,
                    f'-DTALCMP_COMMAND="{self.command}"',
                    f"-DDEFAULT_RANDOM_CALLS={module_steps.RANDOM_CALLS}"]
        if source in MODULE:
            return ["-O1", f"-D{module_steps.ONE_SET}"]
        return ["-O0", "-include", str(WORK / "talcmp.h"), '-DTALCMP_VERSION="0.0.0"', *SETTINGS]


# ---- The tests

@dataclass(frozen=True)
class Program:
    """Tests in C++ that are linked together, or one in Python."""

    name: str
    sources: tuple
    runs_talcmp: bool = True
    run: tuple = ()


def test_programs():
    """The tests of parts as one program; each source that runs talcmp, and each in Python, as its
    own."""
    found = (str(path.relative_to(ROOT)) for path in sorted((ROOT / TESTS).glob("*_test.*")))
    paths = [path for path in found if path not in OTHER_BUILDS]
    sources = [path for path in paths if path.endswith(".cpp") and path != COUNTED]
    whole = [path for path in sources if "run_talcmp.h" in (ROOT / path).read_text()]
    parts = [path for path in sources if path not in whole]
    fast = ("--gtest_filter=-Exhaustive*",)
    yield Program("parts", (*parts, *ORACLE), False, fast)
    for path in sorted(whole, key=lambda path: "answers" in path):
        yield Program(Path(path).stem, (path, RUN_TALCMP), True, fast)
    for path in paths:
        if path.endswith(".py"):
            yield Program(Path(path).stem, (path,))


class Bench(steps.Bench):
    """What all copies of talcmp share."""

    spare = 4

    def __init__(self, memory):
        precompile("talcmp.h", STANDARD_HEADERS, ["-O0"])
        super().__init__(memory, Tree(WORK / "talcmp"))
        self.sources_of_core = [path for path in self.tree.texts if path.startswith(TOOL)
                                and path.endswith(".cpp") and path != MAIN
                                and path not in OTHER_BUILDS]
        self.programs = list(test_programs())
        self.core = WORK / "talcmp" / "core.a"
        self.core.unlink(missing_ok=True)
        objects = [self.tree.object(path) for path in (*self.sources_of_core, *MODULE)]
        command(["ar", "rcs", str(self.core), *map(str, objects)])
        self.compiled = {path: self.tree.lines_compiled(path) for path in self.sources_of_core
                         if re.search(r"^#if", self.tree.texts[path], flags=re.MULTILINE)}

    def tree_of(self, folder):
        return Tree(folder, self.tree)

    def is_compiled(self, mutant):
        lines = self.compiled.get(mutant.path)
        return lines is None or (mutant.path, mutant.line) in lines

    def needs(self, program, source):
        return self.tree.needs(source) if source.endswith(".cpp") else {source}

    def run(self, program, tree, seconds):
        """Builds and runs the program with the tree's talcmp; raises Killed where a test fails."""
        if program.runs_talcmp:
            self._link(tree, [tree.object(MAIN)], tree.command)
        if program.sources[0].endswith(".py"):
            words = ["/usr/bin/python3", "-B", str(ROOT / program.sources[0]), str(tree.command),
                     "--", "--failfast"]
        else:
            target = tree.folder / program.name
            self._link(tree, [tree.object(source) for source in program.sources], target,
                       "-lgtest", "-lgtest_main")
            words = [str(target), *program.run]
        with steps.temporary_folder(tree.folder) as folder:
            variables = {"TMPDIR": folder, "TALNUMERICARRAY_ROUNDS": "1"}
            run_test(words, seconds, patience=6, cwd=folder, env=variables)

    def _link(self, tree, objects, target, *libraries):
        """Objects that see the mutant come first, so that the archive's are not taken."""
        changed = [tree.object(path) for path in self.sources_of_core if tree.sees(path)]
        steps.link(target, *objects, *changed, self.core, *libraries, *LIBRARIES)

    def steps(self, mutant, tree):
        """Name, sources and action of each step; the parts first where the mutant is in one."""
        of_part = mutant.path.startswith(tuple(
            f"{TOOL}/{name}/" for name in ("arrays", "comparison", "formats", "picture")))
        for program in sorted(self.programs, key=lambda each: self._order(each, of_part)):
            yield (program.name, self.sources(program),
                   lambda program=program: self.run(program, tree, self.limit(program)))

    @staticmethod
    def _order(program, of_part):
        return program.sources[0].endswith(".py"), program.runs_talcmp == of_part


# ---- The target

class Talcmp:
    mark = "mutants of talcmp"  # of the table in the document
    columns = {"parts": "tests of parts", "command": "tests of the command",
               "python": "tests in Python", TIME_OUT: "time-out", SURVIVES: "equivalent"}
    row_title = "folder"
    bench = Bench

    @staticmethod
    def row(path):
        return path.rpartition("/")[0]

    @staticmethod
    def group(step):
        in_python = (ROOT / TESTS / f"{step}.py").exists()
        return "parts" if step == "parts" else "python" if in_python else "command"

    @staticmethod
    def mutants():
        for path in sorted((ROOT / TOOL).rglob("*.*")):
            if path.suffix in (".cpp", ".h"):
                name = str(path.relative_to(ROOT))
                text = path.read_text(encoding="utf-8")
                yield from chosen(mutants.mutants_of(name, text, WholeSource))
