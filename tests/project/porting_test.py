#!/usr/bin/env python3
"""Compares docs/porting.md with the project: the interface in the sources, the modules of the
blueprint, the example of a JAR's key block, and the files of integration/, which it must all
name."""

import hashlib
import re
import subprocess
import sys

from blueprint import Blueprint
from sources import ROOT, report

PAGE = (ROOT / "docs/porting.md").read_text()


def section(title):
    return re.search(rf"^#+ {re.escape(title)}\n(.*?)(?=^#)", PAGE, re.M | re.S)[1]


def interface_problems():
    """Numbers and names are those of the sources."""
    integrity = (ROOT / "sign/integrity.cpp").read_text()
    libzu = (ROOT / "sign/libzu.h").read_text()
    wanted = []
    for constant, heading in (("kSignCommand", "fcntl(fd, {}, payload): sign"),
                              ("kVerifyCommand", "fcntl(fd, {}): verify")):
        number = re.search(constant + r" = (\d+);", integrity)[1]
        wanted.append(f"### {heading.format(number)}\n")
    for path in re.findall(r'"(/proc/self/[^"]+)"', integrity):
        wanted.append(f"`{path}`")
    milliseconds = int(re.search(r"kPollMicroseconds = (\d+);", integrity)[1]) // 1000
    wanted.append(f"every {milliseconds} ms")
    success = re.search(r"result == (0x\w+)", libzu)[1]
    wanted.append(f"{int(success, 16)} ({success})")
    declaration = re.search(r'(extern "C" int ZuNewCertificate\([^)]*\);)', libzu)[1]
    wanted.append(f"\n    {declaration}\n")
    return [f"docs/porting.md does not say {text!r}" for text in wanted if text not in PAGE]


def key_block_problems():
    """Python computes the example's four digests."""
    text = section("ZuNewCertificate(fd, name, data, length)")
    path = re.search(r"^`(/\S+)`:", text, re.M)[1]
    digests, current = [], path.encode()
    for _ in range(4):
        current = hashlib.sha256(current).digest()
        digests.append(current.hex())
    found = re.findall(r"^    ([0-9a-f]{64})$", text, re.M)
    return [] if found == digests else [f"the key block of {path} is {digests}, not {found}"]


def module_problems():
    """The table of modules has all modules of the blueprint that a product may name."""
    named = set(re.findall(r"^\| `(\w[\w-]*)` \|", section("In a platform tree"), re.M))
    built = {module["name"] for module in Blueprint(ROOT / "Android.bp").modules
             if module["type"] != "cc_defaults"}
    return [f"docs/porting.md and Android.bp differ in the module {name}" for name in sorted(named ^ built)]


def link_problems():
    """Every linked file exists, and every file of integration/ is named."""
    problems = []
    for link in re.findall(r"\]\(([^)#]+)(?:#[^)]*)?\)", PAGE):
        if not (ROOT / "docs" / link).exists():
            problems.append(f"docs/porting.md links {link}, which is not there")
    headings = {re.sub(r"[^\w\- ]", "", title.lower()).replace(" ", "-")
                for title in re.findall(r"^#+ (.*)$", PAGE, re.M)}
    problems += [f"docs/porting.md has no heading #{anchor}"
                 for anchor in re.findall(r"\]\(#([^)]+)\)", PAGE) if anchor not in headings]
    files = subprocess.run(["git", "ls-files", "integration"], cwd=ROOT, text=True, check=True,
                           stdout=subprocess.PIPE).stdout.split()
    rooms = {path.split("/")[1] for path in files if path.count("/") > 1}
    return problems + [f"docs/porting.md does not link integration/{room}" for room in sorted(rooms)
                       if f"../integration/{room}" not in PAGE]


if __name__ == "__main__":
    sys.exit(report(interface_problems() + key_block_problems() + module_problems() + link_problems()))
