#!/usr/bin/env python3
"""Tests the check "hardened" of scripts/check-binary. The check must accept hardened programs, and
refuse programs that lack one part of the hardening.

Argument: the compiler.
"""

import pathlib
import subprocess
import sys
import tempfile

from sources import ROOT, report

# A program that needs the hardening: it has a buffer on the stack, and a call with a buffer of
# known size.
SOURCE = """#include <stdio.h>
#include <string.h>
int main(int count, char** words) {
  char text[100];
  memcpy(text, words[0], (size_t)count);
  puts(text);
  return 0;
}
"""

# The flags of a hardened program, by part of the hardening. A row of BAD replaces the flags of one
# part. The last part, "exec", means that the stack is not executable. This part needs no flag. Its
# entry has -O2, which _FORTIFY_SOURCE needs.
GOOD = {"bind": "-Wl,-z,now", "table": "-Wl,-z,relro", "place": "-pie -fPIE",
        "stack": "-fstack-protector-strong", "calls": "-D_FORTIFY_SOURCE=2", "exec": "-O2"}

# A part, the flags that remove it, and the message for a program without it.
BAD = [("bind", "-Wl,-z,lazy", "binds its symbols when they are called"),
       ("table", "-Wl,-z,norelro", "stay writable"),
       ("place", "-no-pie -fno-pie", "is not position-independent"),
       ("stack", "-fno-stack-protector", "no stack is protected"),
       ("calls", "-U_FORTIFY_SOURCE", "no call is checked"),
       ("exec", "-O2 -Wl,-z,execstack", "is executable")]


def compiled(compiler, directory, parts, *more):
    (directory / "source.cpp").write_text(SOURCE)
    flags = " ".join(parts.values()).split()
    subprocess.run([compiler, *flags, *more, "source.cpp", "-o", "made"], cwd=directory, check=True)
    return directory / "made"


def check(*files):
    return subprocess.run([ROOT / "scripts/check-binary", "hardened", *files], text=True,
                          stdout=subprocess.PIPE, stderr=subprocess.STDOUT, check=False)


def main():
    compiler = sys.argv[1]
    arm = subprocess.run([compiler, "-dumpmachine"], check=True, text=True,
                         capture_output=True).stdout.startswith("aarch64")
    problems = []
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        result = check(compiled(compiler, directory, GOOD))
        if result.returncode != 0 or "hardened: made\n" not in result.stdout:
            problems.append(f"a hardened program is refused: {result.stdout}")
        for part, instead, message in BAD:
            result = check(compiled(compiler, directory, {**GOOD, part: instead}))
            if result.returncode != 1 or message not in result.stdout:
                problems.append(f"{instead} is not noticed: {result.stdout}")
        if arm:
            branches = {**GOOD, "branches": "-mbranch-protection=standard"}
            if (result := check(compiled(compiler, directory, branches, "-c"))).returncode != 0:
                problems.append(f"a hardened object is refused: {result.stdout}")
            result = check(compiled(compiler, directory, GOOD, "-c"))
            if result.returncode != 1 or "0 of 1 objects" not in result.stdout:
                problems.append(f"unprotected branches are not noticed: {result.stdout}")
        if check().returncode == 0:
            problems.append("an empty list of files is accepted as hardened")
        if check(directory / "missing").returncode == 0:
            problems.append("a missing file is accepted as hardened")
    return report(problems, "scripts/check-binary")


if __name__ == "__main__":
    sys.exit(main())
