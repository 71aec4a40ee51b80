#!/usr/bin/env python3
"""Runs the recipes of examples/recipes as their users would."""

import json
import os
import pathlib
import re
import shlex
import shutil
import unittest

import numpy as np

try:
    import h5py
except ImportError:
    h5py = None

from support.talcmp_command import COMMAND, ROOT, Folder, read_bytes, run_program, run_tests

RECIPES = ROOT / "examples" / "recipes"


class Recipe(Folder):
    def setUp(self):
        super().setUp()
        self.programs = self.make_folder("programs")
        self.environment = {**os.environ, "HOME": self.folder,
                            "PATH": f"{self.programs}:{os.environ['PATH']}"}
        self.folder = self.make_folder("work")
        self.add_program("talcmp", f'exec {shlex.join(COMMAND)} "$@"')

    def add_program(self, name, script):
        os.chmod(self.write(f"{self.programs}/{name}", f"#!/bin/sh\n{script}\n".encode()), 0o755)

    def run_in_folder(self, *command):
        return run_program(*command, cwd=self.folder, env=self.environment)


class CTest(Recipe):
    def results(self, result):
        shutil.copy(RECIPES / "CMakeLists.txt", self.folder)
        self.save("expected.npy", np.arange(5.0))
        self.save("computed.npy", result)
        self.add_program("simulate", f'cp {self.folder}/computed.npy "$1"')
        status, output, errors = self.run_in_folder("cmake", "-B", "build")
        self.assertEqual(status, 0, output + errors)
        return self.run_in_folder("ctest", "--test-dir", "build", "--output-on-failure")

    def test_results_within_the_tolerance(self):
        self.assertEqual(self.results(np.arange(5.0) * (1 + 2.0**-45))[0], 0)

    def test_results_outside_the_tolerance(self):
        status, output, _ = self.results(np.arange(5.0) * (1 + 2.0**-35))
        self.assertNotEqual(status, 0)
        self.assertIn("(the same from --tol 18 on)", output)


@unittest.skipUnless(h5py, "NOT TESTED: h5py is not installed")
class CTestOfHdf5Files(Recipe):
    def write_hdf5(self, name, noise=0.0, scale=1.0):
        with h5py.File(self.path(name), "w") as file:
            file["/fields/pressure"] = np.linspace(0, 1, 1000) * scale + noise
            file["note"] = "text is listed, and no trouble"

    def results(self, **difference):
        shutil.copy(RECIPES / "hdf5_results" / "CMakeLists.txt", self.folder)
        for name in ("first.h5", "second.h5"):
            self.write_hdf5(f"expected/{name}")
            self.write_hdf5(f"computed/{name}", **(difference if name == "second.h5" else {}))
        self.add_program("simulate", f'mkdir -p "$1" && cp {self.folder}/computed/* "$1"')
        status, output, errors = self.run_in_folder("cmake", "-B", "build")
        self.assertEqual(status, 0, output + errors)
        return self.run_in_folder("ctest", "--test-dir", "build", "--output-on-failure")

    def test_results_within_the_errors(self):
        status, output, _ = self.results(noise=1e-13, scale=1 + 1e-10)
        self.assertEqual(status, 0, output)
        self.assertIn("100% tests passed, 0 tests failed out of 3", output)

    def test_results_outside_the_errors(self):
        status, output, _ = self.results(scale=1 + 1e-8)
        self.assertNotEqual(status, 0)
        self.assertIn("second.h5[/fields/pressure] differ: [1]: 0.001001001001001001 and "
                      "0.001001001011011011 (the same from --tol 27 on)", output)
        self.assertIn("0 the same, 1 different, 0 only in the first, 0 only in the second, 0 in "
                      "trouble, 1 skipped", output)
        self.assertIn("1 tests failed out of 3", output)


class ShellScript(Recipe):
    def compare(self, result):
        self.save("expected/run.npy", np.arange(5.0))
        self.save("results/run.npy", result)
        return self.run_in_folder(RECIPES / "check_results.sh")

    def test_as_expected(self):
        self.assertEqual(self.compare(np.arange(5.0)), (0, "all results are as expected\n", ""))

    def test_not_as_expected(self):
        status, output, _ = self.compare(np.arange(5.0) * (1 + 2.0**-35))
        self.assertEqual(status, 1)
        self.assertIn("smallest tolerance    --tol 18", output)

    def test_trouble(self):
        self.write("results/run.npy", b"broken")
        self.write("expected/run.npy", b"broken")
        status, _, errors = self.run_in_folder(RECIPES / "check_results.sh")
        self.assertEqual(status, 2)
        self.assertIn("could not be compared", errors)


class SlurmJob(Recipe):
    """The job, with stand-ins for srun, and here also for talcmp-mpi."""

    def setUp(self):
        super().setUp()
        self.add_program("talcmp-mpi", f'exec {shlex.join(COMMAND)} "$@"')
        self.start_by("exec")

    def start_by(self, launcher):
        """After it has taken the options that the job gives srun; it knows no others."""
        self.add_program("srun", "while :; do case $1 in\n"
                                 "--kill-on-bad-exit=0 | --wait=60 | --cpus-per-task=1) shift ;;\n"
                                 "*) break ;;\n"
                                 f'esac; done\n{launcher} "$@"')

    def run_job(self):
        return self.run_in_folder(RECIPES / "slurm_job.sh", "first", "second", "report.txt")

    def compare(self, result):
        self.save("first/run.npy", np.arange(5.0))
        self.save("second/run.npy", result)
        return self.run_job()

    def report(self):
        return read_bytes(self.path("report.txt")).decode()

    def test_the_same(self):
        self.assertEqual(self.compare(np.arange(5.0)), (0, "all results are the same\n", ""))
        self.assertIn("\n1 the same, 0 different", self.report())

    def test_different(self):
        self.assertEqual(self.compare(np.arange(5.0) * (1 + 2.0**-35)),
                         (1, "some results differ, as report.txt says\n", ""))
        self.assertIn("smallest tolerance    --tol 18", self.report())

    def test_trouble(self):
        self.write("first/run.npy", b"broken")
        self.write("second/run.npy", b"broken")
        status, output, errors = self.run_job()
        self.assertEqual((status, output), (2, ""))
        self.assertIn("talcmp: first/run.npy: ", errors)
        self.assertTrue(errors.endswith("\nsome results could not be compared\n"), errors)

    def test_ended(self):
        self.start_by("exit 137 #")
        self.assertEqual(self.compare(np.arange(5.0)),
                         (2, "", "the comparison was ended: there is no answer\n"))


class SlurmJobOfTwoProcesses(SlurmJob):
    """The same with talcmp-mpi, started by Open MPI, which has to be told twice that root may."""

    def setUp(self):
        super().setUp()
        program = pathlib.Path(COMMAND[-1]).with_name("talcmp-mpi")
        if not program.exists() or shutil.which("mpirun") is None:
            self.skipTest("NOT TESTED: talcmp-mpi is not built, or mpirun not installed")
        os.remove(f"{self.programs}/talcmp-mpi")
        os.symlink(program, f"{self.programs}/talcmp-mpi")
        # Without the third, mpirun waits a second after a status that is not 0. It leaks memory.
        self.environment.update(OMPI_ALLOW_RUN_AS_ROOT="1", OMPI_ALLOW_RUN_AS_ROOT_CONFIRM="1",
                                OMPI_MCA_odls_base_sigkill_timeout="0",
                                ASAN_OPTIONS="detect_leaks=0")
        self.start_by("exec mpirun -q --oversubscribe -n 2")


class Workflow(Recipe):
    def step(self):
        text = (RECIPES / "workflow.yml").read_text(encoding="utf-8")
        lines = re.search(r"run: \|\n((?: {10}.*\n)+)", text).group(1)
        return re.sub("^ {10}", "", lines, flags=re.MULTILINE)

    def test_step(self):
        self.save("expected/run.npy", np.arange(5.0))
        for result, expected_status in ((np.arange(5.0), 0), (np.arange(5.0) + 1, 1)):
            self.save("results/run.npy", result)
            status, _, errors = self.run_in_folder("bash", "-e", "-o", "pipefail", "-c",
                                                   self.step())
            self.assertEqual((status, errors), (expected_status, ""))
            report = json.loads(read_bytes(self.path("report/talcmp.json")))
            self.assertEqual(report["exit_status"], expected_status)


@unittest.skipIf(shutil.which("git") is None, "NOT TESTED: git is not installed")
class Git(Recipe):
    def git(self, *arguments):
        status, output, errors = self.run_in_folder(
            "git", "-c", "user.name=Tester", "-c", "user.email=tester@localhost", *arguments)
        self.assertEqual((status, errors), (0, ""))
        return output

    def setUp(self):
        super().setUp()
        self.git("init", "--quiet")
        self.run_in_folder(RECIPES / "set_up_git.sh")
        self.save("a.npy", np.arange(5.0))
        self.git("add", ".")
        self.git("commit", "--quiet", "-m", "one")
        self.save("a.npy", np.arange(5.0) * (1 + 2.0**-35))

    def test_difftool(self):
        self.assertIn("smallest tolerance    --tol 18", self.git("difftool"))

    def test_diff_of_values_alone(self):
        self.save("a.npy", np.arange(5.0) + 1)
        self.assertTrue(self.git("diff"))

    def test_diff(self):
        self.save("a.npy", np.array([0, np.nan, 2]))
        output = self.git("diff")
        self.assertIn("-  first array           float64 (5,)", output)
        self.assertIn("+  first array           float64 (3,)", output)
        self.assertIn("+  NaNs                  1 and 1", output)


if __name__ == "__main__":
    run_tests()
