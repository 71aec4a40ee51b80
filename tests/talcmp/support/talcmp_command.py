"""The talcmp that is tested, and how its tests in Python are started:

    SOMETHING_test.py TALCMP... [-- unittest options]

TALCMP is the command, after its emulator if there is one.
"""

import sys
import unittest

COMMAND = []


def run_tests():
    """Runs the tests of the program that is started."""
    arguments, options = sys.argv[1:], []
    if "--" in arguments:
        position = arguments.index("--")
        arguments, options = arguments[:position], arguments[position + 1:]
    COMMAND.extend(arguments)
    unittest.main(module="__main__", argv=[sys.argv[0]] + options)
