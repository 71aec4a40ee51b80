#!/usr/bin/env python3
"""Lints C++ sources with clang-tidy, several at a time.

    lint.py BUILD_FOLDER SOURCE...

clang-tidy examines all that a source includes, so nearly all its time goes to the standard library.
Sources that are compiled alike are therefore put together in one file. Where clang-tidy complains
of that file, its sources are linted one by one, which shows what is wrong and where.
"""

import json
import os
import re
import shlex
import subprocess
import sys
from collections import defaultdict
from concurrent.futures import ThreadPoolExecutor
from dataclasses import dataclass
from pathlib import Path

ROOT = Path(__file__).resolve().parents[2]
WORKERS = os.cpu_count()
TOGETHER = 9  # sources


@dataclass(frozen=True)
class Source:
    path: Path
    defined: tuple  # -D and -I, which may differ between sources that are put together
    others: tuple

    def text(self):
        return self.path.read_text(encoding="utf-8")

    def settings(self):
        return next(folder / ".clang-tidy" for folder in self.path.parents
                    if (folder / ".clang-tidy").exists())

    def stands_alone(self):
        """Functions with C's names can only be defined once, and may be declared by headers."""
        return re.search(r'^extern "C"|^int main\(', self.text(), flags=re.MULTILINE)


def source_of(path, command):
    """With the flags that can change what a source says, not how code is made of it."""
    command = re.sub(r"^.*clang\+\+ | -mllvm \S+| -o .*$", "", command)
    flags = [flag for flag in shlex.split(command) if not flag.startswith(("-O", "-f", "-g"))]
    defined = tuple(flag for flag in flags if flag.startswith(("-D", "-I")))
    return Source(path, defined, tuple(flag for flag in flags if flag not in defined))


def groups_of(sources):
    """Sources that can be put together, in lists of about the same length."""
    alike = defaultdict(list)
    for source in sources:
        if not source.stands_alone():
            part = source.path.relative_to(ROOT).parts[0]
            alike[part, source.settings(), source.others].append(source)
    for found in alike.values():
        count = -(-len(found) // TOGETHER)
        yield from (found[i * len(found) // count:(i + 1) * len(found) // count]
                    for i in range(count))


def without(text, included):
    """The lines of `text` without the headers in `included`, to which its own are added."""
    own, depth = set(), 0
    for line in text.splitlines():
        depth += bool(re.match(r"#\s*if", line)) - bool(re.match(r"#\s*endif", line))
        if depth == 0 and line.startswith("#include"):
            if line in included:
                continue
            own.add(line)
        yield line
    included |= own


def put_together(group):
    """The lines. A source without a named namespace is given one of its own, so that different
    things in different sources may have the same name. A source with a header is not: what the
    header declares would be declared twice."""
    included = set()
    for number, source in enumerate(group):
        lines = list(without(source.text(), included))
        has_namespace = any(re.match(r"namespace \w", line) for line in lines)
        has_header = source.path.with_suffix(".h").exists()
        if "namespace {" in lines and not has_namespace and not has_header:
            lines.insert(lines.index("namespace {"), f"namespace source{number} {{")
            lines.append("}")
        yield from lines


def complaints(*words):
    found = subprocess.run(["clang-tidy", "--quiet", *words], cwd=ROOT, text=True, check=False,
                           stdout=subprocess.PIPE, stderr=subprocess.STDOUT)
    return found.stdout if found.returncode != 0 else ""


def is_clean(build, number, group):
    path = build / "together" / f"{number}.cpp"
    path.parent.mkdir(exist_ok=True)
    path.write_text("".join(f"{line}\n" for line in put_together(group)), encoding="utf-8")
    flags = dict.fromkeys(flag for source in group
                          for flag in (*source.defined, f"-I{source.path.parent}"))
    return not complaints(f"--config-file={group[0].settings()}", str(path), "--", *flags,
                          *group[0].others)


def main():
    build, paths = Path(sys.argv[1]).resolve(), [ROOT / name for name in sys.argv[2:]]
    commands = {entry["file"]: entry["command"]
                for entry in json.loads((build / "compile_commands.json").read_text())}
    groups = list(groups_of(source_of(path, commands[str(path)])
                            for path in paths if str(path) in commands))
    with ThreadPoolExecutor(WORKERS) as pool:
        clean = pool.map(lambda item: is_clean(build, *item), enumerate(groups))
        done = {source.path for group, passed in zip(groups, clean) if passed
                for source in group}
        alone = [path for path in paths if path not in done]
        found = list(pool.map(lambda path: complaints("-p", str(build), str(path)), alone))
    print("".join(found), end="")
    print(f"lint: {len(done)} sources together in {len(groups)}, and {len(alone)} alone")
    sys.exit(1 if any(found) else 0)


if __name__ == "__main__":
    main()
