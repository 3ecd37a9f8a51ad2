#!/usr/bin/env python3
"""Runs the simulator as docs/guide.md shows it, and holds the page against what it prints.

Arguments: the folder of the page's package, and the words that start apktoolkit-sim. A last line of
three dots stands for what follows.
"""

import pathlib
import re
import shlex
import shutil
import subprocess
import sys
import tempfile
import zipfile

from sources import ROOT, report

FOLDER = "/data/app/vault"  # what the page has in place of this test's folder
COMMAND = "$ apktoolkit-sim "


def prepare(package, folder):
    """The files that the page speaks of."""
    shutil.copytree(package, folder, dirs_exist_ok=True)
    shutil.copytree(package, folder / "tampered")
    library = folder / "tampered/lib/arm64/libvault.so"
    library.write_bytes(library.read_bytes()[:-1])
    (folder / "alone").mkdir()
    shutil.copy(package / "base.apk", folder / "alone")
    (folder / "notes.txt").write_text("nothing")
    with zipfile.ZipFile(folder / "library.jar", "w") as archive:
        archive.writestr("a.txt", "a")


def check(block, simulator, folder):
    """The problems of one block: its first line is the command, the others what it prints."""
    command, *expected = block.splitlines()
    run = subprocess.run([*simulator, *shlex.split(command.removeprefix(COMMAND))], cwd=folder,
                         capture_output=True, text=True)
    printed = (run.stdout + run.stderr).replace(str(folder), FOLDER).splitlines()
    if expected and expected[-1].strip() == "...":
        expected.pop()
        printed = printed[:len(expected)]
    return [] if printed == expected else [f"{command} prints:", *printed]


def main():
    page = (ROOT / "docs/guide.md").read_text()
    blocks = re.findall(r"^```\n(%s.*?)\n```$" % re.escape(COMMAND), page, re.M | re.S)
    problems = [] if blocks else ["docs/guide.md shows no command"]
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name).resolve()
        prepare(pathlib.Path(sys.argv[1]), folder)
        for block in blocks:
            problems += check(block, sys.argv[2:], folder)
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
