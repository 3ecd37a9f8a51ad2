"""Code that the tests of this directory share. It reads the project's own files, runs commands, and
reports problems.

Some tests generate the text of a file or parts of it, for example a table in the docs, and compare
the file with this text. With --write as the first argument, these tests rewrite the file instead.
A test that finds a problem prints the command to run or the file to fix.
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
    """Runs shell commands in `directory`. In these commands, apktoolkit-sim is a program that runs
    the command line `simulator`, a list of words. Each command sees the files and the exit status
    of the command before it."""

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
    """Writes a copy of the zip archive to `out`. Each entry's content is replaced by change(name, content)."""
    with zipfile.ZipFile(archive) as source, zipfile.ZipFile(out, "w") as copy:
        for name in source.namelist():
            copy.writestr(name, change(name, source.read(name)))


def shown_commands(block):
    """Yields each command of a block on a page, with the output that the page shows for it. In the
    block, the line of a command begins with "$ "."""
    for part in re.split(r"^\$ ", block, flags=re.M)[1:]:
        command, *expected = part.splitlines()
        yield command, expected


def report(problems, fix, pages=None):
    """Prints the problems and how to fix them. Returns the exit status of the test.

    `fix`: the file to fix, or the command to run, if there are problems. `pages`: a map from the
    path of each file with generated text to the whole correct text of the file. If a file has
    another text, prints the difference. With --write, rewrites the file instead.
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
