#!/usr/bin/env python3
"""Runs the commands of docs/guide.md, and compares the page with their output.

Arguments: the directory of the golden packages, and the words that start apktoolkit-sim. With
--write before them, the page is updated instead. A last line of three dots stands for the rest of
the output. A command followed by three dots alone may print anything.
"""

import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile
import zipfile

from sources import ROOT, path_with_simulator, report

PAGE = ROOT / "docs/guide.md"
DIRECTORY = "/data/app/vault"  # replaces the path of this test's directory on the page
BLOCK = re.compile(r"^```\n(\$ .*?)\n```$", re.M | re.S)

# Texts that differ with each new certificate, and with each compiler of the library. Any value is
# right on the page.
VARIES = [(re.compile(r"certificate SHA-256 digest: [0-9a-f]{64}"), "certificate SHA-256 digest: *"),
          (re.compile(r"\(\d+ bytes\) verified"), "(* bytes) verified"),
          (re.compile(r"(signer CN=Example, RSA-2048, key ).*"), r"\1*")]


def prepare(golden, directory):
    """Makes the files that the page names."""
    package = golden / "apksigner-sha256-2048"
    shutil.copy(package / "base.apk", directory)
    shutil.copytree(package, directory / "tampered")
    library = directory / "tampered/lib/arm64/libvault.so"
    library.write_bytes(library.read_bytes()[:-1])
    for name, source in (("newer-only", "apksigner-newer-only"), ("changed-dex", "changed-dex"),
                         ("added-entry", "added-entry"), ("sha1", "apksigner-sha1-2048")):
        shutil.copytree(golden / source, directory / name)
    (directory / "alone").mkdir()
    shutil.copy(package / "base.apk", directory / "alone")
    shutil.copy(golden / "unsigned.apk", directory)
    shutil.copy(golden / "rsa-2048.pem", directory / "signer.pem")
    (directory / "notes.txt").write_text("nothing")
    with zipfile.ZipFile(directory / "library.jar", "w") as archive:
        archive.writestr("a.txt", "a")


def commands(block):
    """The commands of one block, each with its output on the page."""
    for part in re.split(r"^\$ ", block, flags=re.M)[1:]:
        command, *expected = part.splitlines()
        yield command, expected


class Shell:
    """A shell in the directory. A command finds the files and variables that earlier commands left."""

    def __init__(self, directory, simulator):
        self.directory = directory
        self.path = path_with_simulator(directory, simulator)
        self.status = 0

    def run(self, command):
        run = subprocess.run(["bash", "-c", f"(exit {self.status})\n{command}"], cwd=self.directory,
                             env={**os.environ, "PATH": self.path, "LC_ALL": "C.UTF-8"},
                             stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
        self.status = run.returncode
        return run.stdout.replace(str(self.directory), DIRECTORY).splitlines()


def settled(lines):
    text = "\n".join(lines)
    for pattern, replacement in VARIES:
        text = pattern.sub(replacement, text)
    return text.splitlines()


def check(block, shell):
    """The problems of one block, and the block as it should be."""
    problems, lines = [], []
    for command, expected in commands(block):
        printed = shell.run(command)
        if expected and expected[-1].strip() == "...":
            shown = printed[:len(expected) - 1] + expected[-1:]
        else:
            shown = printed
        if settled(shown) != settled(expected):
            problems += [f"$ {command} prints:", *printed]
        lines += [f"$ {command}", *(expected if settled(shown) == settled(expected) else shown)]
    return problems, "\n".join(lines)


def main():
    arguments = sys.argv[1:]
    writes = arguments[0] == "--write"
    golden, *simulator = arguments[1:] if writes else arguments
    page = PAGE.read_text()
    problems = [] if BLOCK.search(page) else ["docs/guide.md shows no command"]
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name).resolve()
        prepare(pathlib.Path(golden), directory)
        shell = Shell(directory, simulator)
        for block in BLOCK.findall(page):
            found, right = check(block, shell)
            problems += found
            page = page.replace(block, right, 1)
    if writes:
        PAGE.write_text(page)
        return 0
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
