#!/usr/bin/python3
"""Times talcmp on files in the cache of the system, next to h5diff, cdfdiff, cmp and NumPy, each on
files that it reads: talcmp_peers.py TALCMP [--quick]. Prints seconds and the greatest resident
memory of each, after both have called other files different."""

import importlib.util
import json
import os
import shutil
import subprocess
import sys
import tempfile
from dataclasses import dataclass
from typing import Callable

import numpy as np

from commands_in_turns import in_another_process, measured_in_turns

PACKAGES_OF_PROGRAMS = {"cmp": "diffutils", "h5diff": "hdf5-tools", "cdfdiff": "pnetcdf-bin"}
PACKAGES_OF_MODULES = {"h5py": "python3-h5py", "netCDF4": "python3-netcdf4"}

# Prints the seconds of loading and comparing, without those in which Python and NumPy begin.
ARRAY_EQUAL = """
import sys, time
import numpy as np
begin = time.perf_counter()
same = np.array_equal(np.load(sys.argv[1])["x"], np.load(sys.argv[2]))
print(time.perf_counter() - begin)
sys.exit(not same)
"""


# ---- What is in the files


def random_doubles(count):
    return np.random.default_rng(20261123).random(count) + 0.5


def smooth_doubles(count):
    """A wave with noise, rounded to ten binary places, as measured values are."""
    noise = np.random.default_rng(20261123).standard_normal(count)
    return np.round((280 + 20 * np.sin(np.arange(count) / 1000) + noise / 4) * 1024) / 1024


def changed(values, name):
    """Near values have relative errors below 1e-12, a far one has 1e-9; others do not change."""
    if name == "near":
        noise = np.random.default_rng(20261124).standard_normal(len(values))
        return values * (1 + noise * 2.0**-46)
    if name == "far":
        values[-1] *= 1 + 1e-9
    return values


# Only the process that writes imports what these need.


def save_numpy(path, values):
    if path.endswith(".npz"):
        np.savez(path, x=values)
    else:
        np.save(path, values)


def save_contiguous(path, values):
    import h5py
    with h5py.File(path, "w") as file:
        file["x"] = values


def save_chunked(path, values):
    import h5py
    with h5py.File(path, "w") as file:
        # The library's cache has room for two such chunks.
        file.create_dataset("x", data=values, chunks=(1 << 16,), compression="gzip", shuffle=True)


def save_netcdf(path, values):
    import netCDF4
    with netCDF4.Dataset(path, "w", format="NETCDF3_64BIT_OFFSET") as file:
        file.createDimension("n", len(values))
        file.createVariable("x", "f8", ("n",))[:] = values


# ---- What is compared


@dataclass(frozen=True)
class Question:
    workload: str  # identical or near, as the second file is called
    options: tuple  # of talcmp
    peer: tuple  # the command without the files
    peer_name: str = None


@dataclass(frozen=True)
class Case:
    files: str
    elements: int
    values: Callable
    save: Callable
    endings: tuple  # of the first file and the second
    questions: tuple


CASES = (
    Case("HDF5, contiguous", 1 << 27, random_doubles, save_contiguous, (".h5", ".h5"), (
        Question("identical", (), ("h5diff",)),
        Question("near", ("--relative", "1e-10"), ("h5diff", "-p", "1e-10")),
    )),
    Case("HDF5, chunks, shuffle, gzip", 1 << 24, smooth_doubles, save_chunked, (".h5", ".h5"), (
        Question("identical", (), ("h5diff",)),
    )),
    Case("netCDF, 64-bit offsets", 1 << 27, random_doubles, save_netcdf, (".nc", ".nc"), (
        Question("identical", (), ("cdfdiff",)),
        Question("near", ("--relative", "1e-10"), ("cdfdiff", "-t", "0,1e-10")),
    )),
    Case("stored .npz", 1 << 27, random_doubles, save_numpy, (".npz", ".npz"), (
        Question("identical", (), ("cmp",)),
    )),
    Case("stored .npz and .npy", 1 << 27, random_doubles, save_numpy, (".npz", ".npy"), (
        Question("identical", (), (sys.executable, "-c", ARRAY_EQUAL),
                 "NumPy load and array_equal"),
    )),
)


def path_of(folder, case, name):
    return os.path.join(folder, name + case.endings[name != "one"])


def save_files(folder, case, count, names):
    for name in names:
        case.save(path_of(folder, case, name), changed(case.values(count), name))


def member(path):
    return path + "[x]" if path.endswith(".npz") else path


def commands_of(talcmp, folder, case, question, second):
    """What asks talcmp and its peer, by name."""
    paths = [path_of(folder, case, name) for name in ("one", second)]
    return {
        " ".join(("talcmp", *question.options)): [talcmp, *question.options, *map(member, paths)],
        question.peer_name or " ".join(question.peer): [*question.peer, *paths],
    }


def check_far_differs(talcmp, folder, case):
    """Under the same options, so that neither tolerates more than it should."""
    in_another_process(save_files, folder, case, 1 << 17, ("one", "far"))
    for question in case.questions:
        for name, command in commands_of(talcmp, folder, case, question, "far").items():
            status = subprocess.run(command, check=False, stdout=subprocess.DEVNULL).returncode
            if status != 1:
                sys.exit(f"talcmp_peers: {case.files}: {name} has the status {status} instead of 1 "
                         "for files that differ")


def rows_of(talcmp, case, quick):
    """A row for each question, with the rows of its two commands."""
    count, repetitions = (1 << 17, 1) if quick else (case.elements, 5)
    workloads = [question.workload for question in case.questions]
    with tempfile.TemporaryDirectory() as folder:
        check_far_differs(talcmp, folder, case)
        in_another_process(save_files, folder, case, count, ("one", *workloads))
        measured = measured_in_turns({
            (question.workload, name): command
            for question in case.questions
            for name, command in commands_of(talcmp, folder, case, question,
                                             question.workload).items()
        }, repetitions)
    return [{
        "files": case.files,
        "workload": workload,
        "bytes": 8 * count,
        "commands": [{"name": name, **values} for (of, name), values in measured.items()
                     if of == workload],
    } for workload in workloads]


# ---- What is there to compare with


def check_installed():
    missing = {name: package for name, package in PACKAGES_OF_PROGRAMS.items()
               if not shutil.which(name)}
    missing.update((name, package) for name, package in PACKAGES_OF_MODULES.items()
                   if not importlib.util.find_spec(name))
    if missing:
        sys.exit(f"talcmp_peers: not found: {', '.join(missing)}; scripts/setup bench installs the "
                 f"Debian packages {' '.join(missing.values())}")


def has_hdf5(talcmp):
    formats = subprocess.run([talcmp, "--version"], check=True, stdout=subprocess.PIPE, text=True)
    return "HDF5" in formats.stdout


def main():
    talcmp, quick = sys.argv[1], "--quick" in sys.argv
    check_installed()
    cases = [case for case in CASES if has_hdf5(talcmp) or ".h5" not in case.endings]
    left_out = [case.files for case in CASES if case not in cases]
    if left_out:
        print(f"talcmp_peers: left out, as {talcmp} was built without HDF5: {'; '.join(left_out)}",
              file=sys.stderr)
    rows = [row for case in cases for row in rows_of(talcmp, case, quick)]
    print(json.dumps({"rows": rows, "left_out": left_out}))


if __name__ == "__main__":
    main()
