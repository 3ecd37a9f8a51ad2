"""Reads the project's own files for the tests of this directory."""

import os
import pathlib
import re
import shlex

ROOT = pathlib.Path(__file__).resolve().parents[2]
ROOMS = ("sign", "apk", "crypto", "util", "verify")


def tool_sources():
    """Every .cpp file of the tool, relative to the root."""
    for room in ROOMS:
        for path in sorted((ROOT / room).glob("*.cpp")):
            yield path.relative_to(ROOT)


def without_comments(text):
    """C++ text with its comments removed; string literals stay whole."""
    token = re.compile(r'"(?:[^"\\\n]|\\.)*"|//[^\n]*|/\*.*?\*/', re.S)
    return token.sub(lambda match: match[0] if match[0].startswith('"') else " ", text)


def path_with_simulator(directory, simulator):
    """A search path on which `apktoolkit-sim` runs these words, by a script in the directory."""
    (directory / "bin").mkdir()
    command = directory / "bin/apktoolkit-sim"
    command.write_text(f"#!/bin/sh\nexec {shlex.join(simulator)} \"$@\"\n")
    command.chmod(0o755)
    return f"{directory}/bin:{os.environ['PATH']}"


def report(problems):
    """Prints the problems. Returns the exit status of the test."""
    for problem in problems:
        print(problem)
    return 1 if problems else 0
