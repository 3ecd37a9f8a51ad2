#!/usr/bin/env python3
"""Runs what docs/guide.md shows, and writes what is printed.

Arguments: the directory of the golden packages, and the words that start apktoolkit-sim. A last line of
three dots stands for the lines that follow; a command with nothing else may print anything.
"""

import pathlib
import re
import shutil
import sys
import tempfile
import zipfile

from sources import ROOT, Shell, report, shown_commands

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
                         ("added-entry", "added-entry")):
        shutil.copytree(golden / source, folder / name)
    (folder / "alone").mkdir()
    shutil.copy(package / "base.apk", folder / "alone")
    shutil.copy(golden / "unsigned.apk", folder)
    shutil.copy(golden / "rsa-2048.pem", folder / "signer.pem")
    (folder / "notes.txt").write_text("nothing")
    with zipfile.ZipFile(folder / "library.jar", "w") as archive:
        archive.writestr("a.txt", "a")


def settled(lines):
    text = "\n".join(lines)
    for pattern, replacement in VARIES:
        text = pattern.sub(replacement, text)
    return text.splitlines()


def checked(block, shell):
    """The block as it should be."""
    lines = []
    for command, expected in shown_commands(block):
        shown = shell.run(command).stdout.replace(str(shell.folder), FOLDER).splitlines()
        if expected and expected[-1].strip() == "...":
            shown = shown[:len(expected) - 1] + expected[-1:]
        lines += [f"$ {command}", *(expected if settled(shown) == settled(expected) else shown)]
    return "\n".join(lines)


def main():
    golden, *simulator = sys.argv[1:]
    page = PAGE.read_text()
    problems = [] if BLOCK.search(page) else ["docs/guide.md shows no command"]
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name).resolve()
        prepare(pathlib.Path(golden), folder)
        shell = Shell(folder, simulator)
        for block in BLOCK.findall(page):
            page = page.replace(block, checked(block, shell), 1)
    return report(problems, PAGE, {PAGE: page})


if __name__ == "__main__":
    sys.exit(main())
