#!/usr/bin/python3
"""Checks that the examples in a document are true.

    documented_examples.py DOCUMENT ROOT BIN [EMULATOR ARGUMENT...]

Each ```console block is a session: its lines after "$ " are run one after the other by bash in
ROOT, with the programs of BIN first in the path, after their emulator if one is given, and must
print the lines that follow them. Each block in another language must be found, line by line, in one of
the files of ROOT that are listed for it below, which other tests run.
"""

import os
import re
import subprocess
import sys
import tempfile
from pathlib import Path

SOURCES = {
    "cpp": ["examples/*.cpp"],
    "cmake": ["tests/outside/*/CMakeLists.txt", "examples/recipes/CMakeLists.txt"],
    "sh": ["examples/recipes/*.sh"],
    "yaml": ["examples/recipes/*.yml"],
}


def blocks(document, language):
    pattern = rf"^( *)```{language}\n(.*?)^ *```$"
    found = re.findall(pattern, document, flags=re.MULTILINE | re.DOTALL)
    return [re.sub(f"^{indent}", "", body, flags=re.MULTILINE) for indent, body in found]


def run_session(commands, root, folder):
    """The text as a terminal would show it."""
    script = "".join(f"printf '%s\\n' {quoted(f'$ {c}')}\n(exit $s)\n{c}\ns=$?\n" for c in commands)
    environment = {**os.environ, "PATH": f"{folder}:{os.environ['PATH']}"}
    result = subprocess.run(["bash", "-c", "s=0\n" + script], cwd=root, env=environment, text=True,
                            stdout=subprocess.PIPE, stderr=subprocess.STDOUT, check=False)
    return result.stdout


def emulated(programs, emulator, folder):
    """Fills the folder with commands that run the programs under the emulator."""
    for program in Path(programs).iterdir():
        words = " ".join(quoted(word) for word in [*emulator, str(program)])
        command = Path(folder, program.name)
        command.write_text(f'#!/bin/sh\nexec {words} "$@"\n', encoding="utf-8")
        command.chmod(0o755)


def quoted(text):
    return "'" + text.replace("'", "'\\''") + "'"


def main():
    document = Path(sys.argv[1]).read_text(encoding="utf-8")
    root, programs, emulator = Path(sys.argv[2]), sys.argv[3], sys.argv[4:]
    sessions = blocks(document, "console")
    failures = 0
    with tempfile.TemporaryDirectory() as commands_folder:
        emulated(programs, emulator, commands_folder)
        for session in sessions:
            commands = [line[2:] for line in session.splitlines() if line.startswith("$ ")]
            shown = run_session(commands, root, commands_folder)
            if shown != session:
                failures += 1
                print(f"-- documented:\n{session}-- found:\n{shown}")
    snippets = 0
    for language, patterns in SOURCES.items():
        sources = [path.read_text(encoding="utf-8") for pattern in patterns
                   for path in root.glob(pattern)]
        for snippet in blocks(document, language):
            snippets += 1
            if not any(snippet in source for source in sources):
                failures += 1
                print(f"-- not in any file of {patterns}:\n{snippet}")
    print(f"{len(sessions)} sessions and {snippets} snippets, {failures} wrong")
    sys.exit(1 if failures or not sessions else 0)


if __name__ == "__main__":
    main()
