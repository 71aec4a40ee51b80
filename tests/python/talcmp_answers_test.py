"""Every answer about arrays in memory is what talcmp says of the files that NumPy saves of them.

The environment variable TALNUMERICARRAY_TALCMP names the command; TALNUMERICARRAY_SEED sets what is
drawn, which is printed where a test fails.
"""

import json
import os
import random
import re
import subprocess
import warnings

import numpy as np
import pytest

import drawn_arrays
import talnumericarray as tna

TALCMP = os.environ["TALNUMERICARRAY_TALCMP"].split(";")
SEED = int(os.environ.get("TALNUMERICARRAY_SEED", random.randrange(2**32)))
ARCHIVES = int(os.environ.get("TALNUMERICARRAY_PYTHON_EXAMPLES", 1000)) // 40 + 1
MEMBERS = 30


def run(*arguments):
    words = [*TALCMP, *map(str, arguments)]
    done = subprocess.run(words, capture_output=True, check=False, text=True, timeout=120)
    assert done.returncode in (0, 1), done.stderr
    return done.stdout


def command_options(options, folder):
    """The options of talcmp that ask for what the keyword arguments do."""
    words = []
    for name, value in options.items():
        if name == "slices":
            words.append("--slice=" + drawn_arrays.slices_text(value))
        elif name == "ignore":
            path = folder / "mask.npy"
            np.save(path, value)
            words.append(f"--ignore={path}")
        elif name == "max_places":
            words.append(f"--max-differences={value}")
        elif value is True:
            words.append("--" + name.replace("_", "-"))
        else:
            words.append(f"--{name}={value!r}")
    return words


def reports_in(output):
    """The reports on single comparisons; each begins with lines that are not indented."""
    reports, indented = [], True
    for line in output.splitlines()[:-1]:
        if indented and not line.startswith("  "):
            reports.append([])
        indented = line.startswith("  ")
        reports[-1].append(line)
    return ["\n".join(lines) for lines in reports]


def as_python(text):
    """As the package spells options."""
    return re.sub(r"--tol (\d+)", r"tol=\1", text)


def report_as_python(report, names):
    """As the package prints it, which has a word between the names."""
    first, second = names
    return as_python(report.replace(f"{first} {second} ", f"{first} and {second} "))


def place_json(place):
    return place and {"index": list(place.index), "first": place.first_text,
                      "second": place.second_text, "digits": place.digits, "reason": place.reason}


def number_json(number):
    return str(number) if number in (np.inf, -np.inf) else number


def facts_json(facts):
    return {"name": facts.name, "type": facts.type, "stored_type": facts.stored_type,
            "shape": list(facts.shape), "selected_shape": list(facts.selected_shape),
            "order": "Fortran" if facts.fortran_order else "C"}


def comparison_json(found):
    """What --json prints."""
    report = {"pairs": found.pairs, "ignored": found.ignored, "differing": found.differing,
              "worst": place_json(found.worst),
              "largest_absolute_difference": number_json(found.largest_absolute_difference),
              "largest_relative_difference": number_json(found.largest_relative_difference),
              "smallest_tolerance": found.smallest_tolerance,
              "why_no_tolerance": found.why_no_tolerance,
              "first_values": found.first_values._asdict(),
              "second_values": found.second_values._asdict(),
              "histogram": [bar._asdict() for bar in found.histogram]}
    return {"result": "same" if found.same else "different", "first": facts_json(found.first),
            "second": facts_json(found.second), "tolerance": number_json(found.tolerance),
            "difference": found.difference,
            "differences": [place_json(place) for place in found.places],
            "report": None if found.difference == "shape" else report}


def respelled(document):
    return json.loads(as_python(json.dumps(document)))


def drawn_archive(rng):
    """Pairs of arrays of one shape, and options for all of them."""
    shape = drawn_arrays.shape(rng)
    options = drawn_arrays.options(rng, shape)
    if rng.randrange(3) == 0:
        options["ignore"] = drawn_arrays.mask(rng, shape)
    if rng.randrange(2):
        options["absolute"] = rng.choice(drawn_arrays.ABSOLUTES)
    pairs = {}
    for number in range(MEMBERS):
        type1, type2 = rng.choice(drawn_arrays.TYPES), rng.choice(drawn_arrays.TYPES)
        first, second = drawn_arrays.arrays(rng, type1, rng.choice([type1, type2]), shape)
        first, second = drawn_arrays.stored(rng, first), drawn_arrays.stored(rng, second)
        if rng.randrange(10) == 0 and "slices" not in options:
            second = second[..., None]
        pairs[f"m{number:03}"] = first, second
    return pairs, options


def check_archive(pairs, options, folder):
    paths = folder / "a.npz", folder / "b.npz"
    for side, path in enumerate(paths):
        np.savez(path, **{name: pair[side] for name, pair in pairs.items()})
    words = command_options(options, folder)
    documents = json.loads(run("--json", *words, *paths))["comparisons"]
    reports = reports_in(run("--report", "-v", *words, *paths))
    assert len(documents) == len(reports) == len(pairs)
    for (name, (first, second)), document, report in zip(pairs.items(), documents, reports):
        names = tuple(f"{path}[{name}]" for path in paths)
        with warnings.catch_warnings():
            warnings.simplefilter("ignore")
            found = tna.compare(first, second, names=names, **options)
        assert comparison_json(found) == respelled(document)
        assert str(found) == report_as_python(report, names)


@pytest.mark.parametrize("number", range(ARCHIVES))
def test_drawn_arrays(number, tmp_path):
    print("seed", SEED)
    check_archive(*drawn_archive(random.Random(f"{SEED} {number}")), tmp_path)


def test_large_arrays(tmp_path):
    """Of several pieces, in all orders, and by several threads."""
    rng = np.random.default_rng(SEED)
    print("seed", SEED)
    first = rng.standard_normal((300, 20, 50))
    second = first * (1 + rng.choice([0, 0, 0, 1e-15, 1e-10, 1e-3, -2, np.nan], first.shape))
    stored = [first, first.copy("F"), first.transpose(2, 0, 1).copy().transpose(1, 2, 0),
              np.repeat(first, 2, axis=2)[:, :, ::2], first[::-1].copy()[::-1],
              first.astype(">f8"), first.astype("f4")]
    pairs = {f"m{number:03}": (each, np.array(second, order=order))
             for number, each in enumerate(stored) for order in "CF"}
    pairs = {f"m{number:03}": pair for number, pair in enumerate(pairs.values())}
    pairs |= {f"n{number:03}": (one, stored[-number]) for number, one in enumerate(stored)}
    mask = rng.random(first.shape) < 0.3
    for options in ({"tol": 10, "max_places": 50}, {"relative": 1e-12, "threads": 2},
                    {"slices": np.s_[::3, 1:, ::-2], "equal_nan": True, "max_places": 20},
                    {"ignore": mask, "absolute": 1e-12, "threads": 3}):
        check_archive(pairs, options, tmp_path)


@pytest.mark.parametrize("slices", [":,0", "...,::2", "1:3,-1", " 1 : 3 , ...", "::-1,1:9"])
def test_slices_as_text(slices, tmp_path):
    first = np.arange(20.0).reshape(4, 5)
    second = first + (first % 3 != 1)
    paths = tmp_path / "a.npy", tmp_path / "b.npy"
    for path, array in zip(paths, (first, second)):
        np.save(path, array)
    document = json.loads(run("--json", f"--slice={slices}", "-n100", *paths))["comparisons"][0]
    found = tna.compare(first, second, names=tuple(map(str, paths)), slices=slices, max_places=100)
    assert comparison_json(found) == respelled(document)
    assert found.differing > 0
