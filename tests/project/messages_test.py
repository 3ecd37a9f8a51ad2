#!/usr/bin/env python3
"""Holds docs/messages.md against the texts in the sources, both ways: text, priority and file."""

import re
import sys

from sources import ROOT, report, tool_sources, without_comments

# A text is the first argument of a function that writes: literals, or the name of a constant.
LITERALS = r'(?:"(?:[^"\\]|\\.)*"\s*)+'
CALL = re.compile(r"\b(LogInfo|LogError|Fail)\(\s*(%s|k\w+)" % LITERALS)
CONSTANT = re.compile(r"constexpr char (k\w+)\[\] =\s*(%s)" % LITERALS)

# What each function writes to, and what it puts before each text (Fail is crypto/pkcs7.cpp's).
WRITERS = {
    "LogInfo": ("Info", ""),
    "LogError": ("Error", ""),
    "Fail": ("Standard output", "CERT_PARCER [ERROR]: "),
}

# An entry of the page: "### `text`", then a paragraph that opens with "Error, `file`, `file`."
ENTRY = re.compile(
    r"^### `(?P<text>.*)`\n\n((?P<priority>Info|Error), )?(?P<files>`[^`]+`(, `[^`]+`)*)\.\s", re.M)


def joined(literals):
    return "".join(re.findall(r'"((?:[^"\\]|\\.)*)"', literals))


def written():
    found = set()
    for path in tool_sources():
        source = without_comments((ROOT / path).read_text())
        constants = dict(CONSTANT.findall(source))
        for function, argument in CALL.findall(source):
            writer, prefix = WRITERS[function]
            found.add((prefix + joined(constants.get(argument, argument)), writer, str(path)))
    return found


def documented():
    text = (ROOT / "docs/messages.md").read_text()
    entries = list(ENTRY.finditer(text))
    if len(entries) != text.count("\n### "):
        sys.exit("docs/messages.md: an entry does not open with its priority and its files")
    return {(entry["text"], entry["priority"] or "Standard output", path)
            for entry in entries for path in re.findall(r"`([^`]+)`", entry["files"])}


def main():
    in_sources, in_page = written(), documented()
    problems = [f"not in docs/messages.md: {entry}" for entry in sorted(in_sources - in_page)]
    problems += [f"not in the sources: {entry}" for entry in sorted(in_page - in_sources)]
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
