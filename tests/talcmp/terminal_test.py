#!/usr/bin/env python3
"""What talcmp does on a terminal and not elsewhere: colours, the width of bars, progress, and what
signals leave there."""

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

import numpy as np

from support.talcmp_command import COMMAND, Folder, read_bytes, run, run_tests

ESCAPE = "\x1b["


def read_some(terminal):
    """What can be read; nothing at the end, or if none comes within a minute."""
    ready, _, _ = select.select([terminal], [], [], 60)
    try:
        return os.read(terminal, 65536) if ready else b""
    except OSError:  # the other end is closed
        return b""


def run_on_terminal(*arguments, columns=80, errors=True, stdin=subprocess.DEVNULL,
                    notice=lambda process, text: None, before=None, folder=None, **variables):
    """Runs talcmp with a terminal as its standard output and, if `errors`, standard error; returns
    the exit status and what is on the terminal, and after that what is on another standard error.
    `notice` is called with the process and the text so far, at the start and whenever there is
    more. A variable that is None is not set."""
    environment = {**os.environ, "NO_COLOR": None, "TERM": "xterm", "LC_ALL": "C.UTF-8",
                   **variables}
    environment = {name: value for name, value in environment.items() if value is not None}
    controller, device = pty.openpty()
    fcntl.ioctl(device, termios.TIOCSWINSZ, struct.pack("HHHH", 24, columns, 0, 0))
    with tempfile.TemporaryFile() as elsewhere:
        process = subprocess.Popen(
            COMMAND + list(arguments), env=environment, cwd=folder, stdin=stdin, stdout=device,
            stderr=device if errors else elsewhere, preexec_fn=before)
        os.close(device)
        text = b""
        notice(process, "")
        while chunk := read_some(controller):
            text += chunk
            notice(process, text.decode(errors="replace"))
        process.wait(60)
        os.close(controller)
        elsewhere.seek(0)
        return process.returncode, (text + elsewhere.read()).decode()


def accept_signals():
    """A program started by nohup or a shell's & ignores some signals, and so would talcmp."""
    for number in (signal.SIGINT, signal.SIGTERM, signal.SIGHUP):
        signal.signal(number, signal.SIG_DFL)


class Answers(Folder):
    """Whole texts, with `{red}`, say, where a colour begins and `{end}` where it ends."""

    COLOURS = {"red": ESCAPE + "31m", "green": ESCAPE + "32m", "blue": ESCAPE + "34m",
               "end": ESCAPE + "0m"}
    NO_COLOURS = {"NO_COLOR": "1"}, {"TERM": "dumb"}, {"TERM": ""}, {"TERM": None}

    def check(self, expected, *arguments, status=1, columns=80, difference_map=""):
        """`difference_map` is what a report ends with on a terminal alone."""
        def expect(text, **variables):
            self.assertEqual(
                run_on_terminal(*arguments, columns=columns, folder=self.folder, **variables),
                (status, text.replace("\n", "\r\n")))

        expect((expected + difference_map).format(**self.COLOURS))
        without = dict.fromkeys(self.COLOURS, "")
        plain = expected.format(**without)
        for variables in self.NO_COLOURS:
            with self.subTest(variables=variables):
                expect(plain + difference_map.format(**without), **variables)
        if columns == 80:  # which is the width elsewhere, whatever the variable says
            self.expect(status, plain, "", *arguments, cwd=self.folder,
                        env={**os.environ, "TERM": "xterm", "COLUMNS": "40"})

    def save_special_values(self):
        near = 1 + 2**-51
        self.save("a.npy", [[np.nan, -0.0, np.inf, -0.0, np.inf], [np.inf, 1, 1, 1, 1]])
        self.save("b.npy", [[1, 0.0, np.inf, -0.0, np.inf], [1e308, near, near, near, 1]],
                  order="F")

    def test_difference(self):
        self.save("a.npy", [1.0])
        self.save("b.npy", [1 + 2.0**-40])
        self.check("a.npy b.npy {red}differ{end}: [0]: 1 and 1.0000000000009095 (the same from "
                   "--tol 13 on)\n", "a.npy", "b.npy")

    def test_json(self):
        self.save_special_values()
        plain = run("--json", "a.npy", "b.npy", cwd=self.folder)[1]
        self.assertNotIn("\x1b", plain)
        self.check(re.sub(r"([{}])", r"\1\1", plain), "--json", "a.npy", "b.npy")

    def test_report_of_special_values(self):
        self.save_special_values()
        bars = {200: (181, 45, 135, 90), 80: (61, 15, 45, 30), 40: (21, 5, 15, 10),
                20: (1, 1, 1, 1), 5: (1, 1, 1, 1)}
        for columns, lengths in bars.items():
            expected = """\
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
  absolute difference   infinite
  relative difference   infinite
  smallest tolerance    none below all 53 digits; [0, 0]: nan(0x7ff8000000000000) and 1 (a NaN)
  NaNs                  1 and 0
  infinities            3 and 2
  negative zeros        2 and 1
  digits that differ, number of pairs
"""
            for digits, count, length in zip((0, 1, 2, 53), (4, 1, 3, 2), lengths):
                expected += f"  {digits:13} {count} {{blue}}{'#' * length}{{end}}\n"
            with self.subTest(columns=columns):
                self.check(expected, "--report", "-n2", "--tol=1.5", "a.npy", "b.npy",
                           columns=columns, difference_map=self.MAPS[columns])

    MAP = """\
  0 {red}N{end}{blue}░{end}···
  1 {red}█{end}{blue}░░░{end}·
    0
"""
    WIDE_MAP = "  differences; down: axis 0, right: axis 1\n  each character: one element\n" + MAP + (
        "  · equal  {blue}░{end} 1 to 18 digits  {red}█{end} no digit in common  {red}N{end} a NaN\n")
    MAPS = {
        200: WIDE_MAP,
        80: WIDE_MAP,
        40: "  differences; down: axis 0, right:\n  axis 1\n  each character: one element\n" + MAP + (
            "  · equal  {blue}░{end} 1 to 18 digits\n"
            "  {red}█{end} no digit in common  {red}N{end} a NaN\n"),
        20: "  differences;\n  down: axis 0,\n  right: axis 1\n  each character:\n  one element\n" + MAP + (
            "  · equal\n  {blue}░{end} 1 to 18 digits\n  {red}█{end} no digit in common\n"
            "  {red}N{end} a NaN\n"),
        5: "  " + "\n  ".join("differences; down: axis 0, right: axis 1 each character: the worst of "
                             "1 x 5 elements".split()) + (
            "\n  0 {red}N{end}\n  1 {red}█{end}\n    0\n  {red}█{end} no digit in common\n"
            "  {red}N{end} a NaN\n"),
    }

    def test_report_of_numbers_of_two_widths(self):
        self.save("a.npy", np.arange(12), "i2")
        self.save("b.npy", np.arange(12) + (np.arange(12) == 7), "f4")
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
  absolute difference   at most 1
  relative difference   at most 0.125
  smallest tolerance    --tol 22
  NaNs                  0 and 0
  infinities            0 and 0
  negative zeros        0 and 0
  digits that differ, number of pairs
              0 10 {blue}##########{end}
             22  1 {blue}#{end}
""", "--report", "--slice=1:", "a.npy", "b.npy", columns=30, difference_map="""\
  differences; right: axis 0
  each character: one element
  ······{blue}▓{end}····
  0    5
  · equal  {blue}▓{end} 17 to 23 digits
""")

    def test_report_of_arrays_that_are_the_same(self):
        self.save("a.npy", np.arange(100.0))
        self.check("""\
a.npy a.npy {green}are the same{end}
  first array           float64 (100,)
  second array          float64 (100,)
  tolerance             0 binary digits
  pairs                 100
  differing             0 (0 %)
  largest difference    0 binary digits
  absolute difference   at most 0
  relative difference   at most 0
  smallest tolerance    --tol 0
  NaNs                  0 and 0
  infinities            0 and 0
  negative zeros        0 and 0
  digits that differ, number of pairs
              0 100 {blue}###################{end}
""", "--report", "a.npy", "a.npy", status=0, columns=40, difference_map="""\
  differences; right: axis 0
  each character: the worst of 3
  elements
  ··································
  0     20     40     60    80
  · equal
""")

    def test_report_of_pairs_that_are_the_same_under_no_tolerance(self):
        self.save("a.npy", [1.0, 2.0])
        self.save("b.npy", [-1.0, 2.0])
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
  absolute difference   at most 2
  relative difference   at most 2
  smallest tolerance    none; [0]: 1 and -1 (opposite signs)
  NaNs                  0 and 0
  infinities            0 and 0
  negative zeros        0 and 0
  digits that differ, number of pairs
              0 1 {blue}#####################{end}
  more than all 1 {blue}#####################{end}
""", "--report", "a.npy", "b.npy", columns=40, difference_map="""\
  differences; right: axis 0
  each character: one element
  {red}█{end}·
  0
  · equal  {red}█{end} no digit in common
""")

    def test_report_of_nans_that_are_the_same_bit_by_bit_only(self):
        self.save("a.npy", [np.nan, 1], "f4")
        self.save("b.npy", [np.nan, 1 + 2**-23], "f4")
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
  absolute difference   at most 1.1920928955078125e-07
  relative difference   at most 1.1920927533992823e-07
  smallest tolerance    none below all 24 digits; pairs of NaNs are the same under the tolerance 0 only
  NaNs                  1 and 1
  infinities            0 and 0
  negative zeros        0 and 0
  digits that differ, number of pairs
              0 1 {blue}#####################{end}
              1 1 {blue}#####################{end}
""", "--report", "a.npy", "b.npy", columns=40, difference_map="""\
  differences; right: axis 0
  each character: one element
  {red}N{end}{blue}░{end}
  0
  {blue}░{end} 1 to 8 digits  {red}N{end} a NaN
""")


class Help(Folder):
    def test_fits_a_tall_window(self):
        status, text = run_on_terminal("--help")
        self.assertEqual(status, 0)
        lines = text.splitlines()
        self.assertLessEqual(len(lines), 48)
        self.assertLessEqual(max(map(len, lines)), 80)


class Progress(Folder):
    """One array comes from standard input, as slowly as the test wants."""

    def contents(self, order="C"):
        """The bytes of the slow array; the other is in other.npy."""
        values = np.arange(200000.0).reshape(400, 500)
        self.other = self.save("other.npy", values, order=order)
        return read_bytes(self.save("values.npy", values))

    def run_slowly(self, seconds, *options, order="C", **settings):
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
        self.check_bars(*self.run_slowly(2))

    def test_bar_while_a_copy_is_taken(self):
        self.check_bars(*self.run_slowly(2, order="F"))

    BAR = r"\r\[(=*)( *)\] +(\d+) %  \d+\.\d\d [GM]B/s  \d+:\d\d left\x1b\[K"

    def shares(self, text):
        """What the bars show; expects only bars in the text, and the last one to be removed."""
        self.assertRegex(text, f"^({self.BAR})*\r\x1b\\[K$")
        shares = []
        for full, empty, share in re.findall(self.BAR, text):
            self.assertAlmostEqual(len(full) / (len(full) + len(empty)), int(share) / 100,
                                   delta=0.04)
            shares.append(int(share))
        return shares

    def check_bars(self, status, text):
        self.assertEqual(status, 0)
        shares = self.shares(text)
        self.assertGreaterEqual(len(shares), 2)
        self.assertEqual(shares, sorted(shares))
        self.assertGreater(shares[0], 5)

    def test_no_bar_on_a_terminal_that_takes_no_escapes(self):
        for name in ("dumb", "", None):
            self.assertEqual(self.run_slowly(1, TERM=name), (0, ""))

    def send_signals(self, *numbers, before=accept_signals):
        """Sends the signals while the bar is shown."""
        sent = []

        def notice(process, text):
            if not sent and re.search(self.BAR, text):
                sent.extend(numbers)
                for number in numbers:
                    process.send_signal(number)

        result = self.run_slowly(2, order="F", notice=notice, before=before, TMPDIR=self.folder)
        self.assertEqual(sent, list(numbers))
        return result

    def test_signals_end_it_and_remove_the_bar(self):
        for number in (signal.SIGINT, signal.SIGTERM, signal.SIGHUP):
            with self.subTest(signal=number):
                before = set(os.listdir(self.folder)) | {"values.npy", "other.npy"}
                status, text = self.send_signals(number)
                self.assertEqual(status, -number)
                self.assertEqual(len(self.shares(text)), 1)
                self.assertEqual(set(os.listdir(self.folder)), before)

    def test_signals_before_there_is_a_bar(self):
        read_end, write_end = os.pipe()
        os.write(write_end, self.contents("C")[:128])  # the header, so that it waits for elements
        result = run_on_terminal(
            "-", self.other, stdin=read_end, before=accept_signals,
            notice=lambda process, text: threading.Timer(0.5, process.terminate).start())
        os.close(read_end)
        os.close(write_end)
        self.assertEqual(result, (-signal.SIGTERM, ""))

    def test_two_signals_end_it_too(self):
        status, text = self.send_signals(signal.SIGTERM, signal.SIGINT)
        self.assertIn(status, (-signal.SIGTERM, -signal.SIGINT))
        self.assertEqual(len(self.shares(text)), 1)

    def test_signals_that_are_ignored_stay_so(self):
        self.check_bars(*self.send_signals(
            signal.SIGHUP, before=lambda: signal.signal(signal.SIGHUP, signal.SIG_IGN)))

    def test_no_bar_before(self):
        self.assertEqual(self.run_slowly(0), (0, ""))

    def test_no_bar_without_a_terminal(self):
        self.assertEqual(self.run_slowly(1.5, errors=False), (0, ""))

    def test_no_bar_when_quiet(self):
        self.assertEqual(self.run_slowly(1.5, "--quiet"), (0, ""))


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
