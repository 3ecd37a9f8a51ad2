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
import subprocess
import sys
import zipfile

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


class Shell:
    """A shell in the directory, in which these words start apktoolkit-sim. A command finds the files and the
    status that the one before it left."""

    def __init__(self, directory, simulator):
        self.directory, self.status = directory, 0
        (directory / "bin").mkdir()
        command = directory / "bin/apktoolkit-sim"
        command.write_text(f"#!/bin/sh\nexec {shlex.join(simulator)} \"$@\"\n")
        command.chmod(0o755)
        self.environment = {**os.environ, "PATH": f"{directory}/bin:{os.environ['PATH']}", "LC_ALL": "C.UTF-8"}

    def run(self, command, stderr=subprocess.STDOUT):
        run = subprocess.run(["bash", "-c", f"(exit {self.status})\n{command}"], cwd=self.directory, text=True,
                             env=self.environment, stdout=subprocess.PIPE, stderr=stderr)
        self.status = run.returncode
        return run


def changed_zip(archive, change, out):
    """A copy of the zip archive, with what change(name, content) makes of each entry."""
    with zipfile.ZipFile(archive) as source, zipfile.ZipFile(out, "w") as copy:
        for name in source.namelist():
            copy.writestr(name, change(name, source.read(name)))


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
    problems, stale = list(problems), {path: right for path, right in (pages or {}).items() if path.read_text() != right}
    for path, right in stale.items():
        if WRITES:
            path.write_text(right)
        else:
            print(*difflib.unified_diff(path.read_text().splitlines(), right.splitlines(), f"{path.relative_to(ROOT)}",
                                        "as the sources have it", lineterm="", n=0), sep="\n")
    is_stale = stale and not WRITES
    if is_stale:
        print("To fix this:", shlex.join([sys.executable, "-B", sys.argv[0], "--write", *sys.argv[1:]]))
    if problems:
        print(*problems, f"To fix this: {fix}", sep="\n")
    return 1 if problems or is_stale else 0
