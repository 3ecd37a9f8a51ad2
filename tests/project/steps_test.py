#!/usr/bin/env python3
"""Writes the table of steps in docs/testing.md from scripts/check, and has scripts/check run steps that
pass, fail and skip."""

import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile

from sources import ROOT, report


PAGE = ROOT / "docs/testing.md"
FIX = "the table at the head of scripts/check, a function below it, and groups_of in scripts/setup"


def listed_steps():
    """Each step of scripts/check, with what its table says of it."""
    table = re.search(r"^steps='\n(.*?)\n'$", (ROOT / "scripts/check").read_text(), re.M | re.S)
    return dict(line.split(maxsplit=1) for line in table[1].splitlines())


def everyday_steps():
    return re.search(r"/check\" (.*)", (ROOT / "scripts/test").read_text())[1].split()


def page_with_steps():
    """docs/testing.md, with its table as scripts/check has it."""
    everyday = everyday_steps()
    rows = "".join(f"| `{step}`{' *' if step in everyday else ''} | {text} |\n"
                   for step, text in listed_steps().items())
    return re.sub(r"(?<=^\| Step \| What it does \|\n\|---\|---\|\n)(\|.*\n)*", lambda _: rows, PAGE.read_text(),
                  flags=re.M)


def part(path, beginning, end):
    """The text of the file between the two, patterns for whole lines."""
    return re.search(rf"^{beginning}\n(.*?)^{end}$", (ROOT / path).read_text(), re.M | re.S)[1]


def known_to_setup():
    return {word for words in re.findall(r"^ +([\w |]+)\)",
                                         part("scripts/setup", r"groups_of\(\) {[^\n]*", "}"), re.M)
            for word in words.split(" | ")}


def setup_problems():
    """Whatever is asked of scripts/setup is known to it."""
    asked = {("scripts/check", step) for step in listed_steps()}
    for path in (ROOT / "scripts").iterdir():
        asked |= {(path.name, word) for words in re.findall(r"^ *scripts/setup ([\w ]+)$",
                                                            path.read_text(), re.M)
                  for word in words.split()}
    return [f"{who} asks scripts/setup for {word}, which it does not know"
            for who, word in sorted(asked) if word not in known_to_setup()]


def list_problems():
    """Every step is a function, in the same order, and README.md shows the everyday ones."""
    functions = re.findall(r"^step_(\w+)\(\)", (ROOT / "scripts/check").read_text(), re.M)
    shown = re.findall(r"^([a-z]\w+) .*build/logs", part("README.md", r"\$ scripts/test", "```"), re.M)
    return [f"{what}: {found} in place of {expected}"
            for what, found, expected in (("functions of scripts/check", functions, list(listed_steps())),
                                          ("README.md", shown, everyday_steps())) if found != expected]


def check(folder, *steps):
    run = subprocess.run([folder / "scripts/check", *steps], capture_output=True, text=True)
    return re.sub(r"\(\d+ s, ", "(N s, ", run.stdout).splitlines(), run.returncode


def write(path, content):
    path.write_text("#!/bin/bash\n" + content)
    path.chmod(0o755)


def run_problems():
    """What scripts/check makes of steps that end in every way."""
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name)
        (folder / "scripts").mkdir()
        shutil.copy(ROOT / "scripts/check", folder / "scripts")
        write(folder / "scripts/setup", "true")
        write(folder / "scripts/check-arrows", "echo arrow; echo all 3 are allowed")
        write(folder / "scripts/format", "echo bad.cpp; exit 1")
        write(folder / "scripts/run-tests", """echo "test $1 passed"
            echo "skipped A.B: no kernel"
            [[ $1 == release ]] || echo "FAILED A.C: one"
            echo "1 passed"
            [[ $1 == release ]]""")
        found = check(folder, "arrows", "release", "format", "sanitize")
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
        if (found := check(folder, "arrows"))[1] != 0:
            problems.append(f"scripts/check does not pass: {found}")
        if (found := check(folder, "arrow"))[1] != 2:
            problems.append(f"scripts/check takes a step that there is not: {found}")
        write(folder / "scripts/bare-system", "echo on its way; echo skipped: no root; exit 77")
        skipped = ["debian13      skipped: no root (N s, build/logs/debian13.log)"]
        found = check(folder, "debian13", "arrows")
        if found != (skipped + expected[0][:1] + ["steps: 1 passed, 0 failed, 1 skipped"], 0):
            problems.append(f"scripts/check takes a skipped step for another: {found}")
        found = check(folder, "debian13")
        if found != (skipped + ["steps: 0 passed, 0 failed, 1 skipped"], 1):
            problems.append(f"scripts/check passes where no step ran: {found}")
        write(folder / "scripts/setup", "exit 1")
        if (found := check(folder, "arrows"))[1] == 0:
            problems.append(f"scripts/check goes on without its packages: {found}")
    return problems


def emulator_problems():
    """Without an emulator scripts/kernel is a step that was skipped."""
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name)
        (folder / "scripts").mkdir()
        shutil.copy(ROOT / "scripts/kernel", folder / "scripts")
        write(folder / "scripts/setup", "[[ $1 != emulator ]]")
        run = subprocess.run([folder / "scripts/kernel"], capture_output=True, text=True)
        expected = (77, "skipped: there is no qemu, and it cannot be installed\n")
        found = (run.returncode, run.stdout)
        return [] if found == expected else [f"scripts/kernel without qemu ends with {found}"]


def skip_problems():
    """scripts/bare-system says why it cannot be run here, and by its status that it was not."""
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name)
        (folder / "scripts").mkdir()
        shutil.copy(ROOT / "scripts/bare-system", folder / "scripts")
        write(folder / "wget", "exit 4")
        reasons = [("exit 1", "debootstrap is not there, and cannot be installed"),
                   ("true", "there is no http://mirror.invalid/debian/dists/trixie/Release to be had")]
        for setup, reason in reasons:
            write(folder / "scripts/setup", setup)
            expected = reason if os.geteuid() == 0 else "a bare system can be made by root alone"
            run = subprocess.run([folder / "scripts/bare-system", "13"], capture_output=True, text=True,
                                 env={**os.environ, "PATH": f"{folder}:{os.environ['PATH']}",
                                      "DEBIAN_MIRROR": "http://mirror.invalid/debian"}, check=False)
            if (run.returncode, run.stdout) != (77, f"skipped: {expected}\n"):
                yield f"scripts/bare-system ends with {run.returncode}: {run.stdout}{run.stderr}"


if __name__ == "__main__":
    sys.exit(report([*list_problems(), *setup_problems(), *run_problems(), *emulator_problems(), *skip_problems()],
                    FIX, {PAGE: page_with_steps()}))
