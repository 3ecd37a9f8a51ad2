#!/usr/bin/env python3
"""Compares the steps of scripts/check with the docs, and runs scripts/check with steps that pass,
fail and skip."""

import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile

from sources import ROOT, report


def listed_steps():
    table = re.search(r"^steps='\n(.*?)\n'$", (ROOT / "scripts/check").read_text(), re.M | re.S)
    return [line.split()[0] for line in table[1].splitlines()]


def everyday_steps():
    return re.search(r"/check\" (.*)", (ROOT / "scripts/test").read_text())[1].split()


def part(path, beginning, end):
    """The text of the file between two lines, given as patterns."""
    return re.search(rf"^{beginning}\n(.*?)^{end}$", (ROOT / path).read_text(), re.M | re.S)[1]


def known_to_setup():
    return {word for words in re.findall(r"^ +([\w |]+)\)",
                                         part("scripts/setup", r"groups_of\(\) {[^\n]*", "}"), re.M)
            for word in words.split(" | ")}


def setup_problems():
    """scripts/setup knows every step that it is called with."""
    asked = {("scripts/check", step) for step in listed_steps()}
    for path in (ROOT / "scripts").iterdir():
        asked |= {(path.name, word) for words in re.findall(r"^ *scripts/setup ([\w ]+)$",
                                                            path.read_text(), re.M)
                  for word in words.split()}
    return [f"{who} asks scripts/setup for {word}, which it does not know"
            for who, word in sorted(asked) if word not in known_to_setup()]


def list_problems():
    """Every step has a function, and the docs name the steps in the same order."""
    steps, everyday = listed_steps(), everyday_steps()
    functions = re.findall(r"^step_(\w+)\(\)", (ROOT / "scripts/check").read_text(), re.M)
    page = part("docs/testing.md", "## Steps", "## .*")
    shown = part("README.md", r"\$ scripts/test", "```")
    problems = []
    for what, found, expected in (
            ("functions", functions, steps),
            ("docs/testing.md", re.findall(r"^\| `(\w+)`", page, re.M), steps),
            ("docs/testing.md, with a star", re.findall(r"^\| `(\w+)` \*", page, re.M), everyday),
            ("README.md", re.findall(r"^([a-z]\w+) .*build/logs", shown, re.M), everyday)):
        if found != expected:
            problems.append(f"{what}: {found} in place of {expected}")
    return problems


def check(directory, *steps):
    run = subprocess.run([directory / "scripts/check", *steps], capture_output=True, text=True)
    return re.sub(r"\(\d+ s, ", "(N s, ", run.stdout).splitlines(), run.returncode


def write(path, content):
    path.write_text("#!/bin/bash\n" + content)
    path.chmod(0o755)


def run_problems():
    """scripts/check reports every way in which a step can end."""
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        (directory / "scripts").mkdir()
        shutil.copy(ROOT / "scripts/check", directory / "scripts")
        write(directory / "scripts/setup", "true")
        write(directory / "scripts/check-arrows", "echo arrow; echo all 3 are allowed")
        write(directory / "scripts/format", "echo bad.cpp; exit 1")
        write(directory / "scripts/run-tests", """echo "test $1 passed"
            echo "skipped A.B: no kernel"
            [[ $1 == release ]] || echo "FAILED A.C: one"
            echo "1 passed"
            [[ $1 == release ]]""")
        found = check(directory, "arrows", "release", "format", "sanitize")
        expected = (["arrows        all 3 are allowed (N s, build/logs/arrows.log)",
                     "release       1 passed (N s, build/logs/release.log)",
                     "    skipped A.B: no kernel",
                     "format        FAILED (N s, build/logs/format.log)",
                     "    bad.cpp",
                     "sanitize      FAILED (N s, build/logs/sanitize.log)",
                     "    skipped A.B: no kernel",
                     "    FAILED A.C: one",
                     "    1 passed",
                     "steps: 2 passed, 2 failed, 0 skipped"], 1)
        problems = [] if found == expected else [f"scripts/check ends with {found}"]
        if (found := check(directory, "arrows"))[1] != 0:
            problems.append(f"scripts/check does not pass: {found}")
        if (found := check(directory, "arrow"))[1] != 2:
            problems.append(f"scripts/check takes a step that there is not: {found}")
        write(directory / "scripts/bare-system", "echo on its way; echo skipped: no root; exit 77")
        skipped = ["debian13      skipped: no root (N s, build/logs/debian13.log)"]
        found = check(directory, "debian13", "arrows")
        if found != (skipped + expected[0][:1] + ["steps: 1 passed, 0 failed, 1 skipped"], 0):
            problems.append(f"scripts/check takes a skipped step for another: {found}")
        found = check(directory, "debian13")
        if found != (skipped + ["steps: 0 passed, 0 failed, 1 skipped"], 1):
            problems.append(f"scripts/check passes where no step ran: {found}")
        write(directory / "scripts/setup", "exit 1")
        if (found := check(directory, "arrows"))[1] == 0:
            problems.append(f"scripts/check goes on without its packages: {found}")
    return problems


def emulator_problems():
    """Without an emulator scripts/kernel is a skipped step."""
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        (directory / "scripts").mkdir()
        shutil.copy(ROOT / "scripts/kernel", directory / "scripts")
        write(directory / "scripts/setup", "[[ $1 != emulator ]]")
        run = subprocess.run([directory / "scripts/kernel"], capture_output=True, text=True)
        expected = (77, "skipped: qemu is missing, and apt-get cannot install it\n")
        found = (run.returncode, run.stdout)
        return [] if found == expected else [f"scripts/kernel without qemu ends with {found}"]


def skip_problems():
    """scripts/bare-system prints why it cannot run here, and its status marks the step as skipped."""
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        (directory / "scripts").mkdir()
        shutil.copy(ROOT / "scripts/bare-system", directory / "scripts")
        write(directory / "wget", "exit 4")
        reasons = [("exit 1", "debootstrap is missing, and apt-get cannot install it"),
                   ("true", "http://mirror.invalid/debian/dists/trixie/Release cannot be fetched")]
        for setup, reason in reasons:
            write(directory / "scripts/setup", setup)
            expected = reason if os.geteuid() == 0 else "only root can make a bare system"
            run = subprocess.run([directory / "scripts/bare-system", "13"], capture_output=True, text=True,
                                 env={**os.environ, "PATH": f"{directory}:{os.environ['PATH']}",
                                      "DEBIAN_MIRROR": "http://mirror.invalid/debian"}, check=False)
            if (run.returncode, run.stdout) != (77, f"skipped: {expected}\n"):
                yield f"scripts/bare-system ends with {run.returncode}: {run.stdout}{run.stderr}"


if __name__ == "__main__":
    sys.exit(report(list_problems() + setup_problems() + run_problems() + emulator_problems() +
                    list(skip_problems())))
