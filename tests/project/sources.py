"""What the tests of this directory share: how they read the project's own files, and how they end.

Tables that must agree with the sources are written by these tests: started with --write before its
other arguments, a test brings its tables up to date instead of comparing them. A test that fails
prints the command, or the file, that fixes it.
"""

import difflib
import os
import pathlib
import re
import shlex
import sys

WRITES = sys.argv[1:2] == ["--write"]
if WRITES:
    del sys.argv[1]
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


def path_with_simulator(folder, simulator):
    """A search path on which apktoolkit-sim is what these words start, from a script in the folder."""
    (folder / "bin").mkdir()
    command = folder / "bin/apktoolkit-sim"
    command.write_text(f"#!/bin/sh\nexec {shlex.join(simulator)} \"$@\"\n")
    command.chmod(0o755)
    return f"{folder}/bin:{os.environ['PATH']}"


def shown_commands(block):
    """The commands of a block "$ COMMAND", each with the lines that it prints on the page."""
    for part in re.split(r"^\$ ", block, flags=re.M)[1:]:
        command, *expected = part.splitlines()
        yield command, expected


def report(problems, fix="", pages=None):
    """Prints the problems and how each is fixed; the exit status of the test.

    `fix`: the file or the command that fixes the problems. `pages`: by its path, the text that each
    page with generated parts must have.
    """
    problems, is_stale = list(problems), False
    for path, right in (pages or {}).items():
        found = path.read_text()
        if found == right:
            continue
        if WRITES:
            path.write_text(right)
            continue
        is_stale = True
        print(*difflib.unified_diff(found.splitlines(), right.splitlines(), str(path.relative_to(ROOT)),
                                    "as the sources have it", lineterm="", n=0), sep="\n")
    if is_stale:
        print("To fix this:", shlex.join([sys.executable, "-B", sys.argv[0], "--write", *sys.argv[1:]]))
    for problem in problems:
        print(problem)
    if problems:
        print("To fix this:", fix)
    return 1 if problems or is_stale else 0
