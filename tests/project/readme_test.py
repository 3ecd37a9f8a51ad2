#!/usr/bin/env python3
"""Runs scripts/demo, and compares its output with the excerpt in README.md.

Argument: the path of the apktoolkit-sim that scripts/demo uses. In the excerpt, a line of three
dots stands for lines that are left out. The position and the values of the changed byte depend on
the library's compiler, so the test ignores them.
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
    """The excerpt as a regular expression, which must match the whole output."""
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
