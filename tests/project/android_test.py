#!/usr/bin/env python3
"""Runs scripts/android on objects that call functions which API level 27 lacks, and on objects that
do not."""

import pathlib
import subprocess
import sys
import tempfile

from sources import ROOT, report

# Functions that API level 27 lacks: declaration, name as scripts/android prints it, and a call.
LATER = {
    "int memfd_create(const char*, unsigned);": ("memfd_create", 'memfd_create("", 0)'),
    "long getrandom(void*, unsigned long, unsigned);": ("getrandom", "getrandom(0, 0, 0)"),
    "void* reallocarray(void*, unsigned long, unsigned long);": ("reallocarray", "reallocarray(0, 1, 1) != 0"),
    "bool _ZNSt3__14__fs10filesystem8__statusERKNS1_4pathEPNS_10error_codeE(void*, void*);": (
        "std::__1::__fs::filesystem::__status",
        "_ZNSt3__14__fs10filesystem8__statusERKNS1_4pathEPNS_10error_codeE(0, 0)"),
}
EARLIER = 'long read(int, void*, unsigned long); int Own(); int Call() { return Own() + read(0, 0, 0); }'
OWN = "int Own() { return 1; }"


def compiled(directory, name, text):
    source, built = directory / f"{name}.cpp", directory / f"{name}.o"
    source.write_text('extern "C" {\n' + text + "\n}\n")
    subprocess.run(["clang++", "--target=aarch64-linux-android27", "-c", source, "-o", built], check=True)
    return built


def compare(*objects):
    return subprocess.run([ROOT / "scripts/android", "--symbols", *objects], text=True,
                          stdout=subprocess.PIPE, stderr=subprocess.STDOUT, check=False)


def main():
    problems = []
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        good, own = compiled(directory, "good", EARLIER), compiled(directory, "own", OWN)
        result = compare(good, own)
        if result.returncode != 0 or "2 objects" not in result.stdout:
            problems.append(f"functions that the API level has are refused: {result.stdout}")
        result = compare(good)
        if result.returncode != 1 or f"Own called by {good}\n" not in result.stdout:
            problems.append(f"a call of a function that no object defines is not noticed: {result.stdout}")
        for declaration, (symbol, call) in LATER.items():
            bad = compiled(directory, "bad", f"{declaration} int Later() {{ return {call}; }}")
            result = compare(good, own, bad)
            if result.returncode != 1 or symbol not in result.stdout or "read" in result.stdout:
                problems.append(f"{symbol} is not reported, or the function read is reported too: {result.stdout}")
        if compare().returncode == 0:
            problems.append("scripts/android --symbols succeeds without objects")
    return report(problems, "the function compare in scripts/android")


if __name__ == "__main__":
    sys.exit(main())
