#!/usr/bin/env python3
"""Holds the manual pages against mandoc, and the simulator's page and completion against --help.

Arguments: the words that start apktoolkit-sim.
"""

import re
import subprocess
import sys

from sources import ROOT, report


def lint(page):
    """What mandoc has to say, except that the project's other page is not installed."""
    output = subprocess.run(["mandoc", "-T", "lint", page], capture_output=True, text=True)
    return [line for line in output.stdout.splitlines()
            if "referenced manual not found: Xr apktoolkit" not in line]


def options(text):
    return set(re.findall(r"(?<![\w-])--[a-z][a-z-]*", text))


def main():
    problems = []
    for page in sorted((ROOT / "man").glob("*.1")):
        problems += lint(page)
    usage = subprocess.run([*sys.argv[1:], "--help"], capture_output=True, text=True, check=True)
    known = options(usage.stdout)
    page = (ROOT / "man/apktoolkit-sim.1").read_text()
    described = {"-" + name for name in re.findall(r"\bFl (-[a-z][a-z-]*)", page)}
    completed = options(re.sub(r"#.*", "", (ROOT / "simulator/apktoolkit-sim.bash").read_text()))
    for where, found in (("manual page", described), ("completion", completed)):
        problems += [f"{option} is not in the {where}" for option in sorted(known - found)]
        problems += [f"{option} in the {where} is no option" for option in sorted(found - known)]
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
