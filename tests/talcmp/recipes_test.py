#!/usr/bin/env python3
"""Runs the recipes of examples/recipes as their users would."""

import json
import os
import re
import shlex
import shutil
import unittest

import numpy as np

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
