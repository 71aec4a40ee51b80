#!/usr/bin/python3
"""Checks that the examples of Python in documents are true.

    python_examples.py FOLDER DOCUMENT...

The ```pycon blocks of each document are one session, in the folder, with what Python imports as
talnumericarray.
"""

import doctest
import os
import sys
from pathlib import Path

from documented_examples import blocks


def main():
    documents = [Path(name).resolve() for name in sys.argv[2:]]
    os.chdir(sys.argv[1])
    runner = doctest.DocTestRunner(optionflags=doctest.ELLIPSIS)
    for document in documents:
        session = "\n".join(blocks(document.read_text(encoding="utf-8"), "pycon"))
        examples = doctest.DocTestParser().get_doctest(
            session, {"__name__": "__main__"}, document.name, str(document), 0
        )
        if not examples.examples:
            sys.exit(f"{document} has no examples")
        runner.run(examples)
    print(f"{runner.tries} examples, {runner.failures} wrong")
    sys.exit(1 if runner.failures else 0)


if __name__ == "__main__":
    main()
