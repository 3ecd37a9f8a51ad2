#!/usr/bin/env python3
"""Installs the library into its own directory, builds and runs the example with it as
examples/README.md shows, and compiles each installed header alone.

Arguments: the build tree, the compiler, and the directory of a good package.
"""

import concurrent.futures
import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile
import zipfile

from sources import ROOT, report

MARK = "== next command"


def change_manifest(package, out):
    """Copies the package, with one more attribute in its signed manifest."""
    with zipfile.ZipFile(package) as source, zipfile.ZipFile(out, "w") as copy:
        for name in source.namelist():
            more = b"X: y\r\n" if name == "META-INF/MANIFEST.MF" else b""
            copy.writestr(name, source.read(name) + more)


def prepare(directory, build, package):
    """Fills the page's directory: files of a checkout, the build tree, and the files that the page
    names."""
    shutil.copytree(ROOT / "examples", directory / "examples")
    (directory / "build").mkdir()
    (directory / "build/release").symlink_to(build)
    shutil.copy(package / "base.apk", directory)
    change_manifest(package / "base.apk", directory / "changed.apk")


def shown_commands(page):
    """The page's commands, each with its output on the page; None stands for any output."""
    for block in re.findall(r"^```\n(\$ .*?)\n```$", page, re.M | re.S):
        for command in re.split(r"^\$ ", block, flags=re.M)[1:]:
            command, *lines = command.splitlines()
            yield command, None if lines == ["..."] else lines


def run(commands, directory, compiler):
    """The output of each command. All run in one shell, until one fails."""
    script = "set -euo pipefail\n" + "\n".join(f"echo '{MARK}'; {command}" for command in commands)
    environment = {**os.environ, "HOME": str(directory), "CXX": compiler}
    result = subprocess.run(["bash", "-c", script], cwd=directory, env=environment, text=True,
                            capture_output=True)
    printed = [text.splitlines()[1:] for text in result.stdout.split(MARK)[1:]]
    if result.returncode == 0:
        return printed, []
    return printed, [f"{commands[len(printed) - 1]} fails:", *printed[-1], result.stderr]


def page_problems(directory, compiler):
    # The first command would make the build tree. The tested tree takes its place.
    shown = list(shown_commands((ROOT / "examples/README.md").read_text()))[1:]
    printed, problems = run([command for command, _ in shown], directory, compiler)
    for (command, expected), lines in zip(shown, printed):
        if expected is not None and lines != expected:
            problems += [f"{command} prints:", *lines]
    return problems


def header_problems(directory, compiler):
    include = directory / "apktoolkit/include/apktoolkit"
    environment = {**os.environ, "PKG_CONFIG_PATH": directory / "apktoolkit/lib/pkgconfig"}
    flags = subprocess.run(["pkg-config", "--cflags", "apktoolkit"], env=environment, check=True,
                           capture_output=True, text=True).stdout.split()

    def compile_alone(header):
        name = header.relative_to(include)
        result = subprocess.run(
            [compiler, "-std=c++17", "-Wall", "-Wextra", "-Werror", *flags, "-fsyntax-only", "-x",
             "c++", "-"], input=f'#include "{name}"\n', capture_output=True, text=True)
        return [] if result.returncode == 0 else [f"{name} does not compile alone", result.stderr]

    headers = sorted(include.rglob("*.h"))
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        found = list(pool.map(compile_alone, headers))
    return sum(found, [] if headers else ["no header is installed"])


def main():
    build, compiler, package = sys.argv[1:]
    digest = (pathlib.Path(package) / "digest").read_text().strip()  # as openssl tells it
    problems = []
    if digest not in (ROOT / "examples/README.md").read_text():
        problems.append(f"examples/README.md does not show the signer's digest, {digest}")
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name).resolve()
        prepare(directory, pathlib.Path(build), pathlib.Path(package))
        problems += page_problems(directory, compiler)
        problems += header_problems(directory, compiler)
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
