"""The talcmp under test, and what its tests in Python share. They are started as

    SOMETHING_test.py TALCMP... [-- unittest options]

TALCMP is the command, after its emulator if there is one.
"""

import json
import os
import pathlib
import subprocess
import sys
import tempfile
import unittest

import jsonschema
import numpy as np

ROOT = pathlib.Path(__file__).resolve().parents[3]
SCHEMA = json.loads((ROOT / "tools" / "talcmp" / "talcmp.schema.json").read_text("utf-8"))
# Made once: to check the schema itself takes longer than most documents do.
VALIDATOR = jsonschema.validators.validator_for(SCHEMA)(SCHEMA)
VALIDATOR.check_schema(SCHEMA)
COMMAND = []
EMULATED = any("qemu" in word for word in sys.argv)


def run_program(*words, **options):
    """Returns the exit status, and what is on standard output and on standard error."""
    done = subprocess.run([str(word) for word in words], capture_output=True, check=False,
                          timeout=300, **options)
    return done.returncode, done.stdout.decode(), done.stderr.decode()


def run(*arguments, prefix=(), **options):
    """Runs talcmp, by the program in `prefix` if there is one."""
    return run_program(*prefix, *COMMAND, *arguments, **options)


def document_of(output):
    """What --json has printed."""
    document = json.loads(output)
    VALIDATOR.validate(document)
    return document


def some(rng, cases):
    """All cases; under an emulator, which takes ten times as long, a third of them, others in each
    run."""
    cases = list(cases)
    if not EMULATED:
        return cases
    chosen = sorted(rng.choice(len(cases), size=-(-len(cases) // 3), replace=False))
    return [cases[i] for i in chosen]


def read_bytes(path):
    return pathlib.Path(path).read_bytes()


def summary(same=0, different=0, only_in_first=0, only_in_second=0, trouble=0, rest=""):
    """The last line about many arrays."""
    return (f"{same} the same, {different} different, {only_in_first} only in the first, "
            f"{only_in_second} only in the second, {trouble} in trouble{rest}\n")


class Folder(unittest.TestCase):
    """Tests with a temporary folder each."""

    maxDiff = None

    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = folder.name

    def path(self, name):
        """The path of a file or folder; makes the folder that it is in."""
        path = os.path.join(self.folder, name)
        os.makedirs(os.path.dirname(path), exist_ok=True)
        return path

    def make_folder(self, name):
        os.mkdir(self.path(name))
        return self.path(name)

    def write(self, name, contents):
        path = self.path(name)
        pathlib.Path(path).write_bytes(contents)
        return path

    def save(self, name, values, dtype=None, order=None):
        path = self.path(name)
        np.save(path, np.asarray(values, dtype=dtype, order=order))
        return path

    def save_as(self, path, values):
        """Under a name that need not end in .npy."""
        with open(path, "wb") as file:
            np.save(file, values)
        return path

    def save_archive(self, name, save=np.savez, **arrays):
        path = self.path(name)
        save(path, **arrays)
        return path

    def expect(self, status, output, errors, *arguments, **options):
        self.assertEqual(run(*arguments, **options), (status, output, errors))


def run_tests():
    """Runs the tests of the program that is started."""
    arguments, options = sys.argv[1:], []
    if "--" in arguments:
        position = arguments.index("--")
        arguments, options = arguments[:position], arguments[position + 1:]
    # Tests start talcmp in other folders too.
    COMMAND.extend(os.path.abspath(word) if os.path.exists(word) else word for word in arguments)
    unittest.main(module="__main__", argv=[sys.argv[0]] + options)
