#!/usr/bin/python3
"""Checks that the sample arrays are what their script writes: sample_arrays.py EXAMPLES."""

import subprocess
import sys
import tempfile
from pathlib import Path


def contents(folder):
    return {path.name: path.read_bytes() for path in Path(folder).glob("*.npy")}


def main():
    examples = Path(sys.argv[1])
    with tempfile.TemporaryDirectory() as folder:
        subprocess.run([sys.executable, examples / "make_arrays.py", folder], check=True)
        written, kept = contents(folder), contents(examples / "arrays")
    differing = [name for name in sorted(written.keys() | kept.keys())
                 if written.get(name) != kept.get(name)]
    print(f"{len(kept)} arrays, differing: {differing}")
    sys.exit(1 if differing or not kept else 0)


if __name__ == "__main__":
    main()
