#!/usr/bin/env python3
"""Arrays of archives as operands, and what is reported of many arrays."""

import gzip
import os
import subprocess

import numpy as np

from support.talcmp_command import Folder, document_of, read_bytes, run, run_tests, summary

NO_NUMBERS = ("has elements of type '<U1' (text), which is not supported; save them as booleans, "
              "integers of 8 to 64 bits, float16 to float64, complex64 or complex128")


class MembersAsOperands(Folder):
    def setUp(self):
        super().setUp()
        self.a = self.save_archive("a.npz", x=np.arange(3), y=np.arange(4.0))
        self.b = self.save_archive("b.npz", np.savez_compressed, x=np.arange(3) + 1, z=np.arange(4))

    def test_of_different_names(self):
        self.expect(0, "", "", f"{self.a}[y]", f"{self.b}[z]")
        self.expect(1, f"{self.a}[x] {self.b}[x] differ: [0]: 0 and 1 (different integers)\n", "",
                    f"{self.a}[x]", f"{self.b}[x]")

    def test_and_files(self):
        file = self.save("file.npy", np.arange(4))
        self.expect(0, "", "", f"{self.a}[y]", file)
        self.expect(0, "", "", file, f"{self.a}[y]")
        self.expect(0, "", "", "-", f"{self.a}[y]", input=read_bytes(file))

    def test_and_another_archive(self):
        """The array of the same name, if there is one."""
        self.expect(1, f"{self.a}[x] {self.b}[x] differ: [0]: 0 and 1 (different integers)\n", "",
                    f"{self.a}[x]", self.b)
        self.expect(2, "", f"talcmp: {self.b}: has 2 arrays, and one is needed; choose one, such "
                           f"as {self.b}[x]\n", f"{self.a}[y]", self.b)
        self.expect(0, "", "", f"{self.a}[y]", self.b, "--include=z")

    def test_when_none_is_left(self):
        file = self.save("file.npy", np.arange(4))
        self.expect(2, "", f"talcmp: {self.a}: has no array that --include and --exclude leave\n",
                    "--include=q", self.a, file)
        empty = self.save_archive("empty.npz")
        self.expect(2, "", f"talcmp: {empty}: holds no array\n", empty, file)
        self.expect(2, "", f"talcmp: {self.a}: has 2 arrays, and one is needed; choose one, such as "
                           f"{self.a}[x]\n", self.a, file)
        more = self.save_archive("more.npz", x=1, y=2, z=3)
        self.expect(2, "", f"talcmp: {more}: has 2 arrays, and one is needed; choose one, such as "
                           f"{more}[y]\n", "--exclude=x", more, file)

    def test_with_the_root(self):
        """Of files with groups, names may be written with the root or without it."""
        self.expect(0, "", "", f"{self.a}[/y]", f"{self.b}[/z]")
        self.expect(1, f"{self.a}[x] {self.b}[x] differ: [0]: 0 and 1 (different integers)\n"
                    + summary(different=1), "", self.a, self.b, "--include=/x")

    def test_of_pipes(self):
        """As a shell passes the output of a command by <(command)."""
        reading, writing = os.pipe()
        os.write(writing, read_bytes(self.a)) # less than a pipe holds
        os.close(writing)
        self.expect(0, "", "", f"/dev/fd/{reading}[y]", f"{self.b}[z]", pass_fds=[reading])
        os.close(reading)

    def test_that_are_not_there(self):
        self.expect(2, "", f"talcmp: {self.a}: has no array 'q'; it has x, y\n", f"{self.a}[q]",
                    self.b)
        many = self.save_archive("many.npz", **{f"m{i}": np.zeros(1) for i in range(7)})
        self.expect(2, "", f"talcmp: {many}: has no array 'q'; it has m0, m1, m2, m3, m4, ...\n",
                    f"{many}[q]", self.b)
        file = self.save("file.npy", np.arange(4))
        self.expect(2, "", f"talcmp: {file}: holds one array, without a name; leave out [x]\n",
                    f"{file}[x]", self.a)
        missing = self.path("missing.npz") + "[x]"
        self.expect(2, "", f"talcmp: {missing}: there is no such file; a pattern can be compared with "
                           "another one or with a folder\n", missing, self.a)

    def test_with_brackets_in_names(self):
        odd = self.save_archive("odd[1].npz", **{"m[2]": np.arange(4), "n": np.zeros(1)})
        self.expect(0, "", "", f"{odd}[m[2]]", f"{self.a}[y]")
        # A file of the whole name comes first.
        whole = self.save_archive("a.npz[y]", x=np.zeros(4))
        os.rename(whole + ".npz", whole)
        self.expect(1, f"{whole}[x] {self.b}[z] differ: [1]: 0 and 1 (zero is the same only as "
                       "zero)\n", "", whole, f"{self.b}[z]")


class StandardInput(Folder):
    def test_may_be_an_archive(self):
        a = self.save_archive("a.npz", x=np.arange(100000), y=np.zeros(3))
        b = self.save_archive("b.npz", np.savez_compressed, x=np.arange(100000), y=np.ones(3))
        y = "differ: [0]: 0 and 1 (zero is the same only as zero)\n"
        result = summary(same=1, different=1)
        self.expect(1, f"-[y] {b}[y] {y}" + result, "", "-", b, input=read_bytes(a))
        self.expect(0, "", "", f"{a}[x]", "-[x]", input=read_bytes(b))
        with subprocess.Popen(["sh", "-c", 'while read -r line; do :; done; sleep 0.1; cat "$1"', "sh",
                               a], stdin=subprocess.DEVNULL, stdout=subprocess.PIPE) as pipe:
            self.expect(1, f"-[y] {b}[y] {y}" + result, "", "-", b, stdin=pipe.stdout)
        self.expect(2, "", "talcmp: standard input: is a broken .npz archive: Not a zip archive; is "
                           "the file complete?\n", "-", b, input=read_bytes(a)[:-5])

    def test_is_only_one_operand(self):
        a = self.save("a.npy", [1])
        for operands in (("-", "-"), ("-[x]", "-"), ("-", a, "--ignore=-"), (a, "-[x]", "--ignore=-[y]")):
            self.expect(2, "", "talcmp: standard input can be only one of the arrays; see 'talcmp "
                               "--help'\n", *operands)

    def test_room_for_an_archive(self):
        a = self.save_archive("a.npz", x=np.arange(100000))
        missing = self.path("missing")
        self.expect(2, "", f"talcmp: {missing}: cannot take a temporary copy of the array; set TMPDIR "
                           "to a folder with room for it: No such file or directory\n", "-", a,
                    input=read_bytes(a), env={**os.environ, "TMPDIR": missing})


class CompressedFiles(Folder):
    def test_name_the_program_that_reads_them(self):
        a = self.save("a.npy", np.arange(10))
        packed = self.write("a.npy.gz", gzip.compress(read_bytes(a)))
        command = f"gzip -dc '{packed}' | talcmp - OTHER"
        message = f"is compressed by gzip; compare what this prints: {command}\n"
        self.expect(2, "", f"talcmp: {packed}: {message}", packed, a)
        shell = command.replace("talcmp - OTHER", "cat")
        contents = subprocess.run(["sh", "-c", shell], capture_output=True, check=True).stdout
        self.expect(0, "", "", "-", a, input=contents)
        self.expect(2, "", "talcmp: standard input: is compressed by gzip; compare what this prints: "
                           "gzip -dc | talcmp - OTHER\n", "-", a, input=read_bytes(packed))

    def test_of_other_programs(self):
        for beginning, name, command in ((b"BZh9", "bzip2", "bzip2 -dc"),
                                         (b"\xfd7zXZ\x00", "xz", "xz -dc"),
                                         (b"\x28\xb5\x2f\xfd", "zstd", "zstd -dc")):
            packed = self.write("packed", beginning + b" and so on")
            self.expect(2, "", f"talcmp: {packed}: is compressed by {name}; compare what this prints: "
                               f"{command} '{packed}' | talcmp - OTHER\n", packed, packed)


class MembersThatAreNoNumbers(Folder):
    def setUp(self):
        super().setUp()
        self.a = self.save_archive("a.npz", x=np.arange(3), text=np.array(["a"]))
        self.b = self.save_archive("b.npz", x=np.arange(3), text=np.array(["b"]))

    def test_are_trouble_once(self):
        self.expect(2, summary(same=1, trouble=1), f"talcmp: {self.a}[text]: {NO_NUMBERS}\n", self.a,
                    self.b)

    def test_are_left_out_by_name(self):
        self.expect(0, summary(same=1), "", self.a, self.b, "--exclude=text")

    def test_are_listed_when_they_are_skipped(self):
        skipped = (f"{self.a}[text] {self.b}[text] are skipped: {self.a}[text]: {NO_NUMBERS}\n"
                   + summary(same=1, rest=", 1 skipped"))
        self.expect(0, skipped, "", "--skip-others", self.a, self.b)
        self.expect(0, "", "", "-q", "--skip-others", self.a, self.b)
        document = document_of(run("--json", "--skip-others", self.a, self.b)[1])
        self.assertEqual(document["comparisons"][0],
                         {"result": "skipped", "names": [f"{self.a}[text]", f"{self.b}[text]"],
                          "message": f"{self.a}[text]: {NO_NUMBERS}"})
        self.assertEqual((document["summary"]["skipped"], document["exit_status"]), (1, 0))

    def test_are_a_difference_beside_numbers(self):
        """No run that skips others may call an array of numbers the same as a text."""
        numbers = self.save_archive("numbers.npz", x=np.arange(3), text=np.zeros(1))
        for operands in (self.a, numbers), (numbers, self.a):
            self.expect(2, summary(same=1, trouble=1), f"talcmp: {self.a}[text]: {NO_NUMBERS}\n",
                        "--skip-others", *operands)

    def test_are_missed_in_the_other(self):
        less = self.save_archive("less.npz", x=np.arange(3))
        self.expect(1, f"{self.a} {less} differ: only in {self.a}: text\n"
                    + summary(same=1, only_in_first=1), "", "--skip-others", self.a, less)


class FirstDifferences(Folder):
    def setUp(self):
        super().setUp()
        for i, (first, second) in enumerate(((0, 0), (1, 2), (3, 4), (5, 5))):
            self.save(f"one/{i}.npy", first)
            self.save(f"two/{i}.npy", second)
        self.one, self.two = self.path("one"), self.path("two")
        self.stopped = "; stopped at the first difference"

    def difference(self, name, values):
        return (f"{self.one}/{name} {self.two}/{name} differ: []: {values} (different integers)\n")

    def test_stop_the_run(self):
        self.expect(1, self.difference("1.npy", "1 and 2")
                    + summary(same=1, different=1, rest=self.stopped), "", "--first", self.one,
                    self.two)
        self.expect(1, "", "", "-q", "--first", self.one, self.two)
        document = document_of(run("--json", "--first", self.one, self.two)[1])
        self.assertEqual((len(document["comparisons"]), document["stopped"]), (2, True))

    def test_in_archives(self):
        a = self.save_archive("a.npz", w=1, x=2, y=3)
        b = self.save_archive("b.npz", w=1, x=3, y=4)
        self.expect(1, f"{a}[x] {b}[x] differ: []: 2 and 3 (different integers)\n"
                    + summary(same=1, different=1, rest=self.stopped), "", "--first", a, b)

    def test_are_also_what_only_one_has(self):
        self.save("two/0a.npy", 1)
        self.expect(1, f"{self.one} {self.two} differ: only in {self.two}: 0a.npy\n"
                    + summary(same=1, only_in_second=1, rest=self.stopped), "", "--first", self.one,
                    self.two)

    def test_do_not_hide_trouble_before_them(self):
        self.write("one/0.npy", b"")
        self.expect(2, self.difference("1.npy", "1 and 2")
                    + summary(different=1, trouble=1, rest=self.stopped),
                    f"talcmp: {self.one}/0.npy: is empty; an .npy file was expected\n", "--first",
                    self.one, self.two)


class FilesWithOtherEndings(Folder):
    def test_are_counted(self):
        self.save("one/a.npy", 1)
        self.save("two/a.npy", 1)
        one, two = self.path("one"), self.path("two")
        self.write("one/notes.txt", b"")
        self.expect(0, summary(same=1, rest="; 1 other file"), "", one, two)
        self.write("two/notes.txt", b"")
        self.write("two/sub/picture.png", b"")
        self.expect(0, summary(same=1, rest="; 2 other files"), "", one, two)
        self.expect(0, summary(same=1, rest="; 1 other file"), "", one, two, "--exclude=*.png")
        document = document_of(run("--json", one, two)[1])
        self.assertEqual(document["summary"]["other_files"], 2)


if __name__ == "__main__":
    run_tests()
