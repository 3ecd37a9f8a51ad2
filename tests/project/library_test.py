#!/usr/bin/env python3
"""Installs the static libraries and headers (cmake/Library.cmake) into a temporary directory, and
builds and runs the example there as examples/README.md shows. Compiles each installed header alone.

Arguments: the build tree, the compiler, and the directory of a good package.
"""

import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile

from sources import ROOT, changed_zip, report, shown_commands

MARK = "== next command"


def prepare(directory, build, package):
    """Puts the examples, a link to the build tree, and packages into `directory`. The commands of
    examples/README.md run in this directory and use these packages."""
    shutil.copytree(ROOT / "examples", directory / "examples")
    (directory / "build").mkdir()
    (directory / "build/release").symlink_to(build)
    shutil.copy(package / "base.apk", directory)
    changed_zip(package / "base.apk", lambda name, content: content + (b"X: y\r\n" if name.endswith(".MF") else b""),
                directory / "changed.apk")


def run(commands, directory, compiler):
    """Runs the commands in one shell, up to the first that fails. Returns the output of each
    command that ran, and the problems."""
    script = "set -euo pipefail\n" + "\n".join(f"echo '{MARK}'; {command}" for command in commands)
    environment = {**os.environ, "HOME": str(directory), "CXX": compiler}
    result = subprocess.run(["bash", "-c", script], cwd=directory, env=environment, text=True,
                            capture_output=True)
    printed = [text.splitlines()[1:] for text in result.stdout.split(MARK)[1:]]
    if result.returncode == 0:
        return printed, []
    return printed, [f"{commands[len(printed) - 1]} fails:", *printed[-1], result.stderr]


def page_problems(directory, compiler):
    # The first command makes a build tree. This command is left out, because the caller passes a
    # build tree to the test.
    blocks = re.findall(r"^```\n(\$ .*?)\n```$", (ROOT / "examples/README.md").read_text(), re.M | re.S)
    shown = [command for block in blocks for command in shown_commands(block)][1:]
    printed, problems = run([command for command, _ in shown], directory, compiler)
    for (command, expected), lines in zip(shown, printed):
        if expected != ["..."] and lines != expected:
            problems += [f"{command} prints:", *lines]
    return problems


def header_problems(directory, compiler):
    include = directory / "apktoolkit/include/apktoolkit"
    flags = subprocess.run(["pkg-config", "--cflags", directory / "apktoolkit/lib/pkgconfig/apktoolkit.pc"], check=True,
                           capture_output=True, text=True).stdout.split()

    sources = []
    for header in include.rglob("*.h"):
        sources.append(directory / f"alone{len(sources)}.cpp")
        sources[-1].write_text(f'#include "{header.relative_to(include)}"\n')
    result = subprocess.run([compiler, "-std=c++17", "-Wall", "-Wextra", "-Werror", *flags, "-fsyntax-only", *sources],
                            capture_output=True, text=True)
    if not sources:
        return ["no header is installed"]
    return [] if result.returncode == 0 else ["a header does not compile alone:", result.stderr]


def main():
    build, compiler, package = sys.argv[1:]
    digest = (pathlib.Path(package) / "digest").read_text().strip()  # openssl computed it
    problems = []
    if digest not in (ROOT / "examples/README.md").read_text():
        problems.append(f"examples/README.md does not show the signer's digest, {digest}")
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name).resolve()
        prepare(directory, pathlib.Path(build), pathlib.Path(package))
        problems += page_problems(directory, compiler)
        problems += header_problems(directory, compiler)
    return report(problems, "examples/README.md, or cmake/Library.cmake, which installs the library")


if __name__ == "__main__":
    sys.exit(main())
