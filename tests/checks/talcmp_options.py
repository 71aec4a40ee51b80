#!/usr/bin/python3
"""Checks that the options of talcmp are the same wherever they are listed.

    talcmp_options.py ROOT TALCMP...

TALCMP is the command, after its emulator if there is one. Every option of its help has to be in the
manual page and in the completions of all shells, and they may list no others.
"""

import re
import subprocess
import sys
from pathlib import Path


def options_in(text):
    return set(re.findall(r"(?<![\w-])--?[a-z][a-z-]*", text))


def main():
    talcmp = Path(sys.argv[1], "tools", "talcmp")
    help_text = subprocess.run(sys.argv[2:] + ["--help"], check=True, text=True,
                               stdout=subprocess.PIPE).stdout
    expected = options_in(help_text)
    long_ones = {option for option in expected if option.startswith("--")}
    bash = (talcmp / "completions" / "talcmp.bash").read_text("utf-8")
    zsh = (talcmp / "completions" / "_talcmp").read_text("utf-8")
    fish = (talcmp / "completions" / "talcmp.fish").read_text("utf-8")
    manual = re.sub(r"\\f.", " ", (talcmp / "talcmp.1").read_text("utf-8").replace("\\-", "-"))
    manual = manual.split(".SH OPTIONS")[1].split(".SH TOLERANCE")[0]
    fish_options = {"--" + name for name in re.findall(r" -l ([\w-]+)", fish)}
    fish_options |= {"-" + name for name in re.findall(r" -s (\w)", fish)}
    found = {
        "manual page": options_in(manual),
        "zsh": options_in("\n".join(line.replace("_files -g", "") for line in zsh.splitlines()
                                    if "_arguments" not in line)),
        "fish": fish_options,
        "bash": options_in(re.search(r'compgen -W "(.*?)"', bash, re.DOTALL).group(1)) | (
            expected - long_ones),
    }
    wrong = 0
    for place, options in found.items():
        if options != expected:
            wrong += 1
            print(f"{place}: lacks {sorted(expected - options)}, has {sorted(options - expected)}")
    print(f"{len(expected)} options in {len(found)} places, {wrong} of them wrong")
    sys.exit(1 if wrong or len(expected) < 15 else 0)


if __name__ == "__main__":
    main()
