#!/usr/bin/env python3
"""Ranks that see other files, that are killed, and that MPI does not start: one line says so, the
status is 2, and nothing goes on running."""

import os
import re
import signal
import socket

import numpy as np

from ranks import (Folder, MarkedRun, kill, mpirun, parent_of, read_process, run_tests, summary,
                   talcmp_mpi, write_zeros)

HOST = socket.gethostname()
SOON = 20  # seconds; far less than the comparisons take that are interrupted
MIB = 2**20
GIB = 2**30


class RanksElsewhere(Folder):
    """The last rank compares files of the same names in another folder."""

    def setUp(self):
        super().setUp()
        self.here, self.elsewhere = self.make_folder("here"), self.make_folder("elsewhere")

    def save_both(self, name, values):
        for folder in "here", "elsewhere":
            self.save(f"{folder}/{name}", values)

    def compare(self, *operands, first_ranks=1, prefix=()):
        there = ["sh", "-c", 'cd "$1" && shift && exec "$@"', "sh", self.elsewhere, *prefix]
        words = mpirun(first_ranks, talcmp_mpi(), *operands, ":", "-n", 1, *there, talcmp_mpi(),
                       *operands)
        status, output, errors = MarkedRun(words, cwd=self.here).finish(SOON)
        return status, output.decode(), errors.decode()

    def expect_line(self, line, *operands, output="", **options):
        self.assertEqual(self.compare(*operands, **options), (2, output, f"talcmp: {line}\n"))


class SharedArrays(RanksElsewhere):
    """Of two arrays that all ranks share."""

    def setUp(self):
        super().setUp()
        self.values = np.zeros(5 * MIB)
        self.save_both("a.npy", self.values)
        self.save_both("b.npy", self.values)
        self.there = os.path.join(self.elsewhere, "b.npy")

    def check(self, line, **options):
        for first_ranks in 1, 3:
            self.expect_line(line.replace("RANK", f"rank {first_ranks} on {HOST}"), "a.npy",
                             "b.npy", first_ranks=first_ranks, **options)

    def check_another(self, last, first):
        self.check(f"b.npy: RANK sees another file ({last}) than the first rank ({first}); give "
                   "all ranks the same files")

    def test_are_there(self):
        self.assertEqual(self.compare("-v", "a.npy", "b.npy"),
                         (0, "a.npy b.npy are the same\n", ""))

    def test_missing(self):
        os.remove(self.there)
        self.check("b.npy: cannot be opened: No such file or directory (RANK)")

    def test_unreadable(self):
        os.chmod(self.there, 0)
        # Root, without the capabilities that override permissions.
        prefix = ["setpriv", "--bounding-set=-dac_override,-dac_read_search"]
        self.check("b.npy: cannot be opened: Permission denied (RANK)",
                   prefix=prefix if os.geteuid() == 0 else ())

    def test_of_another_size(self):
        self.save("elsewhere/b.npy", self.values[:-1])
        self.check_another("41943160 bytes", "41943168 bytes")

    def test_of_another_shape(self):
        self.save("elsewhere/b.npy", self.values.reshape(5, -1))
        self.check_another("float64 (5, 1048576), row-major", "float64 (5242880,), row-major")

    def test_of_another_type(self):
        self.save("elsewhere/b.npy", self.values.astype("i8"))
        self.check_another("int64 (5242880,), row-major", "float64 (5242880,), row-major")

    def test_that_is_no_array(self):
        self.write("elsewhere/b.npy", bytes(os.path.getsize(self.there)))
        self.check("b.npy: is not an .npy file: it does not begin with \\x93NUMPY (RANK)")

    def test_cut_short(self):
        os.truncate(self.there, 30 * MIB)
        self.check_another("31457280 bytes", "41943168 bytes")


class ManyPairs(RanksElsewhere):
    """In folders; each pair is compared by one rank."""

    NAMES = [f"{i:02}.npy" for i in range(100)]

    def setUp(self):
        super().setUp()
        for name in self.NAMES:
            self.save_both(f"one/{name}", np.zeros(99999))
            self.save_both(f"two/{name}", np.zeros(99999))

    def check(self, change, line):
        """What the last ranks see is changed; where one of them compares, the line is printed."""
        for name in self.NAMES:
            change(f"{self.elsewhere}/two/{name}")
        status, output, errors = self.compare("-v", "one", "two")
        line = line.replace("RANK", f"rank 1 on {HOST}")
        lines = {name: f"talcmp: {line.replace('NAME', name)}\n" for name in self.NAMES}
        troubles = [name for name in self.NAMES if lines[name] in errors]
        self.assertEqual(errors, "".join(lines[name] for name in troubles))
        self.assertEqual(output, "".join(f"one/{name} two/{name} are the same\n"
                                         for name in self.NAMES if name not in troubles)
                         + summary(same=len(self.NAMES) - len(troubles), trouble=len(troubles)))
        self.assertEqual(status, 2)

    def test_missing(self):
        self.check(os.remove, "two/NAME: cannot be opened: No such file or directory (RANK)")

    def test_of_another_size(self):
        self.check(lambda path: np.save(path, np.zeros(99998)),
                   "two/NAME: has 800112 bytes, but 800120 for the first rank; give all ranks "
                   "the same files (RANK)")


class OtherWords(Folder):
    """Where ranks are started with other words, those of the first rank count."""

    def test_are_not_read(self):
        a, b = self.save("a.npy", np.arange(9)), self.save("b.npy", np.arange(9) + 1)
        first = [talcmp_mpi(), "-v", a, a]
        answer = (0, f"{a} {a} are the same\n".encode(), b"")
        for other in (["--nothing"], ["--help"], [], ["-q", "--tol=50", b, "-"]):
            words = mpirun(1, *first, ":", "-n", 2, talcmp_mpi(), *other)
            self.assertEqual(MarkedRun(words).finish(SOON), answer)


class KilledRanks(Folder):
    def setUp(self):
        super().setUp()
        self.a, self.b = (write_zeros(self.path(name), 400 * GIB) for name in ("a.npy", "b.npy"))

    def start(self, ranks, *options):
        return MarkedRun(mpirun(ranks, talcmp_mpi(), *options, self.a, self.b))

    def compared(self, run, rank):
        """The process of the rank, once it has read some of the arrays."""
        process = run.ranks().get(rank)
        counts = read_process(process, "io").split()
        return process if counts and int(counts[1]) > 64 * MIB else None

    def expect_line(self, run, *lines):
        status, output, errors = run.finish(SOON)
        self.assertEqual((status, output), (2, b""))
        self.assertIn(errors.decode(), lines)

    @staticmethod
    def killed(process, number=signal.SIGKILL, name="Killed"):
        return f"talcmp: {process} was killed (signal {number}, {name}); there is no answer\n"

    def check(self, ranks, rank, number, name):
        run = self.start(ranks)
        kill(run.wait_for(lambda: self.compared(run, rank)), number)
        self.expect_line(run, self.killed(f"rank {rank} on {HOST}", number, name))

    def test_while_they_compare(self):
        self.check(1, 0, signal.SIGKILL, "Killed")
        for rank in 0, 1, 2:
            self.check(3, rank, signal.SIGKILL, "Killed")
        self.check(3, 1, signal.SIGSEGV, "Segmentation fault")
        self.check(2, 0, signal.SIGBUS, "Bus error")

    def test_without_mpirun(self):
        run = MarkedRun([talcmp_mpi(), self.a, self.b])
        kill(run.wait_for(lambda: self.compared(run, -1)), signal.SIGKILL)
        self.expect_line(run, self.killed("the process"))

    def test_while_mpi_starts(self):
        """Without mpirun, which may wait for ever for a rank that is killed while it connects."""
        run = MarkedRun([talcmp_mpi(), self.a, self.b])
        kill(run.wait_for(lambda: run.ranks().get(-1)), signal.SIGKILL)
        self.expect_line(run, self.killed("the process"))

    def test_watching_processes(self):
        """Whoever kills one of these ends its rank, too."""
        for rank in 0, 1:
            run = self.start(2)
            kill(parent_of(run.wait_for(lambda: self.compared(run, rank))), signal.SIGKILL)
            self.assertEqual(run.finish(SOON), (128 + signal.SIGKILL, b"", b""))
        # Here mpirun is not there to end it.
        run = MarkedRun([talcmp_mpi(), self.a, self.b])
        run.wait_for(lambda: self.compared(run, -1))
        run.process.kill()
        self.assertEqual(run.finish(SOON), (-signal.SIGKILL, b"", b""))

    def test_by_the_launcher(self):
        """Its status is its own."""
        for number in signal.SIGINT, signal.SIGTERM:
            run = self.start(2)
            run.wait_for(lambda: self.compared(run, 1))
            kill(run.process.pid, number)
            self.assertEqual(run.finish(SOON), (1, b"", b""))


class BrokenMpi(Folder):
    def setUp(self):
        super().setUp()
        self.a = self.save("a.npy", np.arange(3))

    def expect_line(self, words, process, reason):
        """The reason is a pattern, as Open MPI does not always say the same."""
        status, output, errors = MarkedRun([*words, talcmp_mpi(), self.a, self.a]).finish(SOON)
        self.assertEqual((status, output), (2, b""))
        self.assertRegex(errors.decode(),
                         rf"\Atalcmp: MPI cannot be started \({process}\){reason}; is Open MPI "
                         r"installed completely\? mpirun says more without the option -q\n\Z")

    def check(self, setting, reason=""):
        for ranks in 1, 2, 5:
            self.expect_line(mpirun(ranks, "env", setting), f"rank 0 on {HOST}", reason)
        self.expect_line(["env", setting], "the process", "(: [^\n]+)?")

    def test_without_a_messaging_layer(self):
        self.check("OMPI_MCA_pml=nonexistent")

    def test_without_windows(self):
        self.check("OMPI_MCA_osc=nonexistent")

    def test_without_transports(self):
        self.check("OMPI_MCA_btl=nonexistent")

    def test_without_its_folder(self):
        self.check("OPAL_PREFIX=/nonexistent", "(: [^\n]+)?")


if __name__ == "__main__":
    run_tests()
