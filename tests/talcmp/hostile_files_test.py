#!/usr/bin/env python3
"""Files and folders that are not what they seem, and systems that lack what others have: talcmp says
so of what it concerns, compares the rest, and never says "the same" of what it has not seen."""

import os
import resource
import socket
import subprocess
import tempfile
import unittest
import zipfile

import numpy as np

from support.talcmp_command import COMMAND, run_tests


def run(*arguments, prefix=(), stdin=subprocess.DEVNULL, **options):
    """Returns the exit status, what is on standard output and what on standard error."""
    command = list(prefix) + COMMAND + [str(argument) for argument in arguments]
    done = subprocess.run(command, stdin=stdin, capture_output=True, check=False, timeout=60,
                          **options)
    return done.returncode, done.stdout.decode(), done.stderr.decode()


def read_bytes(path):
    with open(path, "rb") as file:
        return file.read()


def summary(same=0, different=0, only_in_first=0, only_in_second=0, trouble=0):
    return (f"{same} the same, {different} different, {only_in_first} only in the first, "
            f"{only_in_second} only in the second, {trouble} in trouble\n")


class Folder(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = folder.name

    def path(self, name):
        return os.path.join(self.folder, name)

    def save(self, name, array):
        os.makedirs(os.path.dirname(self.path(name)), exist_ok=True)
        np.save(self.path(name), array)
        return self.path(name)

    def link(self, name, target):
        os.makedirs(os.path.dirname(self.path(name)), exist_ok=True)
        os.symlink(target, self.path(name))

    def two_folders(self):
        """That hold a file which is the same."""
        self.save("one/a.npy", np.arange(3))
        self.save("two/a.npy", np.arange(3))
        return self.path("one"), self.path("two")

    def expect(self, status, output, errors, *arguments, **options):
        self.assertEqual(run(*arguments, **options), (status, output, errors))


class StandardDescriptors(Folder):
    """Closed by whoever starts talcmp: no file may take the place of one."""

    def closed(self, redirection, *arguments):
        script = f'exec "$@" {redirection}'
        return run(*arguments, prefix=["sh", "-c", script, "sh"])

    def test_closed_input_is_trouble(self):
        path = self.save("a.npy", np.arange(3))
        trouble = (2, "", "talcmp: standard input: cannot be read: Bad file descriptor\n")
        self.assertEqual(self.closed("<&-", "-v", "-", path), trouble)
        self.assertEqual(self.closed("<&-", "-v", path, "-"), trouble)

    def test_closed_output_is_trouble_where_there_is_an_answer(self):
        one, two = self.save("a.npy", np.arange(3)), self.save("b.npy", np.ones(3))
        self.assertEqual(self.closed(">&-", one, two),
                         (2, "", "talcmp: standard output: cannot be written\n"))
        self.assertEqual(self.closed("<&- >&-", one, one), (0, "", ""))

    def test_closed_errors_are_written_to_no_file(self):
        one, two = self.save("a.npy", np.arange(3)), self.save("b.npy", np.arange(4))
        before = read_bytes(one), read_bytes(two)
        self.assertEqual(self.closed("2>&-", one, self.path("c.npy")), (2, "", ""))
        self.assertEqual(self.closed("<&- 2>&-", one, two)[0], 1)
        self.assertEqual((read_bytes(one), read_bytes(two)), before)


class LinkedFolders(Folder):
    def test_are_followed(self):
        one, two = self.two_folders()
        self.save("one/sub/b.npy", np.zeros(2))
        self.save("elsewhere/b.npy", np.ones(2))
        self.link("two/sub", "../elsewhere")
        self.expect(1, f"{one}/a.npy {two}/a.npy are the same\n"
                       f"{one}/sub/b.npy {two}/sub/b.npy differ: [0]: 0 and 1 "
                       "(zero is the same only as zero)\n" + summary(same=1, different=1), "",
                    one, two)

    def test_are_followed_under_each_name(self):
        one, two = self.two_folders()
        self.save("elsewhere/b.npy", np.ones(2))
        for name in ("one/first", "one/second", "two/first", "two/second"):
            self.link(name, "../elsewhere")
        self.expect(0, f"{one}/a.npy {two}/a.npy are the same\n"
                       f"{one}/first/b.npy {two}/first/b.npy are the same\n"
                       f"{one}/second/b.npy {two}/second/b.npy are the same\n" + summary(same=3),
                    "", one, two)

    def test_loops_are_trouble_and_the_rest_is_compared(self):
        one, two = self.two_folders()
        self.save("two/sub/b.npy", np.ones(2))
        self.save("one/sub/b.npy", np.ones(2))
        self.link("one/sub/up", "..")
        same = (f"{one}/a.npy {two}/a.npy are the same\n"
                f"{one}/sub/b.npy {two}/sub/b.npy are the same\n")
        self.expect(2, same + summary(same=2, trouble=1),
                    f"talcmp: {one}/sub/up: is a link to a folder that it is in; leave it out by "
                    "--exclude\n", one, two)
        self.expect(0, same + summary(same=2), "", one, two, "--exclude=sub/up")

    def test_links_that_lead_nowhere_are_trouble(self):
        one, two = self.two_folders()
        self.link("one/l", "l")
        self.link("two/lost.d", "nowhere")
        # What is below the name in the other folder cannot be said to be missing.
        self.save("two/l/b.npy", np.ones(2))
        self.save("two/l.npy", np.ones(2))
        self.expect(2, f"{one}/a.npy {two}/a.npy are the same\n"
                       f"{one} {two} differ: only in {two}: l.npy\n"
                    + summary(same=1, only_in_second=1, trouble=2),
                    f"talcmp: {one}/l: cannot be followed: Too many levels of symbolic links\n"
                    f"talcmp: {two}/lost.d: cannot be followed: No such file or directory\n",
                    one, two)


class FoldersThatCannotBeRead(Folder):
    def setUp(self):
        super().setUp()
        # As root without what makes permissions mean nothing.
        self.prefix = ["setpriv", "--bounding-set=-dac_override,-dac_read_search"]
        self.prefix = self.prefix if os.geteuid() == 0 else []

    def lock(self, path, mode):
        self.addCleanup(os.chmod, path, 0o700)
        os.chmod(path, mode)

    def test_subfolder(self):
        one, two = self.two_folders()
        self.save("one/locked/b.npy", np.ones(2))
        self.save("two/locked/b.npy", np.ones(2))
        self.lock(one + "/locked", 0)
        self.expect(2, f"{one}/a.npy {two}/a.npy are the same\n" + summary(same=1, trouble=1),
                    f"talcmp: {one}/locked: cannot be read: Permission denied\n", one, two,
                    prefix=self.prefix)

    def test_subfolder_whose_names_alone_can_be_read(self):
        one, two = self.two_folders()
        self.save("one/names/b.npy", np.ones(2))
        self.save("two/names/b.npy", np.ones(2))
        self.lock(one + "/names", 0o400)
        self.expect(2, f"{one}/a.npy {two}/a.npy are the same\n" + summary(same=1, trouble=1),
                    f"talcmp: {one}/names/b.npy: cannot be followed: Permission denied\n", one, two,
                    prefix=self.prefix)

    def test_folder_of_a_pattern(self):
        one, two = self.two_folders()
        self.lock(one, 0)
        self.expect(2, "", f"talcmp: {self.folder}/*/*.npy: cannot be matched: one of its folders "
                           "cannot be read\n", self.folder + "/*/*.npy", two,
                    prefix=self.prefix)

    def test_operand(self):
        one, two = self.two_folders()
        self.lock(one, 0)
        self.expect(2, "", f"talcmp: {one}: cannot be read: Permission denied\n", one, two,
                    prefix=self.prefix)


class NoRegularFiles(Folder):
    """Nobody ever writes to the pipes."""

    def setUp(self):
        super().setUp()
        self.two_folders()
        os.mkfifo(self.path("one/p.npy"))
        self.save("two/p.npy", np.ones(2))

    what = "is no regular file; leave it out by --exclude, or compare it by itself\n"

    def test_in_folders(self):
        one, two = self.path("one"), self.path("two")
        with socket.socket(socket.AF_UNIX) as unix:
            before = os.getcwd()
            os.chdir(two)  # as names of sockets have to be short
            unix.bind("s.npy")
            os.chdir(before)
        self.expect(2, f"{one}/a.npy {two}/a.npy are the same\n" + summary(same=1, trouble=2),
                    f"talcmp: {one}/p.npy: {self.what}talcmp: {two}/s.npy: {self.what}", one, two)

    def test_in_both_folders(self):
        one, two = self.path("one"), self.path("two")
        os.remove(f"{two}/p.npy")
        os.mkfifo(f"{two}/p.npy")
        self.expect(2, f"{one}/a.npy {two}/a.npy are the same\n" + summary(same=1, trouble=1),
                    f"talcmp: {one}/p.npy: {self.what}", one, two)

    def test_of_patterns(self):
        one, two = self.path("one"), self.path("two")
        self.expect(2, f"{one}/a.npy {two}/a.npy are the same\n" + summary(same=1, trouble=1),
                    f"talcmp: {one}/p.npy: {self.what}", one + "/*.npy", two + "/*.npy")

    def test_found_by_the_name_of_a_file(self):
        one, two = self.path("one"), self.path("two")
        self.expect(2, "", f"talcmp: {one}/p.npy: {self.what}", one, two + "/p.npy")

    def test_device(self):
        self.expect(2, "", "talcmp: /dev/null: is neither a file nor a pipe; save the array to a "
                           "file first\n", "/dev/null", self.path("one/a.npy"))


class FilesOfOneName(Folder):
    def test_that_a_pattern_matches_are_trouble(self):
        self.two_folders()
        pattern, one, two = self.path("*/a.npy"), self.path("one"), self.path("two")
        self.expect(2, "", f"talcmp: {pattern}: matches two files of one name, {one}/a.npy and "
                    f"{two}/a.npy; files are matched by name\n", pattern, two + "/*.npy")


class DamagedArchives(Folder):
    """A member is read to its end before a difference is believed."""

    def setUp(self):
        super().setUp()
        self.good = self.path("good.npz")
        self.bad = self.path("bad.npz")
        self.values = np.arange(100000.0)

    def damage(self, save, damaged):
        """Saves the values, and beside it what `damaged` makes of the bytes of the archive."""
        save(self.good, x=self.values)
        before = read_bytes(self.good)
        after = damaged(before)
        flipped = [one ^ other for one, other in zip(before, after) if one != other]
        self.assertEqual([bin(bits).count("1") for bits in flipped], [1])
        with open(self.bad, "wb") as file:
            file.write(after)

    def expect_damage(self, *options):
        errors = f"talcmp: {self.bad}[x]: cannot be read: CRC error; is the archive damaged?\n"
        for option in options or ("-n1", "-q", "--slice=0:5", "--slice=::3", "--report"):
            self.expect(2, "", errors, option, self.good, self.bad)
            self.expect(2, "", errors, option, self.bad, self.good)

    def test_element(self):
        first = np.float64(1).tobytes()
        self.damage(np.savez, lambda bytes_: bytes_.replace(first, first[:-1] + b"\x3e", 1))
        self.expect_damage()

    def test_last_element(self):
        last = self.values[-1].tobytes()
        self.damage(np.savez, lambda bytes_: bytes_.replace(last, b"\x01" + last[1:], 1))
        self.expect_damage()

    def test_compressed_element(self):
        self.damage(np.savez_compressed,
                    lambda bytes_: bytes_[:4000] + bytes([bytes_[4000] ^ 1]) + bytes_[4001:])
        self.expect_damage()

    def test_shape(self):
        self.values = np.zeros((0, 3))
        self.damage(np.savez, lambda bytes_: bytes_.replace(b"(0, 3)", b"(0, 1)"))
        self.expect_damage("-n1", "-q", "--slice=:,0", "--report")

    def test_byte_order(self):
        self.damage(np.savez, lambda bytes_: bytes_.replace(b"<f8", b">f8"))
        self.expect_damage()

    def test_difference_without_damage(self):
        np.savez(self.good, x=self.values)
        np.savez(self.bad, x=self.values + 1)
        self.expect(1, f"{self.good}[x] {self.bad}[x] differ: [0]: 0 and 1 (zero is the same only "
                       "as zero)\n", "", self.good, self.bad)


class LongNames(Folder):
    def test_of_members_are_shortened_in_messages(self):
        one, two = self.path("one.npz"), self.path("two.npz")
        name = "x" * 65000
        np.savez(one, **{name: np.arange(3)})
        np.savez(two, **{name: np.arange(3) + 1})
        names = [(path + "[" + name)[:700] + " [...] " + "x" * 249 + "]" for path in (one, two)]
        self.expect(1, f"{names[0]} {names[1]} differ: [0]: 0 and 1 (different integers)\n", "",
                    one, two)
        self.assertIn(f'"name": "{one}[{name}]"', run("--json", one, two)[1])
        np.savez(two, y=np.arange(3))
        self.expect(1, f"{one} {two} differ: only in {one}: " + "x" * 700 + " [...] " + "x" * 250
                    + f"\n{one} {two} differ: only in {two}: y\n", "", one, two)


class EntriesOfFolders(Folder):
    def test_are_no_arrays(self):
        path = self.save("g/x.npy", np.arange(3.0))
        archive = self.path("recursive.npz")
        with zipfile.ZipFile(archive, "w") as file:  # as zip -r writes it
            file.writestr("g/", b"")
            file.write(path, "g/x.npy")
        flat = self.path("flat.npz")
        np.savez(flat, **{"g/x": np.arange(3.0)})
        self.expect(0, f"{archive}[g/x] {flat}[g/x] are the same\n", "", "-v", archive, flat)
        self.expect(0, f"{archive}[g/x] {path} are the same\n", "", "-v", archive, path)


class PipesAndFiles(Folder):
    """The same bytes have the same answer from both."""

    def expect_status(self, status, contents, other, *options):
        file = self.path("contents.npy")
        with open(file, "wb") as written:
            written.write(contents)
        self.assertEqual(run(*options, file, other)[0], status)
        cat = subprocess.Popen(["cat", file], stdout=subprocess.PIPE)
        self.assertEqual(run(*options, "-", other, stdin=cat.stdout)[0], status)
        cat.stdout.close()
        cat.wait()

    def test_of_other_lengths_than_their_headers_say(self):
        other = self.save("other.npy", np.zeros(3))
        empty = self.save("empty.npy", np.zeros((0, 2)))
        whole = read_bytes(self.save("whole.npy", np.ones(100000)))
        nothing = read_bytes(empty)
        for options in ((), ("-q",), ("--slice=:1",)):
            self.expect_status(1, whole, other, *options)
            self.expect_status(2, whole[:-1], other, *options)
            self.expect_status(2, whole[:200], other, *options)
            self.expect_status(2, whole + b"x", other, *options)
            self.expect_status(2, whole[:-1], self.path("whole.npy"), *options)
        self.expect_status(0, nothing, empty)
        self.expect_status(2, nothing + b"x", empty)


class LittleRoom(Folder):
    def limited(self, limits, *arguments, **options):
        def limit():
            for which, most in limits.items():
                resource.setrlimit(which, (most, most))
        return run(*arguments, preexec_fn=limit, **options)

    def test_memory(self):
        limits = {resource.RLIMIT_AS: 100 * 2**20}
        if self.limited(limits, "--version")[0] != 0:
            self.skipTest("NOT TESTED: this build does not start with so little memory")
        one, two = self.two_folders()
        self.save("one/b.npy", np.zeros(3000000, "i1"))
        self.save("two/b.npy", np.ones(3000000, "i1"))
        self.assertEqual(self.limited(limits, "--threads=1", "-n1000000", one, two), (
            2, f"{one}/a.npy {two}/a.npy are the same\n" + summary(same=1, trouble=1),
            f"talcmp: {one}/b.npy: there is not enough memory to compare it with {two}/b.npy: "
            "524288 bytes for pieces of both, up to 48000000 for differences; fewer --threads and "
            "--max-differences take less\n"))

    def test_temporary_copy(self):
        values = np.arange(100000.0).reshape(500, 200)
        path = self.save("f.npy", np.asfortranarray(values))
        with open(self.save("c.npy", values), "rb") as file:
            self.assertEqual(
                self.limited({resource.RLIMIT_FSIZE: 100000}, "-", path, stdin=file,
                             env={**os.environ, "TMPDIR": self.folder}),
                (2, "", f"talcmp: {self.folder}: cannot take a temporary copy of the array; set "
                        "TMPDIR to a folder with room for it: File too large\n"))
        self.assertEqual(sorted(os.listdir(self.folder)), ["c.npy", "f.npy"])


if __name__ == "__main__":
    run_tests()
