#!/usr/bin/env python3
"""Runs scripts/demo, and compares README.md's excerpt with its output.

Arguments: the command of the built apktoolkit-sim. A line of three dots on the page stands for
lines that are left out. The number of the changed byte and its value depend on the library's
compiler.
"""

import os
import re
import subprocess
import sys

from sources import ROOT, report

BLOCK = re.compile(r"^```\n\$ scripts/demo\n(.*?)\n```$", re.M | re.S)
CHANGED_BYTE = re.compile(r"byte \d+ is now \w\w, was \w\w")


def settled(text):
    return CHANGED_BYTE.sub("byte N is now N, was N", text)


def pattern(shown):
    """A regular expression for the page's excerpt that the whole output matches."""
    parts = (re.escape(line + "\n") if line != "..." else r"(?:.*\n)*?" for line in shown)
    return "".join(parts)


def main():
    shown = settled(BLOCK.search((ROOT / "README.md").read_text())[1]).splitlines()
    run = subprocess.run([ROOT / "scripts/demo", sys.argv[1]], capture_output=True, text=True,
                         env={**os.environ, "LC_ALL": "C.UTF-8"})
    problems = [] if run.returncode == 0 else [f"scripts/demo ends with {run.returncode}", run.stderr]
    if not re.fullmatch(pattern(shown), settled(run.stdout)):
        problems += ["scripts/demo prints:", run.stdout]
    return report(problems, "the block `$ scripts/demo` in README.md, by hand")


if __name__ == "__main__":
    sys.exit(main())
