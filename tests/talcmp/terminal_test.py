#!/usr/bin/env python3
"""What talcmp does on a terminal and, elsewhere, does not: colours, the width of bars, progress."""

import fcntl
import os
import pty
import re
import select
import struct
import subprocess
import sys
import tempfile
import termios
import time
import unittest

import numpy as np

from support.talcmp_command import COMMAND, run_tests

ESCAPE = "\x1b["


class Terminal:
    """A pseudo-terminal; what is written to it is in `text` once the program has ended."""

    def __init__(self, columns=80):
        self.controller, self.device = pty.openpty()
        fcntl.ioctl(self.device, termios.TIOCSWINSZ, struct.pack("HHHH", 24, columns, 0, 0))
        self.text = ""

    def read_until_end(self, process):
        os.close(self.device)
        chunks = []
        while True:
            ready, _, _ = select.select([self.controller], [], [], 60)
            try:
                chunk = os.read(self.controller, 65536) if ready else b""
            except OSError:  # the other end is closed
                chunk = b""
            if not chunk:
                break
            chunks.append(chunk)
        process.wait(60)
        os.close(self.controller)
        self.text = b"".join(chunks).decode()


def run_on_terminal(*arguments, columns=80, output=True, errors=True, stdin=None, **variables):
    """Runs talcmp with a terminal as its standard output or error, or both."""
    terminal = Terminal(columns)
    environment = {name: value for name, value in os.environ.items() if name != "NO_COLOR"}
    environment.update({"TERM": "xterm"}, **variables)
    process = subprocess.Popen(
        COMMAND + [str(argument) for argument in arguments], env=environment,
        stdin=stdin if stdin is not None else subprocess.DEVNULL,
        stdout=terminal.device if output else subprocess.DEVNULL,
        stderr=terminal.device if errors else subprocess.DEVNULL)
    terminal.read_until_end(process)
    return process.returncode, terminal.text


class Folder(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = folder.name
        self.one = self.save("one.npy", np.arange(100.0))
        self.two = self.save("two.npy", np.arange(100.0) * (1 + 2.0**-40))

    def save(self, name, array):
        path = os.path.join(self.folder, name)
        np.save(path, array)
        return path


class Colours(Folder):
    def test_on_a_terminal(self):
        status, text = run_on_terminal(self.one, self.two)
        self.assertEqual(status, 1)
        self.assertIn(ESCAPE + "31mdiffer" + ESCAPE + "0m", text)

    def test_not_where_they_are_not_wanted(self):
        for variables in ({"NO_COLOR": "1"}, {"TERM": "dumb"}):
            self.assertNotIn(ESCAPE, run_on_terminal(self.one, self.two, **variables)[1])

    def test_not_in_a_pipe(self):
        done = subprocess.run(COMMAND + ["--report", self.one, self.two], capture_output=True,
                              check=False)
        self.assertNotIn(b"\x1b", done.stdout + done.stderr)

    def test_none_in_json(self):
        self.assertNotIn(ESCAPE, run_on_terminal("--json", self.one, self.two)[1])


class Width(Folder):
    def test_bars_fit(self):
        for columns in (30, 80, 200):
            _, text = run_on_terminal("--report", self.one, self.two, columns=columns)
            bars = [re.sub(r"\x1b\[\d+m", "", line) for line in text.splitlines() if "#" in line]
            self.assertTrue(bars)
            self.assertLessEqual(max(map(len, bars)), columns)
            if columns >= 80:
                self.assertGreaterEqual(max(map(len, bars)), columns - 10)

    def test_help_fits_a_screen(self):
        status, text = run_on_terminal("--help")
        self.assertEqual(status, 0)
        lines = text.splitlines()
        self.assertLessEqual(len(lines), 24)
        self.assertLessEqual(max(map(len, lines)), 80)


class Progress(Folder):
    """The other array comes from standard input, as slowly as is wanted."""

    def run_slowly(self, seconds, errors=True, options=(), order="C"):
        values = np.arange(200000.0).reshape(400, 500)
        with open(self.save("values.npy", values), "rb") as file:
            contents = file.read()
        path = self.save("other.npy", np.asarray(values, order=order))
        read_end, write_end = os.pipe()
        writer = os.fork()
        if writer == 0:
            try:
                os.close(read_end)
                pieces = 20
                for piece in range(pieces):
                    begin, end = (len(contents) * i // pieces for i in (piece, piece + 1))
                    os.write(write_end, contents[begin:end])
                    time.sleep(seconds / pieces)
            finally:
                os._exit(0)
        os.close(write_end)
        result = run_on_terminal("-", path, *options, stdin=read_end, errors=errors)
        os.close(read_end)
        os.waitpid(writer, 0)
        return result

    def test_bar_after_half_a_second(self):
        self.check_bar(*self.run_slowly(2))

    def test_bar_while_a_copy_is_taken(self):
        self.check_bar(*self.run_slowly(2, order="F"))

    def check_bar(self, status, text):
        self.assertEqual(status, 0)
        bars = re.findall(r"\r\[=* *\] +(\d+) %  \d+\.\d\d [GM]B/s  \d+:\d\d left\x1b\[K", text)
        self.assertGreaterEqual(len(bars), 2)
        shares = [int(share) for share in bars]
        self.assertEqual(shares, sorted(shares))
        self.assertGreater(shares[0], 5)
        self.assertTrue(text.endswith("\r" + ESCAPE + "K"), repr(text[-80:]))

    def test_no_bar_before(self):
        self.assertEqual(self.run_slowly(0), (0, ""))

    def test_no_bar_without_a_terminal(self):
        self.assertEqual(self.run_slowly(1.5, errors=False), (0, ""))

    def test_no_bar_when_quiet(self):
        self.assertEqual(self.run_slowly(1.5, options=["--quiet"]), (0, ""))


if __name__ == "__main__":
    run_tests()
