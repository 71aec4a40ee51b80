"""The module as a target: its mutants, and the tests that are built with one after the other."""

import re
import shutil
import subprocess
import threading
from dataclasses import dataclass, field, replace

import mutants
import steps
from steps import (ROOT, SURVIVES, TIME_OUT, WORK, Killed, command, digest, first_error, precompile,
                   run_test)

FILES = ["Includes/taldata_array_element_types.h", "Includes/talnumericarray.h",
         "Includes/taltensor.h", "TalNumericArray/*.cpp", "TalNumericArray/*.h",
         "compilerruntime/src/scalar_op/utils/*.h", "compilerruntime/src/types/*.h"]
FOLDERS = ["TalNumericArray", "Includes", "SystemConfiguration/Exports",
           "compilerruntime/src/scalar_op/utils", "compilerruntime/src/types"]
MODULE = "TalNumericArray/talnumericarray_compare.cpp"
TABLE = "TalNumericArray/talnumericarray.cpp"

SUPPORT = [f"tests/support/{name}.cpp"
           for name in ("checked_calls", "golden_calls", "oracle", "random_arrays")]
RANDOM_CALLS = 100000

# What the module is built with.
ONE_SET = "TALNUMERICARRAY_INSTRUCTION_SETS=avx2"
BASELINE = "TALNUMERICARRAY_INSTRUCTION_SETS=baseline"
ALL_SETS = "ALL_SETS"


@dataclass(frozen=True)
class Program:
    """A test program: its sources that see the mutant, and those that see only the contract."""

    name: str
    mutated: tuple = ()
    fixed: tuple = ()
    level: str = "-O0"  # of the sources that see the mutant
    link: tuple = ()
    run: tuple = field(default=(), repr=False)
    module_level: str = "-O0"
    sets: str = field(default="", repr=False)  # of the module, if not those for the mutant's file

    @property
    def sources(self):
        return *self.mutated, *self.fixed

    def flags(self, source, sets):
        level = self.level if source in self.mutated else "-O1"
        return *level.split(), f"-D{sets}"


def own(name, *fixed, **settings):
    """The program of a test that instantiates the module's templates itself."""
    return Program(name, (f"tests/{name}.cpp",), fixed, **settings)


ARRAYS = Program("whole arrays", (),
                 (*(f"tests/{name}.cpp" for name in
                    ("golden_calls_test", "random_calls_test", "threads_test",
                     "worked_examples_test")), *SUPPORT))
# Without vectors, as with the option to optimise for size.
SMALL = replace(ARRAYS, name="whole arrays without vectors", module_level="-Os", sets=ALL_SETS)
SCALARS = tuple(map(own, ("tolerant_comparison_test", "scalar_comparison_test",
                          "tolerance_shift_factor_test", "conversion_by_halves_test")))
PARTS = (
    own("array_record_test", level="-O0 -fsanitize=undefined -fno-sanitize-recover=undefined",
        link=("-fsanitize=undefined",)),
    own("entry_points_test"),
    own("element_pairs_test"),
    own("power_calls_test", link=("-Wl,--wrap=pow,--wrap=powf",)),
    own("subnormal_singles_test"),
)
SIGNALS = Program("signals_test", (), ("tests/signals_test.cpp", *SUPPORT), link=("-Wl,-z,now",))
READING = Program("reading_test", (), ("tests/reading_test.cpp",), module_level="-O1")
# Sources that take larger steps without optimisation are built as those that see the mutant are.
CERTAINTY = Program("certainty_test",
                    tuple(f"tests/{name}.cpp" for name in
                          ("certainty/certain_divisor", "certainty/certainty",
                           "certainty/drawn_pairs", "certainty/planted_pairs", "support/loops")),
                    (*(f"tests/certainty/{name}.cpp"
                       for name in ("instruction_sets", "reading_without_vectors")), *SUPPORT))
# With all sets, and so without the longest of the tests, which says no more of them than of one.
CERTAINTY_OF_SETS = replace(CERTAINTY,
                            run=("--gtest_filter=-Loops.AnswerAndRememberAsTheElementLoop",))

# With plain code for the instructions, which is slow without optimisation.
CERTAINTY_OF_AVX512 = replace(CERTAINTY, name="certainty_of_avx512_test",
                              level="-O1 -Wno-psabi -DTALNUMERICARRAY_EMULATED"
                                    " -DAVX512_IN_PLAIN_CODE")

# What the release build makes of the module apart from the test programs, and the tests of that.
CHECKED_TARGETS = ["talnumericarray_compare", "small_runtime", "runtime_by_linking",
                   "runtime_by_dlopen", "talcmp", "compare_arrays"]
CHECKED_TESTS = r"^built\.(archive|shared_object)$|^examples\."


# ---- The mutants to try

BOUNDS = {"<": "<=", "<=": "<", ">": ">=", ">=": ">"}


def rank(mutant):
    """Bounds before other operators and numbers, names last; equals in the order of their
    hashes."""
    before, _, after = mutant.name[mutant.name.rindex("[") + 1 : -1].partition(" -> ")
    by_name = before[0].isalpha() and before not in ("true", "false")
    return by_name, BOUNDS.get(before, "") != after.split(" (")[0], mutant.chance


def chosen(found):
    """One mutant of each line, and all that change the order of two statements."""
    for line in mutants.by_line(found):
        best = min((mutant for mutant in line if not mutant.change.swaps), key=rank, default=None)
        yield from (mutant for mutant in line if mutant is best or mutant.change.swaps)


# ---- A copy of the module, and what is built from it

def sets_for(path):
    """The sets that the module is built with for mutants of a file. All have the same loops, so
    one will do, except where sets are defined and chosen."""
    if path is None or any(name in path for name in ("instruction_sets", "sameq_walk", "avx512")):
        return ALL_SETS
    return BASELINE if "sse2" in path else ONE_SET


class Tree(steps.Tree):
    """A copy of the module in which one file at a time is changed."""

    folders = includes = FOLDERS

    def sees(self, source):
        """Always: sources that see no mutant are compiled only in the copy without one."""
        return True

    def _options(self, source, flags):
        if source.startswith("tests/"):
            return ["-include", str(WORK / "gtest.h"), f"-I{ROOT}/tests",
                    f"-DDEFAULT_RANDOM_CALLS={RANDOM_CALLS}",
                    f'-DGOLDEN_CALLS="{ROOT}/tests/golden_calls.txt"']
        header = ["-include", str(WORK / "standard.h")] if "-O0" in flags else []
        return [*header, "-fno-exceptions"]


STANDARD_HEADERS = ["algorithm", "cfloat", "cmath", "complex", "cstddef", "cstdint", "cstring",
                    "limits", "type_traits"]


class Bench(steps.Bench):
    """What all copies of the module share, with the objects that see no mutant."""

    def __init__(self, memory):
        precompile("standard.h", STANDARD_HEADERS, ["-O0", "-fno-exceptions"])
        super().__init__(memory, Tree(WORK / "original"))
        self.compiled = self.tree.lines_compiled(MODULE) | self.tree.lines_compiled(TABLE)
        self.suite = None
        self.suite_lock = threading.Lock()

    def tree_of(self, folder):
        return Tree(folder, self.tree)

    def is_compiled(self, mutant):
        return (mutant.path, mutant.line) in self.compiled

    def needs(self, program, source):
        return self.tree.needs(source, *program.flags(source, ALL_SETS))

    def run(self, program, tree, seconds):
        """Builds and runs the program with the tree's module; raises Killed where a test fails."""
        sets = sets_for(tree.changed)
        objects = [tree.object(source, *program.flags(source, sets)) for source in program.mutated]
        objects += [tree.object(MODULE, program.module_level, f"-D{program.sets or sets}"),
                    tree.object(TABLE, "-O0", f"-D{sets}")]
        objects += [self.tree.object(source, *program.flags(source, ALL_SETS))
                    for source in program.fixed]
        target = tree.folder / "program"
        steps.link(target, *objects, *program.link, "-lgtest", "-lgtest_main")
        run_test([str(target), *program.run], seconds, cwd=tree.folder)

    def steps(self, mutant, tree):
        """Name, sources and action of each step, those that take long last."""
        def step(program):
            return (program.name, self.sources(program),
                    lambda: self.run(program, tree, self.limit(program)))

        def steps_of(parts):
            return (step(part) for part in parts
                    if mutant.path in (MODULE, TABLE)
                    or any(mutant.path in self.needs(part, source) for source in part.mutated))

        if "avx512" in mutant.path:
            yield step(CERTAINTY_OF_AVX512)
            yield "same code", "", lambda: self._same_code(tree)
            return
        yield from steps_of(SCALARS)
        yield step(ARRAYS)
        of_sets = "instruction_sets" in mutant.path
        if "TalNumericArray" in mutant.path and not of_sets:
            yield from steps_of([CERTAINTY])
        if "TalNumericArray" in mutant.path:
            yield step(SMALL)
        yield "same code", "", lambda: self._same_code(tree)
        yield from steps_of(PARTS)
        if mutant.path.endswith(("/compare.h", "/factor_cache.h")):
            yield step(SIGNALS)
        yield step(READING)
        if of_sets:
            yield step(CERTAINTY_OF_SETS)
        if mutant.change.text == "":
            # An attribute, say, which only the built files show.
            yield "release build", checked_sources(), lambda: self._release(mutant, tree)

    def _same_code(self, tree):
        """No test of what is compiled can distinguish them."""
        flags = "-O1", f"-D{sets_for(tree.changed)}"
        same = all(tree.object(source, *flags).read_bytes()
                   == self.tree.object(source, *flags).read_bytes()
                   for source in (MODULE, TABLE))
        return (SURVIVES, "same machine code") if same else None

    def _release(self, mutant, tree):
        with self.suite_lock:
            self.suite = self.suite or Suite()
            self.suite.run_with(mutant.path, mutant.applied(tree.texts[mutant.path]))


# ---- The release build's own checks

def checked_sources():
    paths = sorted((ROOT / "tests" / "checks").iterdir())
    return digest(CHECKED_TESTS, *(path.read_text(encoding="utf-8") for path in paths))


class Suite:
    """A copy of the project in which the module is built as a release, for one mutant at a time."""

    def __init__(self):
        self.folder = WORK / "suite"
        files = subprocess.run(["git", "ls-files", "--cached", "--others", "--exclude-standard"],
                               cwd=ROOT, check=True, text=True, stdout=subprocess.PIPE).stdout
        for name in files.splitlines():
            if not (ROOT / name).exists():
                continue
            target = self.folder / name
            target.parent.mkdir(parents=True, exist_ok=True)
            if not target.exists() or target.read_bytes() != (ROOT / name).read_bytes():
                shutil.copy(ROOT / name, target)
        status, text = command(["cmake", "--preset", "release"], cwd=self.folder)
        if status != 0:
            raise RuntimeError(text)
        try:
            self.run()
        except Killed as failure:
            raise RuntimeError(f"the release build fails without a mutant: {failure}") from None

    def run_with(self, path, text):
        target = self.folder / path
        unharmed = target.read_text(encoding="utf-8")
        target.write_text(text, encoding="utf-8")
        try:
            self.run()
        finally:
            target.write_text(unharmed, encoding="utf-8")

    def run(self):
        status, text = command(["cmake", "--build", "--preset", "release", "--target",
                                *CHECKED_TARGETS, "--", "-j1"], cwd=self.folder)
        if status != 0:
            raise Killed("warning: " + first_error(text))
        status, text = command(["ctest", "--preset", "release", "-j1", "--stop-on-failure",
                                "--tests-regex", CHECKED_TESTS], cwd=self.folder)
        if status != 0:
            failed = re.search(r"^\s*\d+ - (\S+)", text, flags=re.MULTILINE)
            raise Killed(failed.group(1) if failed else "ctest")


# ---- The target

GROUPS = {**{part.name: "parts" for part in (*SCALARS, *PARTS, SIGNALS)}, ARRAYS.name: "arrays",
          SMALL.name: "arrays", READING.name: "reading", CERTAINTY.name: "certainty",
          CERTAINTY_OF_AVX512.name: "certainty", "release build": "release"}


class Module:
    mark = "mutants"  # of the table in the document
    columns = {"arrays": "whole arrays", "parts": "tests of parts", "reading": "`reading_test`",
               "certainty": "`certainty_test`s", "release": "release build", TIME_OUT: "time-out",
               SURVIVES: "equivalent"}
    row_title = "file"
    bench = Bench

    @staticmethod
    def row(path):
        return path.rpartition("/")[2]

    @staticmethod
    def group(step):
        return GROUPS[step]

    @staticmethod
    def mutants():
        for path in sorted(path for pattern in FILES for path in ROOT.glob(pattern)):
            name = str(path.relative_to(ROOT))
            yield from chosen(mutants.mutants_of(name, path.read_text(encoding="utf-8")))
