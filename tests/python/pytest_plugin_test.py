"""What pytest shows of `assert_same` that fails."""

from __future__ import annotations

import os
import re
import subprocess
import sys
import unittest
from pathlib import Path
from typing import List
from xml.etree import ElementTree

import pytest

import talnumericarray as tna

TESTS = """\
import numpy as np
import pytest
import talnumericarray as tna

a = np.array([1.0, 2.0, 3.0])


def test_differs():
    tna.assert_same(a, a * (1 + 2.0**-50), names=("old", "new"))


def test_other_error():
    assert a.size == 4


def test_match():
    with pytest.raises(AssertionError, match="^first and second differ: .1.: 2 and 2.5"):
        tna.assert_same(a, [1, 2.5, 3])
"""

REPORT = tna.compare(
    [1.0, 2.0, 3.0], [x * (1 + 2.0**-50) for x in (1.0, 2.0, 3.0)], names=("old", "new")
).text.splitlines()


def output_of(folder: Path, *options: str) -> str:
    test = folder / "test_arrays.py"
    test.write_text(TESTS)
    paths = [path for path in sys.path if path]
    # These make pytest print more, or in other colours.
    others = ("BUILD_NUMBER", "CI", "FORCE_COLOR", "NO_COLOR", "PYTEST_ADDOPTS", "PY_COLORS")
    inherited = {name: value for name, value in os.environ.items() if name not in others}
    run = subprocess.run(
        [sys.executable, "-m", "pytest", "-q", "-p", "no:cacheprovider", *options, test.name],
        cwd=folder,
        env={**inherited, "PYTHONPATH": os.pathsep.join(paths), "COLUMNS": "100"},
        stdout=subprocess.PIPE,
        stderr=subprocess.STDOUT,
        text=True,
        timeout=60,
    )
    assert run.returncode == 1, run.stdout
    # Some versions draw lines of another length.
    lines = re.sub(r"={3,}|_{3,}", lambda line: line[0][:3], run.stdout)
    return re.sub(r"in \d+\.\d+s", "in TIME", lines)


def test_the_text_is_the_report(tmp_path: Path) -> None:
    first, *others = REPORT
    expected = f"""\
FF.                                                                                          [100%]
=== FAILURES ===
___ test_differs ___

    def test_differs():
>       tna.assert_same(a, a * (1 + 2.0**-50), names=("old", "new"))
E       talnumericarray.NotSameError: {first}
{os.linesep.join("E       " + line for line in others)}

test_arrays.py:9: NotSameError
___ test_other_error ___

    def test_other_error():
>       assert a.size == 4
E       assert 3 == 4
E        +  where 3 = array([1., 2., 3.]).size

test_arrays.py:13: AssertionError
=== short test summary info ===
FAILED test_arrays.py::test_differs - talnumericarray.NotSameError: {first}
FAILED test_arrays.py::test_other_error - assert 3 == 4
2 failed, 1 passed in TIME
"""
    for options in ([], ["-p", "talnumericarray.pytest_plugin"]):
        lines = output_of(tmp_path, "--color=no", *options).splitlines()
        # pytest shortens the summary to the width of the terminal.
        assert [shortened(line) for line in lines] == [
            shortened(line) for line in expected.splitlines()
        ]


def shortened(line: str) -> str:
    return line[:60] if line.startswith("FAILED") else line


COLOURS = {"\x1b[0m": "<>", "\x1b[1m": "<b>", "\x1b[31m": "<red>", "\x1b[34m": "<blue>"}


def coloured_report(folder: Path) -> List[str]:
    """Lines of the report, with names of colours."""
    output = output_of(folder, "--color=yes", "-p", "talnumericarray.pytest_plugin")
    for sequence, name in COLOURS.items():
        output = output.replace(sequence, name)
    lines = output.splitlines()
    assert any(line.startswith("<b><red>E       assert 3 == 4<>") for line in lines)
    begin = next(i for i, line in enumerate(lines) if "old and new differ" in line)
    return lines[begin : begin + len(REPORT)]


def test_colours(tmp_path: Path) -> None:
    first, *others = REPORT
    expected = [f"<b><red>E       talnumericarray.NotSameError: {first}<>"]
    for line in others:
        bar = re.match(r"^( *\d+ \d+ )(#+)$", line)
        expected.append(
            f"<red>E       {bar[1]}<><blue>{bar[2]}<>" if bar else f"<red>E       {line}<>"
        )
    assert any("<blue>" in line for line in expected)
    assert coloured_report(tmp_path) == expected


def test_files_have_no_colours(tmp_path: Path) -> None:
    result = tmp_path / "result.xml"
    output_of(
        tmp_path, "--color=yes", "-p", "talnumericarray.pytest_plugin", f"--junit-xml={result}"
    )
    assert "\x1b" not in result.read_text() and "#x1B" not in result.read_text()
    failure = ElementTree.parse(result).find(".//testcase[@name='test_differs']/failure")
    assert failure is not None and failure.text is not None
    assert failure.attrib["message"] == "talnumericarray.NotSameError: " + "\n".join(REPORT)
    assert [line for line in failure.text.splitlines() if line.startswith("E")] == [
        f"E       talnumericarray.NotSameError: {REPORT[0]}",
        *(f"E       {line}" for line in REPORT[1:]),
    ]


@pytest.mark.parametrize("style", ["short", "line", "native", "no"])
def test_other_styles_of_tracebacks(tmp_path: Path, style: str) -> None:
    plugin = ["-p", "talnumericarray.pytest_plugin"]
    output = output_of(tmp_path, "--color=no", f"--tb={style}", *plugin)
    expected = 1 if style in ("short", "line", "native") else 0
    assert output.count(f"talnumericarray.NotSameError: {REPORT[0]}") == expected
    assert "INTERNALERROR" not in output


def test_unittest_shows_the_report() -> None:
    class Case(unittest.TestCase):
        def runTest(self) -> None:
            tna.assert_same([1.0, 2.0], [1.0, 2.5], names=("old", "new"))

    result = unittest.TestResult()
    Case().run(result)
    assert result.errors == []
    ((_, text),) = result.failures
    report = tna.compare([1.0, 2.0], [1.0, 2.5], names=("old", "new")).text
    assert text.endswith(f"\ntalnumericarray.NotSameError: {report}\n")
