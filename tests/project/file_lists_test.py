#!/usr/bin/env python3
"""Holds the file lists of the Android.bp files against those of CMake, and both against the folders."""

import re
import sys

from sources import ROOT, report, tool_sources, without_comments

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


def cmake_sources(target):
    text = re.sub(r"#.*", "", (ROOT / "CMakeLists.txt").read_text())
    found = re.search(r"add_(?:library|executable)\(%s\s+([^)]*)\)" % target, text)
    if not found:
        sys.exit(f"CMakeLists.txt has no target {target}")
    return sorted(word for word in found[1].split() if word.endswith(".cpp"))


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
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
