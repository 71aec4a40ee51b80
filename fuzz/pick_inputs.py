#!/usr/bin/python3
"""Adds to corpus/FUZZER the inputs that reach most: pick_inputs.py FUZZER [FILES].

From the inputs that scripts/fuzz has left in build/fuzz/corpus, takes those that add most to the code
that is reached, and then to how it is reached, until corpus/FUZZER has FILES files.
"""

import shutil
import subprocess
import sys
import tempfile
from pathlib import Path

PROJECT = Path(__file__).parent.parent
LARGEST = 1024


def reached(fuzzer, inputs):
    """The numbers of what each input reaches, by its path."""
    with tempfile.TemporaryDirectory() as folder:
        (empty := Path(folder) / "empty").mkdir()
        control = Path(folder) / "control"
        subprocess.run([PROJECT / "build/fuzz/fuzz" / fuzzer, "-set_cover_merge=1", f"-max_len={LARGEST}",
                        f"-merge_control_file={control}", empty, *inputs],
                       check=True, stderr=subprocess.DEVNULL)
        lines = control.read_text().splitlines()
    paths = lines[2:2 + int(lines[0])]
    result = {Path(path): set() for path in paths}
    for kind, index, *numbers in (line.split() for line in lines[2 + len(paths):]):
        if kind == "FT":
            result[Path(paths[int(index)])].update(map(int, numbers))
    return result


def worth(fresh):
    """Code first: eight numbers are one place in it, reached more or less often."""
    return len({number // 8 for number in fresh}), len(fresh)


def pick(inputs, known, most):
    """The inputs that add most to what is known, best first."""
    picked = []
    while inputs and len(picked) < most:
        best = max(inputs, key=lambda path: (worth(inputs[path] - known), -path.stat().st_size))
        if not inputs[best] - known:
            break
        picked.append(best)
        known |= inputs.pop(best)
    return picked


def main():
    fuzzer = sys.argv[1]
    most = int(sys.argv[2]) if len(sys.argv) > 2 else 60
    kept = PROJECT / "fuzz/corpus" / fuzzer
    kept.mkdir(parents=True, exist_ok=True)
    inputs = reached(fuzzer, [kept, PROJECT / "build/fuzz/corpus" / fuzzer])
    already = [path for path in inputs if path.parent == kept]
    known = set().union(*(inputs.pop(path) for path in already))
    for path in pick(inputs, known, most - len(already)):
        shutil.copy(path, kept)


if __name__ == "__main__":
    main()
