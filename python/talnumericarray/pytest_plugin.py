"""Colours for `assert_same` under pytest, which finds this plugin when the package is installed.

pytest shows all of an assertion's text in one colour. This shows the first line, which says where
the arrays differ, in bold, and the bars of the histogram in blue, as `talcmp` does; and only where
pytest shows colours.
"""

from __future__ import annotations

import re
from typing import Any, Generator

import pytest

from talnumericarray._comparison import NotSameError

_BAR = re.compile(r"^(E +(?:\d+|more than all) +\d+ )(#+)$")


class _ColouringWriter:
    """A terminal writer that colours the lines of a report as they pass."""

    def __init__(self, writer: Any) -> None:
        self._writer = writer

    def __getattr__(self, name: str) -> Any:
        return getattr(self._writer, name)

    def line(self, text: str = "", **markup: bool) -> None:
        bar = _BAR.match(text)
        if bar:
            self._writer.write(bar[1], red=True)
            self._writer.line(bar[2], blue=True)
        elif text.startswith("E  ") and " differ: " not in text:
            self._writer.line(text, red=True)
        else:
            self._writer.line(text, **markup)


class _ColouredFailure:
    """A failure as pytest represents it, which is written in colours."""

    def __init__(self, failure: Any) -> None:
        self._failure = failure

    def __getattr__(self, name: str) -> Any:
        if name.startswith("__"):
            raise AttributeError(name)
        return getattr(self._failure, name)

    def __str__(self) -> str:
        return str(self._failure)

    def toterminal(self, writer: Any) -> None:
        self._failure.toterminal(_ColouringWriter(writer) if writer.hasmarkup else writer)


@pytest.hookimpl(hookwrapper=True)  # type: ignore[misc]
def pytest_runtest_makereport(
    item: pytest.Item, call: "pytest.CallInfo[None]"
) -> Generator[None, Any, None]:
    outcome = yield
    report = outcome.get_result()
    if call.excinfo is not None and isinstance(call.excinfo.value, NotSameError):
        if hasattr(report.longrepr, "toterminal"):
            report.longrepr = _ColouredFailure(report.longrepr)
