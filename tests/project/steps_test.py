#!/usr/bin/env python3
"""Compares the steps of scripts/check with docs/testing.md, README.md and scripts/setup. With
--write, rewrites the table of steps in docs/testing.md. Checks what scripts/check prints for steps
that pass, fail or are skipped. Checks that scripts/kernel and scripts/bare-system are skipped if
they cannot run."""

import contextlib
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
    """Each step of scripts/check, with its text in the table there."""
    table = re.search(r"^steps='\n(.*?)\n'$", (ROOT / "scripts/check").read_text(), re.M | re.S)
    return dict(line.split(maxsplit=1) for line in table[1].splitlines())


def everyday_steps():
    return re.search(r"/check\" (.*)", (ROOT / "scripts/test").read_text())[1].split()


def page_with_steps():
    """The text of docs/testing.md, with the table from scripts/check."""
    everyday = everyday_steps()
    rows = "".join(f"| `{step}`{' *' if step in everyday else ''} | {text} |\n"
                   for step, text in listed_steps().items())
    return re.sub(r"(?<=^\| Step \| What it does \|\n\|---\|---\|\n)(\|.*\n)*", lambda _: rows, PAGE.read_text(),
                  flags=re.M)


def part(path, beginning, end):
    """The text of the file between two lines, which the patterns `beginning` and `end` match."""
    return re.search(rf"^{beginning}\n(.*?)^{end}$", (ROOT / path).read_text(), re.M | re.S)[1]


def known_to_setup():
    return {word for words in re.findall(r"^ +([\w |]+)\)",
                                         part("scripts/setup", r"groups_of\(\) {[^\n]*", "}"), re.M)
            for word in words.split(" | ")}


def setup_problems():
    """Checks that scripts/setup knows every step of scripts/check, and every step that a script
    passes to scripts/setup by name."""
    asked = {("scripts/check", step) for step in listed_steps()}
    for path in (ROOT / "scripts").iterdir():
        asked |= {(f"scripts/{path.name}", word)
                  for words in re.findall(r"^ *scripts/setup ([\w ]+?)(?: \|\| .*)?$", path.read_text(), re.M)
                  for word in words.split()}
    return [f"{who} asks scripts/setup for {word}, which it does not know"
            for who, word in sorted(asked) if word not in known_to_setup()]


def list_problems():
    """Checks that scripts/check has a function for every step, in the order of its table. Checks
    that README.md shows the everyday steps, which are those of scripts/test."""
    functions = re.findall(r"^step_(\w+)\(\)", (ROOT / "scripts/check").read_text(), re.M)
    shown = re.findall(r"^([a-z]\w+) .*build/logs", part("README.md", r"\$ scripts/test", "```"), re.M)
    return [f"{what}: {found} in place of {expected}"
            for what, found, expected in (("functions of scripts/check", functions, list(listed_steps())),
                                          ("README.md", shown, everyday_steps())) if found != expected]


def check(directory, *steps):
    run = subprocess.run([directory / "scripts/check", *steps], capture_output=True, text=True)
    return re.sub(r"\(\d+ s, ", "(N s, ", run.stdout).splitlines(), run.returncode


@contextlib.contextmanager
def scripts(name):
    """Yields a new directory that contains only a copy of the project's script scripts/`name`."""
    with tempfile.TemporaryDirectory() as directory:
        (pathlib.Path(directory) / "scripts").mkdir()
        shutil.copy(ROOT / "scripts" / name, pathlib.Path(directory) / "scripts")
        yield pathlib.Path(directory)


def write(path, content):
    path.write_text("#!/bin/bash\n" + content)
    path.chmod(0o755)


def run_problems():
    """Checks the output and the status of scripts/check for steps that pass, fail and are
    skipped."""
    with scripts("check") as directory:
        write(directory / "scripts/setup", "true")
        write(directory / "scripts/check-arrows", "echo arrow; echo all 3 are allowed")
        write(directory / "scripts/format", "echo bad.cpp; exit 1")
        write(directory / "scripts/run-tests", """echo "test $1 passed"
            echo "skipped A.B: no kernel"
            [[ $1 == release ]] || echo "FAILED A.C: one"
            echo "1 passed"
            [[ $1 == release ]]""")
        write(directory / "scripts/bare-system", "echo on its way; echo skipped: no root; exit 77")
        arrows = "arrows        all 3 are allowed (N s, build/logs/arrows.log)"
        skipped = "debian13      skipped: no root (N s, build/logs/debian13.log)"
        for steps, printed, status in (
                ("arrows release format sanitize",
                 [arrows, "release       1 passed (N s, build/logs/release.log)", "    skipped A.B: no kernel",
                  "format        FAILED (N s, build/logs/format.log)", "    bad.cpp",
                  "sanitize      FAILED (N s, build/logs/sanitize.log)", "    skipped A.B: no kernel",
                  "    FAILED A.C: one", "    1 passed", "steps: 2 passed, 2 failed, 0 skipped"], 1),
                ("arrows", [arrows, "steps: 1 passed, 0 failed, 0 skipped"], 0),
                ("arrow", [], 2),
                ("debian13 arrows", [skipped, arrows, "steps: 1 passed, 0 failed, 1 skipped"], 0),
                ("debian13", [skipped, "steps: 0 passed, 0 failed, 1 skipped"], 1)):
            if (found := check(directory, *steps.split())) != (printed, status):
                yield f"scripts/check {steps} ends with {found}"
        write(directory / "scripts/setup", "exit 1")
        if (found := check(directory, "arrows"))[1] == 0:
            yield f"scripts/check succeeds although scripts/setup failed: {found}"


def skip_problems():
    """Checks that scripts/kernel and scripts/bare-system print the reason and end with 77 if they
    cannot run."""
    needs_root = "only root can make a bare system"
    for script, setup, reason in (
            ("kernel", "[[ $1 != emulator ]]", "qemu is missing, and apt-get cannot install it"),
            ("bare-system 13", "exit 1", "debootstrap is missing, and apt-get cannot install it"),
            ("bare-system 13", "true", "http://mirror.invalid/debian/dists/trixie/Release cannot be fetched")):
        with scripts(script.split()[0]) as directory:
            write(directory / "wget", "exit 4")
            write(directory / "scripts/setup", setup)
            expected = needs_root if script != "kernel" and os.geteuid() != 0 else reason
            run = subprocess.run(["bash", "-c", f"scripts/{script}"], cwd=directory, capture_output=True, text=True,
                                 env={**os.environ, "PATH": f"{directory}:{os.environ['PATH']}",
                                      "DEBIAN_MIRROR": "http://mirror.invalid/debian"}, check=False)
        if (run.returncode, run.stdout) != (77, f"skipped: {expected}\n"):
            yield f"scripts/{script} ends with {run.returncode}: {run.stdout}{run.stderr}"


if __name__ == "__main__":
    sys.exit(report([*list_problems(), *setup_problems(), *run_problems(), *skip_problems()],
                    FIX, {PAGE: page_with_steps()}))
