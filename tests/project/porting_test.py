#!/usr/bin/env python3
"""Compares docs/porting.md with the sources: the interface, the modules of the blueprint, the
example of a JAR's key block, the links to the page's own headings, and the links to all directories
of integration/. Also compares docs/porting.md and the tool's manual page with the directories of
installed libraries in apk/native_libraries.h. With --write, writes these directories to
docs/porting.md and the manual page."""

import hashlib
import re
import subprocess
import sys

from blueprint import Blueprint
from sources import ROOT, report

PATH = ROOT / "docs/porting.md"
PAGE = PATH.read_text()
MANUAL = ROOT / "man/apktoolkit.1"


def section(title):
    return re.search(rf"^#+ {re.escape(title)}\n(.*?)(?=^#)", PAGE, re.M | re.S)[1]


# A source, the pattern of a value in it, and the page's text with "{}" for the value.
INTERFACE = (
    ("sign/integrity.cpp", r"kSignCommand = (\d+);", "### fcntl(fd, {}, payload): sign\n"),
    ("sign/integrity.cpp", r"kVerifyCommand = (\d+);", "### fcntl(fd, {}): verify\n"),
    ("sign/integrity.cpp", r'"(/proc/self/[^"]+)"', "`{}`"),
    ("sign/integrity.cpp", r"kPollMicroseconds = (\d+)000;", "every {} ms"),
    ("sign/libzu.h", r"result == (0x\w+)", "({})"),
    ("sign/libzu.h", r'(extern "C" int ZuNewCertificate\([^)]*\);)', "\n    {}\n"))


def interface_problems():
    facts = ((path, text, re.search(pattern, (ROOT / path).read_text())) for path, pattern, text in INTERFACE)
    return [f"docs/porting.md does not have the text {text!r} with the value in {path}: {fact and fact[0]}"
            for path, text, fact in facts if not fact or text.format(fact[1]) not in PAGE]


def key_block_problems():
    """Compares the example's four digests with those that Python computes."""
    text = section("ZuNewCertificate(fd, name, data, length)")
    path = re.search(r"^`(/\S+)`:", text, re.M)[1]
    digests, current = [], path.encode()
    for _ in range(4):
        current = hashlib.sha256(current).digest()
        digests.append(current.hex())
    found = re.findall(r"^    ([0-9a-f]{64})$", text, re.M)
    return [] if found == digests else [f"the key block of {path} is {digests}, not {found}"]


def module_problems():
    """Checks that the table of modules names exactly those modules of the blueprint whose type is
    not cc_defaults."""
    named = set(re.findall(r"^\| `(\w[\w-]*)` \|", section("In a platform tree"), re.M))
    built = {module["name"] for module in Blueprint(ROOT / "Android.bp").modules
             if module["type"] != "cc_defaults"}
    return [f"docs/porting.md and Android.bp differ in the module {name}" for name in sorted(named ^ built)]


def link_problems():
    """Checks that every #anchor to which the page links is one of its headings, and that the page
    links every directory of integration/."""
    headings = {re.sub(r"[^\w\- ]", "", title.lower()).replace(" ", "-")
                for title in re.findall(r"^#+ (.*)$", PAGE, re.M)}
    problems = [f"docs/porting.md has no heading #{anchor}"
                for anchor in re.findall(r"\]\(#([^)]+)\)", PAGE) if anchor not in headings]
    files = subprocess.run(["git", "ls-files", "integration"], cwd=ROOT, text=True, check=True,
                           stdout=subprocess.PIPE).stdout.split()
    rooms = {path.split("/")[1] for path in files if path.count("/") > 1}
    return problems + [f"docs/porting.md does not link integration/{room}" for room in sorted(rooms)
                       if f"../integration/{room}" not in PAGE]


def with_library_directories():
    """The correct texts of docs/porting.md and the manual page, with the directories of
    apk/native_libraries.h."""
    installed = {}
    for entry, directory in re.findall(r'\{"(lib/[^"]+)", "(lib/[^"]+)"\}',
                                       (ROOT / "apk/native_libraries.h").read_text()):
        installed.setdefault(directory, []).append(entry)
    rows = "".join(f"| {', '.join(f'`{entry}/`' for entry in entries)} | `{directory}/` |\n"
                   for directory, entries in installed.items())
    items = "".join(f".It Pa {directory}\nBeside a package: the libraries that were extracted from the "
                    "package's\n"
                    + "\nand\n".join(f".Pa {entry}" for entry in entries) + " .\n"
                    for directory, entries in installed.items())
    head = "| Entries of the package | Files beside the package |\n|---|---|\n"
    return {PATH: re.sub(rf"(?<={re.escape(head)})(\|.*\n)*", lambda _: rows, PAGE),
            MANUAL: re.sub(r"(?<=^\.Sh FILES\n\.Bl -tag -width Ds\n)(?:(?:\.It Pa lib/|[^.]|\.Pa ).*\n)*",
                           lambda _: items, MANUAL.read_text(), flags=re.M)}


if __name__ == "__main__":
    sys.exit(report(interface_problems() + key_block_problems() + module_problems() + link_problems(),
                    f"{PATH}: write there what the sources have now", with_library_directories()))
