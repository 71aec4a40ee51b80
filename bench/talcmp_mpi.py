#!/usr/bin/python3
"""Measures talcmp-mpi on this machine, next to talcmp: talcmp_mpi.py PROGRAMS BENCHMARKS [--quick].

PROGRAMS is the folder of talcmp and talcmp-mpi, BENCHMARKS that of mpi_counter and of the library
that is preloaded to take the time. Prints, as JSON, seconds on files in the cache of the system,
messages, memory, how long a run takes to start, and how much is read after a difference was found.
"""

import functools
import json
import os
import re
import shutil
import statistics
import subprocess
import sys
import tempfile
import time
import zipfile
from dataclasses import asdict, dataclass
from pathlib import Path

import numpy as np

from commands_in_turns import in_another_process, in_turns
from talcmp_peers import changed, random_doubles, save_chunked, smooth_doubles

BOX = 1 << 18  # bytes of each array
MANY = 16  # ranks, more than there are processors

# As if the ranks were on two machines without a better network.
OVER_TCP = ("--mca", "pml", "ob1", "--mca", "btl", "self,tcp", "--mca", "osc", "pt2pt")

# Open MPI asks whether this is meant.
ROOT_MAY = {"OMPI_ALLOW_RUN_AS_ROOT": "1", "OMPI_ALLOW_RUN_AS_ROOT_CONFIRM": "1"}
ENVIRONMENT = {**os.environ, **(ROOT_MAY if os.geteuid() == 0 else {})}


@dataclass(frozen=True)
class Setting:
    programs: Path
    benchmarks: Path
    quick: bool

    @property
    def repetitions(self):
        return 1 if self.quick else 7

    @property
    def elements(self):
        """Of the largest arrays: 4096 boxes."""
        return 1 << (19 if self.quick else 27)

    @property
    def many(self):
        return 3 if self.quick else MANY

    def talcmp(self, *arguments):
        return [str(self.programs / "talcmp"), *arguments]

    def talcmp_mpi(self, *arguments):
        return [str(self.programs / "talcmp-mpi"), *arguments]


def mpirun(ranks, *words):
    """What comes before a command to run it on so many ranks of this machine."""
    fits = ranks <= os.cpu_count()
    place = ["--bind-to", "core"] if fits else ["--bind-to", "none", "--oversubscribe"]
    return ["mpirun", "-n", str(ranks), *place, *words]


def run(command):
    subprocess.run(command, check=True, env=ENVIRONMENT, stdout=subprocess.DEVNULL)


# ---- What is in the files


def save_pair(folder, count):
    """Doubles, a copy of them, and some that differ in a few digits."""
    for name in ("one", "same", "near"):
        np.save(folder / f"{name}.npy", changed(random_doubles(count), name))


def save_members(folder, count):
    """Eight compressed members; what they hold matters less than that it can be compressed."""
    members = np.split(smooth_doubles(count), 8)
    with zipfile.ZipFile(folder / "one.npz", "w", zipfile.ZIP_DEFLATED, compresslevel=1) as archive:
        for i, member in enumerate(members):
            with archive.open(f"x{i}.npy", "w") as file:
                np.save(file, member)
    shutil.copy(folder / "one.npz", folder / "same.npz")


def save_chunks(folder, count):
    save_chunked(folder / "one.h5", smooth_doubles(count))
    shutil.copy(folder / "one.h5", folder / "same.h5")


def save_small(folder, count):
    """Two folders of that many arrays."""
    for name in ("one", "same"):
        (folder / name).mkdir()
    for i in range(count):
        np.save(folder / "one" / f"{i}.npy", random_doubles(1 << 15) + i)
        shutil.copy(folder / "one" / f"{i}.npy", folder / "same" / f"{i}.npy")


def save_tiny(folder):
    for name in ("tiny_one", "tiny_same"):
        np.save(folder / f"{name}.npy", np.arange(4.0))


def save_sparse(folder, count):
    """Doubles that take no room on the disk; the first one differs."""
    for value, name in enumerate(("sparse_one", "sparse_other")):
        array = np.lib.format.open_memmap(folder / f"{name}.npy", "w+", "f8", (count,))
        array[0] = value


# ---- Seconds


@dataclass(frozen=True)
class Case:
    files: str
    workload: str
    options: tuple
    first: str
    second: str
    bytes: int  # of the elements of one file
    share: float = 1  # of these that are in the file


def cases_of(setting, folder):
    whole, part = 8 * setting.elements, 2 * setting.elements

    def share(name):
        return (folder / name).stat().st_size / part

    npy = (".npy", "one.npy", "same.npy", "near.npy")
    return [
        Case(npy[0], "identical", (), npy[1], npy[2], whole),
        Case(npy[0], "near", ("--tol", "20"), npy[1], npy[3], whole),
        Case(npy[0], "near, report", ("--tol", "20", "--report"), npy[1], npy[3], whole),
        Case("HDF5, chunks, shuffle, gzip", "identical", (), "one.h5", "same.h5", part,
             share("one.h5")),
        Case(".npz, 8 compressed members", "identical", (), "one.npz", "same.npz", part,
             share("one.npz")),
        Case(f"{small_count(setting)} .npy of 256 KiB", "identical", (), "one", "same",
             small_count(setting) << 18),
    ]


def small_count(setting):
    return 10 if setting.quick else 400


def seconds_of(command):
    begin = time.perf_counter()
    run(command)
    return time.perf_counter() - begin


def seconds_of_ranks(setting, ranks, folder, words, command):
    """Those of the whole command, and those between starting the ranks and ending them."""
    inside = folder / "seconds"
    library = setting.benchmarks.resolve() / "libmpi_seconds.so"
    whole = seconds_of([*mpirun(ranks, "-x", f"MPI_SECONDS={inside}", "-x", f"LD_PRELOAD={library}",
                                *words), *command])
    return whole, float(inside.read_text(encoding="utf-8"))


def calls_of(setting, folder, case):
    arguments = [*case.options, str(folder / case.first), str(folder / case.second)]
    one_thread = ["--threads", "1", *arguments]
    calls = {
        # On one processor, as a rank is; some files are otherwise read ahead on another one.
        "talcmp --threads 1": functools.partial(
            seconds_of, ["taskset", "--cpu-list", "0", *setting.talcmp(*one_thread)]),
        "talcmp": functools.partial(seconds_of, setting.talcmp(*arguments)),
    }
    for name, ranks, words in (("one rank", 1, ()), ("two ranks", 2, ()),
                               ("two ranks, TCP", 2, OVER_TCP)):
        calls[name] = functools.partial(seconds_of_ranks, setting, ranks, folder, words,
                                        setting.talcmp_mpi(*one_thread))
    return calls


def shortest_and_median(seconds, name=""):
    return {f"{name}seconds": min(seconds), f"{name}median": statistics.median(seconds)}


def command_row(name, returned):
    """Seconds of the whole command and, if it has ranks, those inside."""
    if isinstance(returned[0], float):
        return {"name": name, **shortest_and_median(returned)}
    whole, inside = zip(*returned)
    return {"name": name, **shortest_and_median(whole), **shortest_and_median(inside, "inside_")}


def case_rows(setting, folder):
    cases = cases_of(setting, folder)
    calls = {(i, name): call for i, case in enumerate(cases)
             for name, call in calls_of(setting, folder, case).items()}
    returned = in_turns(calls, setting.repetitions)
    for i, case in enumerate(cases):
        yield {"files": case.files, "workload": case.workload, "bytes": case.bytes,
               "share": case.share,
               "commands": [command_row(name, seconds) for (of, name), seconds in returned.items()
                            if of == i]}


# ---- Starting


def start_rows(setting, folder):
    tiny = [str(folder / "tiny_one.npy"), str(folder / "tiny_same.npy")]
    ranks = setting.talcmp_mpi(*tiny)
    calls = {
        "talcmp": functools.partial(seconds_of, setting.talcmp(*tiny)),
        "talcmp-mpi": functools.partial(seconds_of, ranks),
    }
    for count, words in ((1, ()), (2, ()), (2, OVER_TCP), (setting.many, ())):
        calls[f"mpirun -n {count} talcmp-mpi" + (", TCP" if words else "")] = functools.partial(
            seconds_of_ranks, setting, count, folder, words, ranks)
    for name, returned in in_turns(calls, setting.repetitions).items():
        yield command_row(name, returned)


def counter_nanoseconds(setting, words):
    """Of a fetch-and-add, by how many microseconds rank 0 is busy between two looks."""
    quick = ["--quick"] if setting.quick else []
    command = [*mpirun(2, *words), str(setting.benchmarks / "mpi_counter"), *quick]
    output = subprocess.run(command, check=True, env=ENVIRONMENT, stdout=subprocess.PIPE).stdout
    return {row["work"]: row["nanoseconds"] for row in json.loads(output)}


def counter_rows(setting):
    calls = {how: functools.partial(counter_nanoseconds, setting, words)
             for how, words in (("shared memory", ()), ("TCP", OVER_TCP))}
    for how, returned in in_turns(calls, setting.repetitions).items():
        for work in returned[0]:
            yield {"how": how, "work": work, "nanoseconds": min(one[work] for one in returned)}


# ---- Messages

# What Open MPI's monitoring writes: of one rank to another, messages of the program itself,
# messages that Open MPI sends for collective calls and to make windows, one-sided operations; then,
# for each communicator, calls in which one rank sends to all or all send to one.
CHANNEL = re.compile(r"^(?P<kind>[EIS])\t\d+\t\d+\t(?P<bytes>\d+) bytes\t(?P<count>\d+) msgs sent",
                     re.MULTILINE)
CALLS = re.compile(r"^D\tMPI_COMM_WORLD\t.*\n"
                   r"O2A\t\d+\t(\d+) bytes\t(\d+) msgs sent\n"
                   r"A2O\t\d+\t(\d+) bytes\t(\d+) msgs sent", re.MULTILINE)
KINDS = {"E": "point to point", "I": "Open MPI's own", "S": "one-sided operations"}
CALLS_TO_ALL = "broadcasts and reductions"


@dataclass
class Sent:
    messages: int = 0
    bytes: int = 0
    most: int = 0  # bytes from one rank to another, so that no message is larger

    def add(self, messages, size):
        self.messages += messages
        self.bytes += size
        self.most = max(self.most, size)


def messages_of(setting, folder, arguments):
    """What all ranks send, by kind."""
    profile = Path(tempfile.mkdtemp(dir=folder)) / "rank"
    monitoring = ("--mca", "pml_monitoring_enable", "2", "--mca", "pml_monitoring_enable_output",
                  "3", "--mca", "pml_monitoring_filename", str(profile))
    run([*mpirun(setting.many, *monitoring), *setting.talcmp_mpi(*arguments)])
    files = list(profile.parent.glob("rank.*.prof"))
    assert len(files) == setting.many, f"{len(files)} files of messages"
    sums = {kind: Sent() for kind in (*KINDS.values(), CALLS_TO_ALL)}
    others = setting.many - 1
    for text in (file.read_text(encoding="utf-8") for file in files):
        for found in CHANNEL.finditer(text):
            sums[KINDS[found["kind"]]].add(int(found["count"]), int(found["bytes"]))
        to_all, calls_to_all, to_one, calls_to_one = map(int, CALLS.search(text).groups())
        sums[CALLS_TO_ALL].add(others * (calls_to_all + calls_to_one), to_all + to_one)
    sums[CALLS_TO_ALL].most = 0
    # These are the messages of the calls too.
    sums[KINDS["I"]].messages -= sums[CALLS_TO_ALL].messages
    sums[KINDS["I"]].bytes -= sums[CALLS_TO_ALL].bytes
    return {kind: asdict(sent) for kind, sent in sums.items()}


def message_rows(setting, folder):
    pair = [str(folder / name) for name in ("one.npy", "near.npy")]
    tiny = [str(folder / name) for name in ("tiny_one.npy", "tiny_same.npy")]
    boxes = 8 * setting.elements // BOX
    runs = {"tiny": (0, tiny), "no report": (boxes, ["--tol", "20", *pair]),
            "report": (boxes, ["--tol", "20", "--report", *pair])}
    for name, (boxes_of_run, arguments) in runs.items():
        yield {"run": name, "ranks": setting.many, "boxes": boxes_of_run,
               "kinds": messages_of(setting, folder, arguments)}


def merge_bytes(rows):
    """What a rank sends at its end, with a report."""
    return next(row["kinds"][KINDS["E"]]["most"] for row in rows if row["run"] == "report")


# ---- Memory


def children_of(pid):
    """All processes below one."""
    try:
        text = Path(f"/proc/{pid}/task/{pid}/children").read_text(encoding="ascii")
    except OSError:
        return []
    children = [int(word) for word in text.split()]
    return children + [below for child in children for below in children_of(child)]


def number_in(path, name):
    """In bytes; 0 if the process has ended."""
    try:
        found = re.search(rf"^{name}:\s+(\d+) kB", Path(path).read_text(encoding="ascii"),
                          re.MULTILINE)
    except OSError:
        return 0
    return 1024 * int(found.group(1)) if found else 0


def is_rank(pid):
    try:
        return os.readlink(f"/proc/{pid}/exe").endswith("talcmp-mpi")
    except OSError:
        return False


def memory_of_ranks(command):
    """The most that any process of talcmp-mpi had, resident and its own: without what is shared
    with other ranks and without the text of libraries."""
    most = {"resident": 0, "private": 0}
    with subprocess.Popen(command, env=ENVIRONMENT, stdout=subprocess.DEVNULL) as process:
        while process.poll() is None:
            for pid in filter(is_rank, children_of(process.pid)):
                most["resident"] = max(most["resident"], number_in(f"/proc/{pid}/status", "VmHWM"))
                most["private"] = max(most["private"],
                                      number_in(f"/proc/{pid}/smaps_rollup", "Anonymous"))
            time.sleep(0.002)
    if process.returncode != 0:
        raise subprocess.CalledProcessError(process.returncode, command)
    return most


def memory_rows(setting, folder):
    for files, pair in ((".npy", ("one.npy", "near.npy")),
                        ("HDF5, chunks, shuffle, gzip", ("one.h5", "same.h5"))):
        for report in (False, True):
            arguments = ["--tol", "20", *(["--report"] if report else []),
                         *(str(folder / name) for name in pair)]
            for ranks in (1, 2, setting.many):
                yield {"files": files, "report": report, "ranks": ranks,
                       **memory_of_ranks([*mpirun(ranks), *setting.talcmp_mpi(*arguments)])}


# ---- The end after a difference


def bytes_read(setting, folder, ranks, names):
    """By all ranks, counted by the system."""
    counts = Path(tempfile.mkdtemp(dir=folder))
    script = '"$@"; s=$?; cat /proc/$$/io >"$0/$OMPI_COMM_WORLD_RANK"; test $s -le 1'
    arguments = [str(folder / name) for name in names]
    run([*mpirun(ranks), "sh", "-c", script, str(counts),
         *setting.talcmp_mpi("--threads", "1", *arguments)])
    files = list(counts.iterdir())
    assert len(files) == ranks, f"{len(files)} counts of what was read"
    return sum(int(re.search(r"^rchar: (\d+)", file.read_text(encoding="ascii")).group(1))
               for file in files)


def end_rows(setting, folder):
    """Boxes read of arrays whose first elements differ, all bytes beyond those of tiny arrays."""
    for ranks in (2, setting.many):
        before = bytes_read(setting, folder, ranks, ("tiny_one.npy", "tiny_same.npy"))
        read = bytes_read(setting, folder, ranks, ("sparse_one.npy", "sparse_other.npy"))
        yield {"ranks": ranks, "bytes": read - before, "boxes": (read - before) / (2 * BOX)}


# ---- All of it


def what_is_missing(setting):
    if not shutil.which("mpirun"):
        return "there is no mpirun"
    if not (setting.programs / "talcmp-mpi").exists():
        return "talcmp-mpi was not built"
    return None


def main():
    programs, benchmarks = map(Path, sys.argv[1:3])
    setting = Setting(programs, benchmarks, "--quick" in sys.argv)
    missing = what_is_missing(setting)
    if missing:
        print(f"talcmp_mpi: left out, as {missing}", file=sys.stderr)
        print(json.dumps({"left_out": missing}))
        return
    with tempfile.TemporaryDirectory() as name:
        folder = Path(name)
        in_another_process(save_pair, folder, setting.elements)
        in_another_process(save_members, folder, setting.elements // 4)
        in_another_process(save_chunks, folder, setting.elements // 4)
        in_another_process(save_small, folder, small_count(setting))
        in_another_process(save_tiny, folder)
        in_another_process(save_sparse, folder, 1 << 33)
        load_before = os.getloadavg()[0]
        results = {
            "left_out": None,
            "processors": os.cpu_count(),
            "cases": list(case_rows(setting, folder)),
            "start": list(start_rows(setting, folder)),
            "counter": list(counter_rows(setting)),
        }
        # That of these commands themselves is about 1.
        results["load"] = [load_before, os.getloadavg()[0]]
        messages = list(message_rows(setting, folder))
        print(json.dumps({
            **results,
            "messages": messages,
            "merge_bytes": merge_bytes(messages),
            "memory": list(memory_rows(setting, folder)),
            "ends": list(end_rows(setting, folder)),
        }))


if __name__ == "__main__":
    main()
