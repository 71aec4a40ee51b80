"""Builds the compiled part of the Python package; pyproject.toml has nearly everything else."""

import re
from glob import glob
from pathlib import Path

from pybind11.setup_helpers import ParallelCompile, Pybind11Extension
from setuptools import setup

# CMake's project has the version.
version = re.search(
    r"^project\(\s*TalNumericArray\s+VERSION ([\d.]+)$",
    Path("CMakeLists.txt").read_text(encoding="utf-8"),
    re.MULTILINE,
)[1]

# All of each folder, except what the command alone needs.
sources = sorted(
    path
    for folder in ("TalNumericArray", "tools/talcmp/arrays", "tools/talcmp/comparison", "python/core")
    for path in glob(f"{folder}/*.cpp")
) + ["tools/talcmp/text/report_text.cpp", "tools/talcmp/text/terminal.cpp"]

headers = [
    "TalNumericArray",
    "Includes",
    "SystemConfiguration/Exports",
    "compilerruntime/src/scalar_op/utils",
    "compilerruntime/src/types",
    "tools/talcmp",
    "tools/talcmp/arrays",
    "tools/talcmp/comparison",
    "tools/talcmp/text",
    "python/core",
]

ParallelCompile("TALNUMERICARRAY_JOBS", default=0).install()

setup(
    version=version,
    ext_modules=[
        Pybind11Extension(
            "talnumericarray._core",
            sources,
            include_dirs=headers,
            define_macros=[
                ("_FILE_OFFSET_BITS", "64"),
                ("TALNUMERICARRAY_VERSION", f'"{version}"'),
            ],
            cxx_std=17,
            # The rule is defined operation by operation, so no operations may be contracted.
            extra_compile_args=["-O3", "-ffp-contract=off", "-pthread"],
            extra_link_args=["-pthread"],
        )
    ],
)
