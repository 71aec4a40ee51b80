#!/usr/bin/env python3
"""What talcmp does on a terminal and, elsewhere, does not: colours, the width of bars, progress, and
what signals leave there."""

import fcntl
import os
import pty
import re
import select
import signal
import struct
import subprocess
import sys
import tempfile
import termios
import threading
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

    def read_until_end(self, process, notice=lambda text: None):
        """Calls `notice` with all text so far, whenever there is more."""
        os.close(self.device)
        contents = b""
        while True:
            ready, _, _ = select.select([self.controller], [], [], 60)
            try:
                chunk = os.read(self.controller, 65536) if ready else b""
            except OSError:  # the other end is closed
                chunk = b""
            if not chunk:
                break
            contents += chunk
            notice(contents.decode(errors="replace"))
        process.wait(60)
        os.close(self.controller)
        self.text = contents.decode()


def run_on_terminal(*arguments, columns=80, output=True, errors=True, stdin=None, notice=None,
                    before=None, started=None, folder=None, **variables):
    """Runs talcmp with a terminal as its standard output or error, or both; what goes elsewhere is
    after what is on the terminal. `started` is called with the process, `notice` with that and
    the text so far. A variable that is None is not set."""
    terminal = Terminal(columns)
    environment = {name: value for name, value in os.environ.items() if name != "NO_COLOR"}
    environment.update({"TERM": "xterm"}, **variables)
    environment = {name: value for name, value in environment.items() if value is not None}
    with tempfile.TemporaryFile() as elsewhere:
        process = subprocess.Popen(
            COMMAND + [str(argument) for argument in arguments], env=environment, cwd=folder,
            stdin=stdin if stdin is not None else subprocess.DEVNULL,
            stdout=terminal.device if output else elsewhere,
            stderr=terminal.device if errors else elsewhere, preexec_fn=before)
        if started:
            started(process)
        terminal.read_until_end(process,
                                (lambda text: notice(process, text)) if notice else lambda _: None)
        elsewhere.seek(0)
        return process.returncode, terminal.text + elsewhere.read().decode()


def heed_signals():
    """What nohup or a shell's & has started ignores some of them, and so would talcmp."""
    for number in (signal.SIGINT, signal.SIGTERM, signal.SIGHUP):
        signal.signal(number, signal.SIG_DFL)


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
        plain = self.run_elsewhere("--report", self.one, self.two)
        for variables in ({"NO_COLOR": "1"}, {"TERM": "dumb"}, {"TERM": ""}, {"TERM": None}):
            with self.subTest(variables=variables):
                self.assertEqual(run_on_terminal("--report", self.one, self.two, **variables),
                                 (1, plain.replace("\n", "\r\n")))

    def run_elsewhere(self, *arguments):
        done = subprocess.run(COMMAND + list(arguments), capture_output=True, check=False,
                              env={**os.environ, "TERM": "xterm", "COLUMNS": "40"})
        self.assertEqual((done.returncode, done.stderr), (1, b""))
        return done.stdout.decode()

    def test_not_in_a_pipe(self):
        self.assertNotIn("\x1b", self.run_elsewhere("--report", self.one, self.two))

    def test_none_in_json(self):
        plain = self.run_elsewhere("--json", self.one, self.two)
        self.assertNotIn("\x1b", plain)
        self.assertEqual(run_on_terminal("--json", self.one, self.two),
                         (1, plain.replace("\n", "\r\n")))


class Reports(Folder):
    """Whole texts, with `{red}` and its like where colours begin."""

    COLOURS = {"red": ESCAPE + "31m", "green": ESCAPE + "32m", "blue": ESCAPE + "34m",
               "end": ESCAPE + "0m"}

    def check(self, expected, *arguments, status=1, columns=80):
        names = [os.path.basename(argument) for argument in arguments]
        found = run_on_terminal(*names, columns=columns, folder=self.folder)
        self.assertEqual(found[1], expected.format(**self.COLOURS).replace("\n", "\r\n"))
        self.assertEqual(found[0], status)
        plain = re.sub(r"\{\w+\}", "", expected)
        self.assertEqual(
            run_on_terminal(*names, columns=columns, folder=self.folder, NO_COLOR="1"),
            (status, plain.replace("\n", "\r\n")))

    def pairs(self):
        special = [[np.nan, -0.0, np.inf, -0.0, np.inf], [np.inf, 1, 1, 1, 1]]
        near = 1 + 2**-51
        other = [[1, 0.0, np.inf, -0.0, np.inf], [1e308, near, near, near, 1]]
        return (self.save("a.npy", np.array(special)),
                self.save("b.npy", np.array(other, order="F")))

    REPORT = """\
a.npy b.npy {red}differ{end}: [0, 0]: nan(0x7ff8000000000000) and 1 (a NaN)
a.npy b.npy {red}differ{end}: [1, 0]: inf and 1e+308 (no digit in common)
  first array           float64 (2, 5)
  second array          float64 (2, 5), Fortran order
  tolerance             1.5 binary digits
  pairs                 10
  differing             5 (50 %)
  first place           [0, 0]: nan(0x7ff8000000000000) and 1 (a NaN)
  worst place           [0, 0]: nan(0x7ff8000000000000) and 1 (a NaN)
  largest difference    53 binary digits
  smallest tolerance    none below all 53 digits; [0, 0]: nan(0x7ff8000000000000) and 1 (a NaN)
  NaNs                  1 and 0
  infinities            3 and 2
  negative zeros        2 and 1
  digits that differ, number of pairs
"""

    def test_of_special_values(self):
        bars = {80: (61, 15, 45, 30), 40: (21, 5, 15, 10), 20: (1, 1, 1, 1), 5: (1, 1, 1, 1)}
        for columns, lengths in bars.items():
            expected = self.REPORT
            for digits, count, length in zip((0, 1, 2, 53), (4, 1, 3, 2), lengths):
                expected += f"  {digits:13} {count} {{blue}}{'#' * length}{{end}}\n"
            with self.subTest(columns=columns):
                self.check(expected, "--report", "-n2", "--tol=1.5", *self.pairs(),
                           columns=columns)

    def test_of_numbers_of_two_widths(self):
        a = self.save("a.npy", np.arange(12, dtype="i2"))
        b = self.save("b.npy", np.arange(12, dtype="f4") + (np.arange(12) == 7))
        self.check("""\
a.npy b.npy {red}differ{end}: [7]: 7 and 8 (the same from --tol 22 on)
  first array           int16 (12,), of it (11,)
  second array          float32 (12,), of it (11,)
  tolerance             0 binary digits
  pairs                 11
  differing             1 (9.09 %)
  first place           [7]: 7 and 8 (the same from --tol 22 on)
  worst place           [7]: 7 and 8 (the same from --tol 22 on)
  largest difference    22 binary digits
  smallest tolerance    --tol 22
  NaNs                  0 and 0
  infinities            0 and 0
  negative zeros        0 and 0
  digits that differ, number of pairs
              0 10 {blue}##########{end}
             22  1 {blue}#{end}
""", "--report", "--slice=1:", a, b, columns=30)

    def test_of_arrays_that_are_the_same(self):
        self.check("""\
one.npy one.npy {green}are the same{end}
  first array           float64 (100,)
  second array          float64 (100,)
  tolerance             0 binary digits
  pairs                 100
  differing             0 (0 %)
  largest difference    0 binary digits
  smallest tolerance    --tol 0
  NaNs                  0 and 0
  infinities            0 and 0
  negative zeros        0 and 0
  digits that differ, number of pairs
              0 100 {blue}###################{end}
""", "--report", self.one, self.one, status=0, columns=40)

    def test_of_pairs_that_are_the_same_under_no_tolerance(self):
        a = self.save("a.npy", np.array([1.0, 2.0]))
        b = self.save("b.npy", np.array([-1.0, 2.0]))
        self.check("""\
a.npy b.npy {red}differ{end}: [0]: 1 and -1 (opposite signs)
  first array           float64 (2,)
  second array          float64 (2,)
  tolerance             0 binary digits
  pairs                 2
  differing             1 (50 %)
  first place           [0]: 1 and -1 (opposite signs)
  worst place           [0]: 1 and -1 (opposite signs)
  largest difference    more than all binary digits
  smallest tolerance    none; [0]: 1 and -1 (opposite signs)
  NaNs                  0 and 0
  infinities            0 and 0
  negative zeros        0 and 0
  digits that differ, number of pairs
              0 1 {blue}#####################{end}
  more than all 1 {blue}#####################{end}
""", "--report", a, b, columns=40)

    def test_of_nans_that_are_the_same_bit_by_bit_only(self):
        a = self.save("a.npy", np.array([np.nan, 1], dtype="f4"))
        b = self.save("b.npy", np.array([np.nan, 1 + 2**-23], dtype="f4"))
        self.check("""\
a.npy b.npy {red}differ{end}: [1]: 1 and 1.0000001 (the same from --tol 1 on)
  first array           float32 (2,)
  second array          float32 (2,)
  tolerance             0 binary digits
  pairs                 2
  differing             1 (50 %)
  first place           [1]: 1 and 1.0000001 (the same from --tol 1 on)
  worst place           [1]: 1 and 1.0000001 (the same from --tol 1 on)
  largest difference    1 binary digits
  smallest tolerance    none below all 24 digits; pairs of NaNs are the same under the tolerance 0 only
  NaNs                  1 and 1
  infinities            0 and 0
  negative zeros        0 and 0
  digits that differ, number of pairs
              0 1 {blue}#####################{end}
              1 1 {blue}#####################{end}
""", "--report", a, b, columns=40)

    def test_nothing_but_colours_differs_elsewhere(self):
        expected = self.REPORT + "".join(
            f"  {digits:13} {count} {'#' * length}\n"
            for digits, count, length in ((0, 4, 61), (1, 1, 15), (2, 3, 45), (53, 2, 30)))
        a, b = self.pairs()
        done = subprocess.run(COMMAND + ["--report", "-n2", "--tol=1.5", "a.npy", "b.npy"],
                              cwd=self.folder, capture_output=True, check=False,
                              env={**os.environ, "TERM": "xterm"})
        self.assertEqual((done.returncode, done.stdout.decode(), done.stderr),
                         (1, re.sub(r"\{\w+\}", "", expected), b""))


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

    def contents(self, order="C"):
        """Of the slow array; the other is in other.npy."""
        values = np.arange(200000.0).reshape(400, 500)
        self.other = self.save("other.npy", np.asarray(values, order=order))
        with open(self.save("values.npy", values), "rb") as file:
            return file.read()

    def run_slowly(self, seconds, options=(), order="C", **settings):
        contents = self.contents(order)
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
        result = run_on_terminal("-", self.other, *options, stdin=read_end, **settings)
        os.close(read_end)
        os.waitpid(writer, 0)
        return result

    def test_bar_after_half_a_second(self):
        self.check_bar(*self.run_slowly(2))

    def test_bar_while_a_copy_is_taken(self):
        self.check_bar(*self.run_slowly(2, order="F"))

    BAR = (r"\r\[(=*)( *)\] +(\d+) %  \d+\.\d\d [GM]B/s  \d+:\d\d left\x1b\[K")
    END = "\r" + ESCAPE + "K"

    def shares(self, text):
        """What the bars say; expects the text to be nothing but bars, and the last to be gone."""
        self.assertRegex(text, f"^({self.BAR})*\r\x1b\\[K$")
        shares = []
        for full, empty, share in re.findall(self.BAR, text):
            self.assertAlmostEqual(len(full) / (len(full) + len(empty)), int(share) / 100,
                                   delta=0.04)
            shares.append(int(share))
        return shares

    def check_bar(self, status, text):
        self.assertEqual(status, 0)
        shares = self.shares(text)
        self.assertGreaterEqual(len(shares), 2)
        self.assertEqual(shares, sorted(shares))
        self.assertGreater(shares[0], 5)

    def test_no_bar_on_a_terminal_that_takes_no_escapes(self):
        for name in ("dumb", "", None):
            self.assertEqual(self.run_slowly(1, TERM=name), (0, ""))

    def check_signal(self, number, sent_by, before=heed_signals):
        """Sends the signal while the bar is shown."""
        sent = []

        def notice(process, text):
            if not sent and re.search(self.BAR, text):
                sent.append(number)
                sent_by(process)

        result = self.run_slowly(2, order="F", notice=notice, before=before,
                                 TMPDIR=self.folder)
        self.assertEqual(sent, [number])
        return result

    def test_signals_end_with_the_bar_taken_off(self):
        for number in (signal.SIGINT, signal.SIGTERM, signal.SIGHUP):
            with self.subTest(signal=number):
                before = set(os.listdir(self.folder)) | {"values.npy", "other.npy"}
                status, text = self.check_signal(number, lambda process: process.send_signal(number))
                self.assertEqual(status, -number)
                self.assertEqual(len(self.shares(text)), 1)
                self.assertEqual(set(os.listdir(self.folder)), before)

    def test_signals_before_there_is_a_bar(self):
        read_end, write_end = os.pipe()
        os.write(write_end, self.contents("C")[:128])  # the header, so that it waits for elements
        status, text = run_on_terminal(
            "-", self.other, stdin=read_end, before=heed_signals,
            started=lambda process: threading.Timer(0.5, process.terminate).start())
        os.close(read_end)
        os.close(write_end)
        self.assertEqual((status, text), (-signal.SIGTERM, ""))

    def test_two_signals_end_it_too(self):
        def both(process):
            process.send_signal(signal.SIGTERM)
            process.send_signal(signal.SIGINT)

        status, text = self.check_signal(signal.SIGTERM, both)
        self.assertIn(status, (-signal.SIGTERM, -signal.SIGINT))
        self.assertEqual(len(self.shares(text)), 1)

    def test_signals_that_are_ignored_stay_so(self):
        status, text = self.check_signal(
            signal.SIGHUP, lambda process: process.send_signal(signal.SIGHUP),
            lambda: signal.signal(signal.SIGHUP, signal.SIG_IGN))
        self.check_bar(status, text)

    def test_no_bar_before(self):
        self.assertEqual(self.run_slowly(0), (0, ""))

    def test_no_bar_without_a_terminal(self):
        self.assertEqual(self.run_slowly(1.5, errors=False), (0, ""))

    def test_no_bar_when_quiet(self):
        self.assertEqual(self.run_slowly(1.5, options=["--quiet"]), (0, ""))


def has_pseudo_terminals():
    try:
        descriptors = pty.openpty()
    except OSError:
        return False
    for descriptor in descriptors:
        os.close(descriptor)
    return True


if __name__ == "__main__":
    if not has_pseudo_terminals():
        print("NOT TESTED: what talcmp does on a terminal, as this machine has no pseudo-terminals")
        sys.exit(77)  # which CTest reports as skipped
    run_tests()
