"""Builds the tests against one copy of the module after the other, and tells which of them fail."""

import functools
import hashlib
import os
import re
import resource
import shutil
import subprocess
import threading
from dataclasses import dataclass, field, replace
from pathlib import Path

ROOT = Path(__file__).resolve().parents[2]
WORK = ROOT / "build" / "mutation"

FOLDERS = ["TalNumericArray", "Includes", "SystemConfiguration/Exports",
           "compilerruntime/src/scalar_op/utils", "compilerruntime/src/types"]
MODULE = "TalNumericArray/talnumericarray_compare.cpp"
TABLE = "TalNumericArray/talnumericarray.cpp"

FLAGS = ["-std=c++17", "-w", "-ffp-contract=off"]
SUPPORT = [f"tests/support/{name}.cpp"
           for name in ("checked_calls", "golden_calls", "oracle", "random_arrays")]
RANDOM_CALLS = 100000


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


def own(name, *fixed, **settings):
    """The program of a test that instantiates the module's templates itself."""
    return Program(name, (f"tests/{name}.cpp",), fixed, **settings)


ARRAYS = Program("whole arrays", (),
                 (*(f"tests/{name}.cpp" for name in
                    ("complex_pairs_test", "golden_calls_test", "random_calls_test",
                     "threads_test")), *SUPPORT))
# Without blocks, as with the option to optimise for size.
SMALL = replace(ARRAYS, name="whole arrays, built for size", module_level="-Os")
SCALARS = tuple(map(own, ("tolerant_comparison_test", "scalar_comparison_test",
                          "tolerance_shift_factor_test")))
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
BLOCKS = own("blocks_test", *SUPPORT)
# Of all sets, and so without the longest of the tests, which says no more of them than of one.
BLOCKS_OF_SETS = own("blocks_test", *SUPPORT,
                     run=("--gtest_filter=-BlockLoops.AnswerAndRememberAsTheElementLoop",))

# All sets have the same loops, so that one will do but where sets are chosen.
ONE_SET = "TALNUMERICARRAY_INSTRUCTION_SETS=avx2"
ALL_SETS = "ALL_SETS"

# What the release build makes of the module beside the test programs, and the tests of that.
CHECKED_TARGETS = ["talnumericarray_compare", "small_runtime", "runtime_by_linking",
                   "runtime_by_dlopen", "talcmp", "compare_arrays"]
CHECKED_TESTS = r"^built\.(archive|shared_object)$|^examples\."


class Broken(Exception):
    """A copy of the module that does not compile."""


class Killed(Exception):
    """The name of the test that fails, or what else ends the program."""


# ---- Commands

def limited(seconds):
    def limit():
        resource.setrlimit(resource.RLIMIT_CPU, (seconds, seconds + 1))
        resource.setrlimit(resource.RLIMIT_CORE, (0, 0))
    return limit


def command(words, seconds=300, **options):
    """The status and what is printed."""
    with subprocess.Popen(words, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True,
                          errors="replace", preexec_fn=limited(seconds), **options) as process:
        try:
            text, _ = process.communicate(timeout=20 * seconds)
        except subprocess.TimeoutExpired:
            process.kill()
            text, _ = process.communicate()
    return process.returncode, text


def digest(*parts):
    return hashlib.sha256("\0".join(parts).encode()).hexdigest()


# ---- A copy of the module, and what is built from it

class Tree:
    """A copy of the module's folders in which one file at a time is another."""

    def __init__(self, folder):
        self.folder = folder
        self.texts = {}
        for name in FOLDERS:
            shutil.rmtree(folder / name, ignore_errors=True)
            shutil.copytree(ROOT / name, folder / name)
            for path in sorted((folder / name).iterdir()):
                self.texts[str(path.relative_to(folder))] = path.read_text(encoding="utf-8")
        self.objects = {}
        self.sets = ALL_SETS

    def put(self, path, text):
        (self.folder / path).write_text(text, encoding="utf-8")
        self.objects = {}
        self.sets = ALL_SETS if "instruction_sets" in path else ONE_SET

    def restore(self, path):
        self.put(path, self.texts[path])

    def object(self, source, level):
        """The file that `source` is compiled to, once."""
        key = source, level, self.sets
        if key not in self.objects:
            target = self.folder / f"{digest(*key)[:16]}.o"
            self._compile(source, [*level.split(), f"-D{self.sets}"], target)
            self.objects[key] = target
        return self.objects[key]

    def _compile(self, source, flags, target):
        compile_source(self.folder, source, flags, target)


class UnharmedTree(Tree):
    """The module as it is. What was built from the same texts by an earlier run is taken again."""

    def __init__(self, folder):
        super().__init__(folder)
        self.lock = threading.RLock()

    def object(self, source, level, sets=ALL_SETS):
        with self.lock:
            self.sets = sets
            return super().object(source, level)

    def _compile(self, source, flags, target):
        stamp = Path(f"{target}.stamp")
        texts = digest(*flags, *self.texts.values(), test_texts((source,)))
        if not (target.exists() and stamp.exists() and stamp.read_text() == texts):
            stamp.unlink(missing_ok=True)
            super()._compile(source, flags, target)
            stamp.write_text(texts)


@functools.lru_cache(maxsize=None)
def test_texts(sources):
    """The sources and what they include of the tests, as one number."""
    _, text = command(["g++", *FLAGS, *(f"-I{name}" for name in (*FOLDERS, "tests")), "-MM",
                       *sources], cwd=ROOT)
    names = {name for name in text.split() if name.startswith("tests/")}
    return digest(*((ROOT / name).read_text(encoding="utf-8") for name in sorted(names)))


def compile_source(folder, source, flags, target):
    words = ["g++", *FLAGS, *flags, *(f"-I{name}" for name in FOLDERS)]
    if source.startswith("tests/"):
        words += ["-include", str(WORK / "gtest.h"), f"-I{ROOT}/tests",
                  f"-DDEFAULT_RANDOM_CALLS={RANDOM_CALLS}",
                  f'-DGOLDEN_CALLS="{ROOT}/tests/golden_calls.txt"', "-c", str(ROOT / source)]
    else:
        words += ["-include", str(WORK / "standard.h")] if "-O0" in flags else []
        words += ["-fno-exceptions", "-c", source]
    status, text = command([*words, "-o", str(target)], cwd=folder)
    if status != 0:
        raise Broken(first_error(text))


def first_error(text):
    found = re.search(r"error: (.*)", text)
    return found.group(1) if found else text.strip()[-200:]


STANDARD_HEADERS = ["algorithm", "cfloat", "cmath", "complex", "cstddef", "cstdint", "cstring",
                    "limits", "type_traits"]


def precompile(name, headers, *flags_of_variants):
    """Makes a header of these, which takes the compiler a good part of its time, once for all."""
    text = "".join(f"#include <{header}>\n" for header in headers)
    header, folder = WORK / name, WORK / f"{name}.gch"
    if folder.exists() and header.read_text(encoding="utf-8") == text:
        return
    header.write_text(text, encoding="utf-8")
    folder.mkdir(exist_ok=True)
    for flags in flags_of_variants:
        command(["g++", *FLAGS, *flags, "-x", "c++-header", name, "-o",
                 str(folder / flags[0][1:])], cwd=WORK)


class Bench:
    """What all copies share: the objects that see no mutant, the time of each program unharmed."""

    def __init__(self, memory):
        precompile("gtest.h", ["gtest/gtest.h"], ["-O0"], ["-O1"])
        precompile("standard.h", STANDARD_HEADERS, ["-O0", "-fno-exceptions"])
        self.memory = memory
        self.tree = UnharmedTree(WORK / "original")
        self.lock = threading.Lock()

    def limit(self, program):
        """The seconds that the program may take, by what it takes with the module as it is."""
        def seconds():
            before = resource.getrusage(resource.RUSAGE_CHILDREN).ru_utime
            try:
                self.run(program, self.tree, 300)
            except (Broken, Killed) as failure:
                raise RuntimeError(f"{program.name} fails without a mutant: {failure}") from None
            return resource.getrusage(resource.RUSAGE_CHILDREN).ru_utime - before
        key = digest("unharmed", *self.tree.texts.values(), self.sources(program))
        with self.lock:
            return int(10 + 3 * self.memory.ask(key, seconds))

    def sources(self, program):
        """What the finding depends on besides the module."""
        return digest(repr(program), test_texts((*program.mutated, *program.fixed)))

    def run(self, program, tree, seconds):
        """Builds and runs the program with the tree's module; raises Killed where a test fails."""
        objects = [tree.object(source, program.level) for source in program.mutated]
        objects += [tree.object(MODULE, program.module_level), tree.object(TABLE, "-O0")]
        objects += [self.tree.object(source, "-O1") for source in program.fixed]
        target = tree.folder / "program"
        status, text = command(["g++", "-fuse-ld=gold", *map(str, objects), *program.link,
                                "-lgtest", "-lgtest_main", "-pthread", "-o", str(target)])
        if status != 0:
            raise Broken("does not link: " + first_error(text))
        environment = {**os.environ, "TALNUMERICARRAY_SEED": "1",
                       "GTEST_BREAK_ON_FAILURE": "1", "GTEST_FAIL_FAST": "1"}
        status, text = command([str(target), *program.run], seconds, env=environment,
                               cwd=tree.folder)
        if status in (-24, -9):
            raise Killed("time-out")
        if status != 0:
            raise Killed(failing_test(text))

    def same_code(self, tree):
        return (tree.object(MODULE, "-O1").read_bytes()
                == self.tree.object(MODULE, "-O1", tree.sets).read_bytes())

    def dependencies(self, sources):
        """The files of the module that the sources include, or are."""
        found = set()
        for source in sources:
            path = ROOT / source if source.startswith("tests/") else Path(source)
            words = ["g++", *FLAGS, *(f"-I{name}" for name in FOLDERS), f"-I{ROOT}/tests",
                     "-MM", str(path)]
            _, text = command(words, cwd=self.tree.folder)
            found.update(name for name in text.replace("\\\n", " ").split()
                         if name in self.tree.texts)
        return found

    def lines_compiled(self):
        """Pairs of a file and a line of it that the preprocessor leaves of the module here."""
        compiled = set()
        for source in (MODULE, TABLE):
            words = ["g++", *FLAGS, *(f"-I{name}" for name in FOLDERS), "-E", source]
            _, text = command(words, cwd=self.tree.folder)
            path, line = "", 0
            for row in text.split("\n"):
                mark = re.match(r'# (\d+) "([^"]*)"', row)
                if mark:
                    line, path = int(mark.group(1)), mark.group(2)
                    continue
                if row.strip():
                    compiled.add((path, line))
                line += 1
        return compiled


def failing_test(text):
    """The first that says so, else the one in which the program ended."""
    failed = re.search(r"^\[  FAILED  \] (\S+)", text, flags=re.MULTILINE)
    begun = re.findall(r"^\[ RUN      \] (\S+)", text, flags=re.MULTILINE)
    return failed.group(1) if failed else begun[-1] if begun else "before the first test"


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
