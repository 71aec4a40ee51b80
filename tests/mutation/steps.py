"""What the tests of every target are built and run with."""

import hashlib
import os
import re
import resource
import shutil
import signal
import subprocess
import tempfile
import threading
from pathlib import Path

ROOT = Path(__file__).resolve().parents[2]
WORK = ROOT / "build" / "mutation"
FLAGS = ["-std=c++17", "-w", "-ffp-contract=off"]

KILLED, TIME_OUT, SURVIVES, BROKEN = "killed", "time-out", "survives", "does not compile"


class Broken(Exception):
    """A mutant that does not compile."""


class Killed(Exception):
    """The name of the test that fails, or what else ends the program."""


# ---- Commands

def limited(seconds):
    def limit():
        resource.setrlimit(resource.RLIMIT_CPU, (seconds, seconds + 1))
        resource.setrlimit(resource.RLIMIT_CORE, (0, 0))
    return limit


def command(words, seconds=300, patience=20, **options):
    """The status and what is printed. `patience` is how much longer it may wait than compute."""
    with subprocess.Popen(words, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True,
                          errors="replace", preexec_fn=limited(seconds), start_new_session=True,
                          **options) as process:
        try:
            text, _ = process.communicate(timeout=patience * seconds)
        except subprocess.TimeoutExpired:
            os.killpg(process.pid, signal.SIGKILL)
            text, _ = process.communicate()
    return process.returncode, text


def run_test(words, seconds, patience=20, **variables):
    """Raises Killed where a test fails. `variables` are the folder and other arguments of Popen."""
    environment = {**os.environ, "TALNUMERICARRAY_SEED": "1", "GTEST_BREAK_ON_FAILURE": "1",
                   "GTEST_FAIL_FAST": "1", **variables.pop("env", {})}
    status, text = command(words, seconds, patience, env=environment, **variables)
    if status in (-signal.SIGXCPU, -signal.SIGKILL):
        raise Killed(TIME_OUT)
    if status != 0:
        raise Killed(failing_test(text))


def failing_test(text):
    """The first test that is said to fail, else the one in which the program ended."""
    failed = (re.search(r"^\[  FAILED  \] (\S+)", text, flags=re.MULTILINE)
              or re.search(r"^(?:FAIL|ERROR): (\S+)", text, flags=re.MULTILINE))
    begun = re.findall(r"^\[ RUN      \] (\S+)", text, flags=re.MULTILINE)
    return failed.group(1) if failed else begun[-1] if begun else "before the first test"


def first_error(text):
    found = re.search(r"error: (.*)", text)
    return found.group(1) if found else text.strip()[-200:]


def digest(*parts):
    return hashlib.sha256("\0".join(parts).encode()).hexdigest()


# ---- Copies, and what they are built with

class Tree:
    """A copy of some of the project's folders in which one file at a time is changed. Sources that
    do not see the change share the objects of the copy without a mutant."""

    folders, includes = (), ()

    def __init__(self, folder, original=None):
        self.folder = folder
        self.original = original or self
        self.texts = {}
        for name in self.folders:
            shutil.rmtree(folder / name, ignore_errors=True)
            shutil.copytree(ROOT / name, folder / name)
            for path in sorted((folder / name).rglob("*.*")):
                self.texts[str(path.relative_to(folder))] = path.read_text(encoding="utf-8")
        self.changed = None
        self.objects = {}
        self.lock = threading.RLock()

    def put(self, path, text):
        (self.folder / path).write_text(text, encoding="utf-8")
        self.changed = path
        self.objects = {}

    def restore(self, path):
        self.put(path, self.texts[path])
        self.changed = None

    def sees(self, source):
        """Whether `source` is, or includes, the file that is changed here."""
        return self.changed is not None and self.changed in self.original.needs(source)

    def object(self, source, *flags):
        """The file that `source` is compiled to."""
        if self is not self.original and not self.sees(source):
            return self.original.object(source, *flags)
        with self.lock:
            key = source, *flags
            if key not in self.objects:
                self.objects[key] = self._compiled(source, flags)
            return self.objects[key]

    def needs(self, source, *flags):
        """The files of the copy and of the tests that `source` is compiled from."""
        target = self.object(source, *flags)
        return {name.removeprefix(f"{ROOT}/") for name in self._files_of(target)}

    def lines_compiled(self, source):
        """Pairs of a file and a line of it that the preprocessor leaves."""
        _, text = command([*self._compiler(), "-E", source], cwd=self.folder)
        lines, path, line = set(), "", 0
        for row in text.split("\n"):
            mark = re.match(r'# (\d+) "([^"]*)"', row)
            if mark:
                line, path = int(mark.group(1)), mark.group(2)
                continue
            if row.strip():
                lines.add((path, line))
            line += 1
        return lines

    def _compiler(self):
        return ["g++", *FLAGS, *(f"-I{name}" for name in self.includes)]

    def _options(self, source, flags):
        """What the target's sources, or those of the tests, are also compiled with."""
        raise NotImplementedError

    def _compiled(self, source, flags):
        """Compiles it, unless an earlier run did so from the same texts."""
        target = self.folder / f"{digest(source, *flags)[:16]}.o"
        stamp = target.with_suffix(".stamp")
        path = str(ROOT / source) if source.startswith("tests/") else source
        words = [*self._compiler(), *flags, *self._options(source, flags), "-c", path]
        if target.exists() and stamp.exists() and stamp.read_text() == self._stamp(target, words):
            return target
        stamp.unlink(missing_ok=True)
        status, text = command([*words, "-MMD", "-o", str(target)], cwd=self.folder)
        if status != 0:
            raise Broken(first_error(text))
        stamp.write_text(self._stamp(target, words))
        return target

    def _stamp(self, target, words):
        paths = [self.folder / name for name in self._files_of(target)]
        texts = (path.read_text(encoding="utf-8") for path in paths if path.exists())
        return digest(*words, *texts)

    @staticmethod
    def _files_of(target):
        """What it was compiled from, without the headers of the system."""
        names = target.with_suffix(".d").read_text(encoding="utf-8").replace("\\\n", " ").split()
        return [name for name in names[1:] if not name.startswith(("/usr", str(WORK)))]


def temporary_folder(folder):
    """A folder for what a test leaves when it is ended."""
    return tempfile.TemporaryDirectory(dir=folder, prefix="run")


def link(target, *words):
    status, text = command(["g++", "-fuse-ld=gold", *map(str, words), "-pthread", "-o",
                            str(target)])
    if status != 0:
        raise Broken("does not link: " + first_error(text))


def precompile(name, headers, *flags_of_variants):
    """Precompiles these headers, which take the compiler a good part of its time, once for all."""
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
    """What all copies of a target share; `tree` is the copy without a mutant."""

    spare = 10  # seconds that a program may take beyond three times its usual time

    def __init__(self, memory, tree):
        precompile("gtest.h", ["gtest/gtest.h"], ["-O0"], ["-O1"])
        self.memory = memory
        self.tree = tree
        self.lock = threading.RLock()

    def sources(self, program):
        """What a program's finding depends on apart from the target."""
        names = {name for source in program.sources for name in self.needs(program, source)}
        return digest(repr(program), *((ROOT / name).read_text(encoding="utf-8")
                                       for name in sorted(names) if name.startswith("tests/")))

    def limit(self, program):
        """The seconds that the program may take, by what it takes without a mutant."""
        def seconds():
            before = resource.getrusage(resource.RUSAGE_CHILDREN).ru_utime
            try:
                self.run(program, self.tree, 300)
            except (Broken, Killed) as failure:
                raise RuntimeError(f"{program.name} fails without a mutant: {failure}") from None
            return resource.getrusage(resource.RUSAGE_CHILDREN).ru_utime - before
        key = digest("unharmed", *self.tree.texts.values(), self.sources(program))
        with self.lock:
            return int(self.spare + 3 * self.memory.ask(key, seconds))
