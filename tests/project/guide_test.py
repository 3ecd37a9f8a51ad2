#!/usr/bin/env python3
"""Runs the commands that docs/guide.md shows, and compares their output with the page. With
--write, writes the output to the page instead.

Arguments: the directory of the golden packages (tests/journeys/make_golden_packages), and the
command line that starts apktoolkit-sim. If the last line below a command is three dots, this line
stands for all further output. If the three dots are the only line, the command may print anything.
"""

import pathlib
import re
import shutil
import sys
import tempfile
import zipfile

from sources import ROOT, Shell, report, shown_commands

PAGE = ROOT / "docs/guide.md"
DIRECTORY = "/data/app/vault"  # the page has this path in place of the test's temporary directory
BLOCK = re.compile(r"^```\n(\$ .*?)\n```$", re.M | re.S)

# Texts that change with each new certificate, or with the compiler that built libvault.so. The page
# may have any value for them.
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


def settled(lines):
    text = "\n".join(lines)
    for pattern, replacement in VARIES:
        text = pattern.sub(replacement, text)
    return text.splitlines()


def checked(block, shell):
    """Returns the block with the current output of its commands. If the page's output of a command
    differs from the current output only in the texts of VARIES, returns the page's output for this
    command."""
    lines = []
    for command, expected in shown_commands(block):
        shown = shell.run(command).stdout.replace(str(shell.directory), DIRECTORY).splitlines()
        if expected and expected[-1].strip() == "...":
            shown = shown[:len(expected) - 1] + expected[-1:]
        lines += [f"$ {command}", *(expected if settled(shown) == settled(expected) else shown)]
    return "\n".join(lines)


def main():
    golden, *simulator = sys.argv[1:]
    page = PAGE.read_text()
    problems = [] if BLOCK.search(page) else ["docs/guide.md shows no command"]
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name).resolve()
        prepare(pathlib.Path(golden), directory)
        shell = Shell(directory, simulator)
        for block in BLOCK.findall(page):
            page = page.replace(block, checked(block, shell), 1)
    return report(problems, PAGE, {PAGE: page})


if __name__ == "__main__":
    sys.exit(main())
