#!/usr/bin/env python3
"""Runs what docs/guide.md shows, and holds the page against what is printed.

Arguments: the folder of the golden packages, and the words that start apktoolkit-sim. With --write
before them, the page is brought up to date instead. A last line of three dots stands for what
follows, and a command that is followed by them alone prints what it likes.
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
FOLDER = "/data/app/vault"  # what the page has in place of this test's folder
BLOCK = re.compile(r"^```\n(\$ .*?)\n```$", re.M | re.S)

# What is another with each certificate that is made, and with each compiler of the library: on the
# page, any will do.
VARIES = [(re.compile(r"certificate SHA-256 digest: [0-9a-f]{64}"), "certificate SHA-256 digest: *"),
          (re.compile(r"\(\d+ bytes\) verified"), "(* bytes) verified"),
          (re.compile(r"(signer CN=Example, RSA-2048, key ).*"), r"\1*")]


def prepare(golden, folder):
    """The files that the page speaks of."""
    package = golden / "apksigner-sha256-2048"
    shutil.copy(package / "base.apk", folder)
    shutil.copytree(package, folder / "tampered")
    library = folder / "tampered/lib/arm64/libvault.so"
    library.write_bytes(library.read_bytes()[:-1])
    for name, source in (("newer-only", "apksigner-newer-only"), ("changed-dex", "changed-dex"),
                         ("added-entry", "added-entry"), ("sha1", "apksigner-sha1-2048")):
        shutil.copytree(golden / source, folder / name)
    (folder / "alone").mkdir()
    shutil.copy(package / "base.apk", folder / "alone")
    shutil.copy(golden / "unsigned.apk", folder)
    shutil.copy(golden / "rsa-2048.pem", folder / "signer.pem")
    (folder / "notes.txt").write_text("nothing")
    with zipfile.ZipFile(folder / "library.jar", "w") as archive:
        archive.writestr("a.txt", "a")


def commands(block):
    """The commands of one block, each with the lines that it prints on the page."""
    for part in re.split(r"^\$ ", block, flags=re.M)[1:]:
        command, *expected = part.splitlines()
        yield command, expected


class Shell:
    """A shell in the folder, so that a command finds what the one before it left."""

    def __init__(self, folder, simulator):
        self.folder = folder
        self.path = path_with_simulator(folder, simulator)
        self.status = 0

    def run(self, command):
        run = subprocess.run(["bash", "-c", f"(exit {self.status})\n{command}"], cwd=self.folder,
                             env={**os.environ, "PATH": self.path, "LC_ALL": "C.UTF-8"},
                             stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
        self.status = run.returncode
        return run.stdout.replace(str(self.folder), FOLDER).splitlines()


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
        folder = pathlib.Path(name).resolve()
        prepare(pathlib.Path(golden), folder)
        shell = Shell(folder, simulator)
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
