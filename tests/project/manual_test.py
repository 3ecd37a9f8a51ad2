#!/usr/bin/env python3
"""Checks the manual pages with mandoc, compares the simulator's page and completion with --help,
and runs the page's examples.

Arguments: the directory of a good package, and the command line that starts apktoolkit-sim.
"""

import pathlib
import re
import shutil
import subprocess
import sys
import tempfile
import zipfile

from sources import ROOT, Shell, report


def lint(page):
    """mandoc's complaints. Leaves out the complaint that a page of the project is not installed."""
    output = subprocess.run(["mandoc", "-T", "lint", page], capture_output=True, text=True)
    return [line for line in output.stdout.splitlines()
            if "referenced manual not found: Xr apktoolkit" not in line]


def options(text):
    return set(re.findall(r"(?<![\w-])--[a-z][a-z-]*", text))


def examples(page):
    """The commands of the page's examples, as a user types them."""
    section = page.split(".Sh EXAMPLES\n")[1].split("\n.Sh ")[0]
    for single, block in re.findall(r"^\.Dl \$ (.*)$|^\.Bd -literal.*\n\$ ((?:.*\n)*?)\.Ed$", section, re.M):
        yield (single or block).replace("\\e", "\\")


def run_examples(page, package, simulator):
    """Runs the page's examples. Returns a problem for each example that prints no result, prints an
    error, or ends with a status above 1. Returns a problem if the page has no examples."""
    problems = []
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        shutil.copytree(package, directory, dirs_exist_ok=True)
        with zipfile.ZipFile(directory / "library.jar", "w") as archive:
            archive.writestr("a.txt", "a")
        shell, count = Shell(directory, simulator), 0
        for example in examples(page):
            shell.status = 0
            run = shell.run(example, subprocess.PIPE)
            count += 1
            if run.returncode > 1 or run.stderr or not run.stdout:
                problems += [f"$ {example}", f"ends with {run.returncode} and prints:", run.stdout + run.stderr]
    return problems if count else ["the page has no examples"]


def main():
    package, *simulator = sys.argv[1:]
    problems = []
    for page in sorted((ROOT / "man").glob("*.1")):
        problems += lint(page)
    usage = subprocess.run([*simulator, "--help"], capture_output=True, text=True, check=True)
    known = options(usage.stdout)
    page = (ROOT / "man/apktoolkit-sim.1").read_text()
    described = {"-" + name for name in re.findall(r"\bFl (-[a-z][a-z-]*)", page)}
    completed = options(re.sub(r"#.*", "", (ROOT / "simulator/apktoolkit-sim.bash").read_text()))
    for where, found in (("manual page", described), ("completion", completed)):
        problems += [f"{option} is not in the {where}" for option in sorted(known - found)]
        problems += [f"{option} in the {where} is not an option" for option in sorted(found - known)]
    problems += run_examples(page, package, simulator)
    return report(problems, "man/*.1 and simulator/apktoolkit-sim.bash; the options are those of simulator/options.cpp")


if __name__ == "__main__":
    sys.exit(main())
