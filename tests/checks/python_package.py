#!/usr/bin/python3
"""Builds the Python package as pip does, without a network, and tries it.

    python_package.py ROOT BUILD

The source distribution is made from ROOT, a wheel from the source distribution, and the wheel is
installed in a virtual environment and used there. What setup.py compiles, and the package's metadata,
have to be what CMake has for them in BUILD.
"""

import distutils.core
import json
import os
import subprocess
import sys
import tarfile
import tempfile
from email.parser import Parser
from pathlib import Path

TARGETS = ("talnumericarray_compare", "talcmp_comparison", "talnumericarray_python")

# What one with nothing but the package and NumPy finds in it.
USE = """
import importlib.metadata, sys
import talnumericarray as tna

assert tna.same([1, 2], [1, 2]) and not tna.same([1, 2], [1, 3])
loaded = {"dask", "distributed", "pytest", "typing_extensions", "xarray"} & set(sys.modules)
assert not loaded, f"importing the package also imports {loaded}"
metadata = importlib.metadata.distribution("talnumericarray")
assert metadata.version == tna.__version__, (metadata.version, tna.__version__)
[plugin] = [point for point in metadata.entry_points if point.group == "pytest11"]
plugin.load()
"""

FAILING_TEST = """
import talnumericarray

def test_arrays():
    talnumericarray.assert_same([1, 2], [1, 3])
"""


def run(*words, **settings):
    """What the command prints; ends with all of it if the command fails."""
    result = subprocess.run([str(word) for word in words], text=True, check=False,
                            stdout=subprocess.PIPE, stderr=subprocess.STDOUT, **settings)
    if result.returncode != 0:
        sys.exit(f"{' '.join(str(word) for word in words)}:\n{result.stdout}")
    return result.stdout


def expect_same(what, expected, found):
    if expected != found:
        sys.exit(f"{what}: expected {expected}, found {found}")


def compiled_by_cmake(root, build):
    commands = json.loads((build / "compile_commands.json").read_text())
    return {
        str(Path(entry["file"]).relative_to(root)) for entry in commands
        if any(f"/{target}.dir/" in entry["command"] for target in TARGETS)
    }


def compiled_by_pip():
    """Those of the setup.py in this folder."""
    setup = distutils.core.run_setup("setup.py", stop_after="init")
    [extension] = setup.ext_modules
    return {os.path.normpath(source) for source in extension.sources}


def source_distribution(root, folder):
    """Unpacked in the folder; nothing is left in ROOT."""
    run(sys.executable, "setup.py", "egg_info", f"--egg-base={folder}", "sdist",
        f"--dist-dir={folder}", cwd=root)
    [archive] = folder.glob("*.tar.gz")
    with tarfile.open(archive) as file:
        file.extractall(folder)
    return folder / archive.name[:-len(".tar.gz")]


def main():
    root, build = Path(sys.argv[1]).resolve(), Path(sys.argv[2]).resolve()
    # A previous call's objects are found again in spite of another folder.
    os.environ.update(CC="ccache gcc", CCACHE_NOHASHDIR="1", PIP_NO_INDEX="1",
                      PIP_DISABLE_PIP_VERSION_CHECK="1", PIP_NO_CACHE_DIR="1")
    os.environ.pop("PYTHONPATH", None)
    os.chdir(root)
    expect_same("compiled by only one of CMake and pip", set(),
                compiled_by_cmake(root, build) ^ compiled_by_pip())
    with tempfile.TemporaryDirectory() as name:
        folder = Path(name)
        source = source_distribution(root, folder)
        run(sys.executable, "-m", "venv", "--system-site-packages", folder / "venv")
        python = folder / "venv" / "bin" / "python"
        run(python, "-m", "pip", "wheel", "--no-build-isolation", "--no-deps",
            f"--wheel-dir={folder}", source)
        [wheel] = folder.glob("*.whl")
        run(python, "-m", "pip", "install", wheel)
        run(python, "-c", USE, cwd=folder)

        [metadata] = folder.glob("venv/lib/*/site-packages/talnumericarray-*.dist-info")
        by_cmake = build / "python" / metadata.name
        found, expected = (Parser().parsestr((place / "METADATA").read_text(encoding="utf-8"))
                           for place in (metadata, by_cmake))
        for key in set(expected) - {"Metadata-Version"}:
            expect_same(f"{key} in the wheel", expected[key], found[key])
        expect_same("entry points", (root / "python" / "entry_points.txt").read_text().split(),
                    (metadata / "entry_points.txt").read_text().split())

        (folder / "test_failing.py").write_text(FAILING_TEST)
        shown = subprocess.run([python, "-m", "pytest", "--color=yes", "test_failing.py"],
                               cwd=folder, text=True, check=False, stdout=subprocess.PIPE).stdout
        if "talnumericarray-" not in shown or "first and second differ: [1]: 2 and 3" not in shown:
            sys.exit(f"pytest shows:\n{shown}")

        run(python, root / "tests/checks/python_examples.py", root / "examples/arrays",
            root / "README.md", root / "docs/python.md")
    print("the wheel builds from the source distribution, installs and works")


if __name__ == "__main__":
    main()
