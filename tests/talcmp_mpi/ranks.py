"""talcmp-mpi beside talcmp, and what the tests of its ranks share. They are started as

    SOMETHING_test.py TALCMP TALCMP_MPI [-- unittest options]

Every process that a test starts has a mark in its environment, by which the processes are found
that it should not have left.
"""

import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile
import time
import uuid

import numpy as np

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "talcmp"))

from support.talcmp_command import COMMAND, Folder, read_bytes, run_tests, summary

if shutil.which("mpirun") is None:
    print("NOT TESTED: talcmp-mpi, as this machine lacks mpirun", file=sys.stderr)
    sys.exit(77)  # which CTest reports as skipped

MARK = "TALCMP_TEST_MARK"
# Open MPI asks root for the first two. Without the third, mpirun waits for one or two seconds after
# each status that is not 0. Open MPI does not release all of its memory, which AddressSanitizer would
# complain of.
SETTINGS = {"OMPI_ALLOW_RUN_AS_ROOT": "1", "OMPI_ALLOW_RUN_AS_ROOT_CONFIRM": "1",
            "OMPI_MCA_odls_base_sigkill_timeout": "0", "ASAN_OPTIONS": "detect_leaks=0"}
LIMIT = 60  # seconds, many times what any run takes


def talcmp():
    return COMMAND[0]


def talcmp_mpi():
    return COMMAND[1]


def mpirun(ranks, *words):
    """The command that runs a program, or several with colons between them."""
    return ["mpirun", "-q", "--oversubscribe", "-n", str(ranks), *map(str, words)]


def run_alone(*arguments, **options):
    """What talcmp answers: its exit status, its standard output, and its standard error."""
    done = subprocess.run([talcmp(), *map(str, arguments)], capture_output=True, check=False,
                          timeout=LIMIT, stdin=subprocess.DEVNULL, **options)
    return done.returncode, done.stdout, done.stderr


def run_ranks(ranks, *arguments, **options):
    """What talcmp-mpi answers, likewise."""
    return MarkedRun(mpirun(ranks, talcmp_mpi(), *arguments), **options).finish()


def write_zeros(path, size):
    """A file of so many bytes, which take no room, and their header."""
    with open(path, "wb") as file:
        np.lib.format.write_array_header_1_0(
            file, {"descr": "<f8", "fortran_order": False, "shape": (size // 8,)})
        file.truncate(file.tell() + size)
    return str(path)


def read_process(process, name):
    """A file of /proc; nothing if the process has ended, or is another user's."""
    try:
        return pathlib.Path(f"/proc/{process}/{name}").read_bytes()
    except OSError:
        return b""


def variables_of(process):
    return dict(entry.split(b"=", 1) for entry in read_process(process, "environ").split(b"\0")
                if b"=" in entry)


def parent_of(process):
    """None if the process has ended. The name before it, in parentheses, may hold anything."""
    fields = read_process(process, "stat").rpartition(b")")[2].split()
    return int(fields[1]) if fields else None


def kill(process, number):
    try:
        os.kill(process, number)
    except ProcessLookupError:
        pass


class MarkedRun:
    """A command that runs, whose output goes to files: no process that it leaves can delay their
    end."""

    def __init__(self, words, variables=(), **options):
        self.mark = uuid.uuid4().hex
        self.output, self.errors = tempfile.TemporaryFile(), tempfile.TemporaryFile()
        environment = {**os.environ, **SETTINGS, **dict(variables), MARK: self.mark}
        self.process = subprocess.Popen(
            list(map(str, words)), stdin=subprocess.DEVNULL, stdout=self.output,
            stderr=self.errors, env=environment, start_new_session=True, **options)

    def processes(self):
        ours = (int(name) for name in os.listdir("/proc") if name.isdigit())
        return [process for process in ours
                if variables_of(process).get(MARK.encode()) == self.mark.encode()]

    def ranks(self):
        """The processes that compare, by rank; that which watches each is its parent."""
        compare = [process for process in self.processes()
                   if read_process(process, "comm") == b"talcmp-mpi\n"]
        return {int(variables_of(process).get(b"OMPI_COMM_WORLD_RANK", b"-1")): process
                for process in compare if parent_of(process) in compare}

    def wait_for(self, found, seconds=30):
        """Waits until the function returns something, and returns that."""
        end = time.monotonic() + seconds
        while not (result := found()):
            if time.monotonic() > end or self.process.poll() is not None:
                self.kill_all()
                raise AssertionError(f"it did not happen: {self.texts()}")
            time.sleep(0.005)
        return result

    def texts(self):
        """What is on standard output and on standard error so far."""
        texts = []
        for file in (self.output, self.errors):
            file.seek(0)
            texts.append(file.read())
        # mpirun's own, now and then, about a rank that ended early.
        return texts[0], re.sub(rb"^\[warn\] Epoll [^\n]*\n", b"", texts[1], flags=re.MULTILINE)

    def kill_all(self):
        """Those, too, that are started meanwhile."""
        while processes := self.processes():
            for process in processes:
                kill(process, 9)
        self.process.wait()

    def finish(self, seconds=LIMIT):
        """The exit status and both texts, when all its processes have ended."""
        try:
            self.process.wait(seconds)
        except subprocess.TimeoutExpired:
            self.kill_all()
            raise AssertionError(f"it ran for more than {seconds} s: {self.texts()}") from None
        end = time.monotonic() + 5
        while (left := self.processes()) and time.monotonic() < end:
            time.sleep(0.02)
        names = [read_process(process, "cmdline") for process in left]
        self.kill_all()
        if left:
            raise AssertionError(f"it left {names} running: {self.texts()}")
        texts = self.texts()
        self.output.close()
        self.errors.close()
        return (self.process.returncode, *texts)
