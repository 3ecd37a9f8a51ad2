#!/usr/bin/env python3
"""Holds the file lists of the Android.bp files against those of CMake, and both against the folders."""

import pathlib
import re
import sys

from sources import ROOMS, ROOT, report, tool_sources, without_comments

# What needs more than a phone has, and so is in the workstation's build alone.
WORKSTATION_ONLY = {
    "tests/apk/manifest_mf_test.cpp": "runs the JDK",
    "tests/crypto/mpi_mod_mpi_test.cpp": "compares with GMP",
    "tests/crypto/mpi_pow_mod_test.cpp": "compares with GMP",
    "tests/crypto/mpi_test.cpp": "compares with GMP",
    "tests/crypto/pkcs7_signer_test.cpp": "runs openssl",
    "tests/crypto/rsa_test.cpp": "compares with GMP",
    "tests/crypto/x509_authorities_test.cpp": "runs openssl",
    "tests/util/digest_test.cpp": "runs coreutils",
    "fuzz/compiled_manifest_fuzz.cpp": "replaces the program's operator new",
    "fuzz/explanation_fuzz.cpp": "reads with the simulator",
    "fuzz/integrity_fuzz.cpp": "has the linker wrap calls of the C library",
    "fuzz/mpi_fuzz.cpp": "compares with GMP",
    "fuzz/package_fuzz.cpp": "has the linker wrap a call of the zip library",
}

TOKEN = re.compile(r'"((?:[^"\\]|\\.)*)"|([A-Za-z_]\w*|\d+)|([{}\[\]:,=+])|(\S)')


class Blueprint:
    """The modules of an Android.bp file: each a dictionary, its type under the key "type"."""

    def __init__(self, path):
        self.path = path
        self.tokens = [(m[1], m[2] or m[3] or m[4])
                       for m in TOKEN.finditer(without_comments(path.read_text()))]
        self.modules = []
        while self.tokens:
            kind = self.word()
            self.modules.append({"type": kind, **self.value()})

    def word(self, expected=None):
        text, word = self.tokens.pop(0)
        if text is not None or (expected and word != expected):
            sys.exit(f"{self.path}: found {text or word!r} where {expected or 'a word'} should be")
        return word

    def value(self):
        text, word = self.tokens.pop(0)
        if text is not None:
            return text
        if word == "[":
            return list(self.items("]", self.value))
        if word == "{":
            return dict(self.items("}", self.property))
        return {"true": True, "false": False}.get(word, word)

    def property(self):
        key = self.word()
        self.word(":")
        return key, self.value()

    def items(self, end, read):
        while self.tokens[0][1] != end:
            yield read()
            if self.tokens[0][1] != end:
                self.word(",")
        self.word(end)

    def sources(self, name):
        found = [m for m in self.modules if m.get("name") == name]
        if len(found) != 1:
            sys.exit(f"{self.path}: {len(found)} modules are named {name}")
        folder = self.path.parent.relative_to(ROOT)
        return sorted(str(folder / source) for source in found[0]["srcs"])


    def all_sources(self, kind):
        folder = self.path.parent.relative_to(ROOT)
        return [str(folder / source) for module in self.modules if module["type"] == kind
                for source in module["srcs"]]


def cmake_sources(target, folder="."):
    path = ROOT / folder / "CMakeLists.txt"
    found = re.search(r"(?:add_library|add_executable|apktoolkit_add_test)\(%s\s+([^)]*)\)" % target,
                      re.sub(r"#.*", "", path.read_text()))
    if not found:
        sys.exit(f"{path} has no target {target}")
    return sorted(str(pathlib.Path(folder, word)) for word in found[1].split()
                  if word.endswith(".cpp"))


def compare(name, left, right, problems):
    for source in sorted(set(left) ^ set(right)):
        problems.append(f"{name}: {source} stands on one side only")


def main():
    problems = []
    platform = Blueprint(ROOT / "Android.bp")
    core = cmake_sources("apktoolkit_core")
    compare("apktoolkit_core", platform.sources("apktoolkit_core"), core, problems)
    compare("apktoolkit", platform.sources("apktoolkit"), cmake_sources("apktoolkit"), problems)
    compare("libzu", platform.sources("libzu"), cmake_sources("zu"), problems)
    listed = core + cmake_sources("apktoolkit") + cmake_sources("zu")
    compare("the tool's folders", listed, map(str, tool_sources()), problems)

    tests = Blueprint(ROOT / "tests/Android.bp")
    compare("apktoolkit_test_support", tests.sources("apktoolkit_test_support"),
            cmake_sources("test_support", "tests/support"), problems)
    both = [source for room in ROOMS for source in cmake_sources(f"{room}_test", f"tests/{room}")]
    on_phone = tests.all_sources("cc_test")
    fuzz = Blueprint(ROOT / "fuzz/Android.bp")
    compare("apktoolkit_fuzz_support", fuzz.sources("apktoolkit_fuzz_support"),
            cmake_sources("fuzz_support", "fuzz"), problems)
    both += [str(path.relative_to(ROOT)) for path in (ROOT / "fuzz").glob("*_fuzz.cpp")]
    on_phone += fuzz.all_sources("cc_fuzz")
    shared = {"tests/support/phone.cpp", "fuzz/quiet_log.cpp"}
    compare("tests and fuzz targets", set(on_phone) - shared | set(WORKSTATION_ONLY), both, problems)
    problems += [f"{source} is in a module, and named as the workstation's own"
                 for source in set(on_phone) & set(WORKSTATION_ONLY)]
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
