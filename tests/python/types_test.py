"""The annotations, by mypy, and the examples in docstrings."""

import doctest
import importlib
import inspect
import os
import pathlib
import pkgutil
import re
import subprocess
import sys

import pytest

import talnumericarray as tna
from talnumericarray import _options

pytestmark = pytest.mark.skipif("TALNUMERICARRAY_SANITIZED" in os.environ,
                                reason="the extension does nothing in these tests")
TYPING = pathlib.Path(__file__).parent / "typing"
PACKAGE = pathlib.Path(tna.__file__).parent


def run(*arguments):
    environment = {**os.environ, "MYPYPATH": str(PACKAGE.parent)}
    done = subprocess.run([sys.executable, "-m", *map(str, arguments)], env=environment,
                          check=False, capture_output=True, text=True)
    return done.returncode, done.stdout + done.stderr


def mypy(*arguments, cache):
    return run("mypy", "--config-file", TYPING / "mypy.ini", "--cache-dir", cache, *arguments)


@pytest.fixture(name="cache", scope="module")
def cache_folder(tmp_path_factory):
    return tmp_path_factory.mktemp("mypy")


def test_the_package(cache):
    assert mypy("-p", "talnumericarray", cache=cache) == (0, "")


def test_uses(cache):
    assert mypy(TYPING / "uses.py", cache=cache) == (0, "")


def test_misuses(cache):
    path = TYPING / "misuses.py"
    lines = path.read_text("utf-8").splitlines()
    expected = {number: set(re.findall(r"\[([a-z-]+)\]", line.partition("  # ")[2]))
                for number, line in enumerate(lines, 1) if "  # [" in line}
    status, output = mypy(path, cache=cache)
    found = {}
    for number, code in re.findall(r"misuses\.py:(\d+): error: .*\[([a-z-]+)\]", output):
        found.setdefault(int(number), set()).add(code)
    assert found == expected
    assert status == 1


def test_stub_of_the_extension(cache):
    """With the cache of the other tests, for which there is no option."""
    configuration = (TYPING / "mypy.ini").read_text("utf-8")
    path = cache / "mypy.ini"
    path.write_text(configuration.replace("[mypy]", f"[mypy]\ncache_dir = {cache}"), "utf-8")
    status, output = run("mypy.stubtest", "talnumericarray._core", "--mypy-config-file", path,
                         "--allowlist", TYPING / "stubtest_allowlist.txt")
    assert (status, output) == (0, "Success: no issues found in 1 module\n")


def test_help_shows_all_keywords():
    arrays = ["first", "second"]
    same = list(_options.SameOptions.__annotations__)
    assert list(inspect.signature(tna.same).parameters) == arrays + same
    for function in (tna.compare, tna.assert_same):
        parameters = list(inspect.signature(function).parameters)
        assert parameters == arrays + same + ["max_places", "names"]


def test_everything_public_is_documented():
    for name in tna.__all__:
        assert getattr(tna, name).__doc__, name


@pytest.mark.parametrize("name", ["talnumericarray"]
                         + ["talnumericarray." + each.name
                            for each in pkgutil.iter_modules([str(PACKAGE)])])
def test_examples(name):
    module = importlib.import_module(name)
    finder = doctest.DocTestFinder()
    examples = finder.find(module, name)
    if name.endswith("._core"):
        # Of functions that are not Python's own, the finder takes only those of the module itself.
        examples += [doctest.DocTestParser().get_doctest(function.__doc__, {}, each, None, 0)
                     for each, function in vars(module).items() if inspect.isbuiltin(function)]
    runner = doctest.DocTestRunner(verbose=False)
    for example in examples:
        runner.run(example)
    assert runner.failures == 0


def test_there_are_examples():
    for name in ("same", "equivalent", "compare", "assert_same", "Comparison"):
        assert ">>> " in getattr(tna, name).__doc__, name
