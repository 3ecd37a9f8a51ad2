#!/usr/bin/env python3
"""Holds docs/messages.md against the sources, both ways.

The tool's messages: text, priority and file. The simulator's reasons: code, text and cure, which
stand in docs/journal.schema.json, too, as far as codes go; and the messages that a reason is known by.
"""

import json
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


# A row of the table of reasons in the sources, and on the page.
CAUSE = re.compile(r"inline constexpr Cause k\w+ = \{\s*(%s),\s*(%s),\s*(%s)\}" % ((LITERALS,) * 3))
ROW = re.compile(r"^\| `(?P<code>[a-z0-9-]+)` \| (?P<reason>.+?) \| (?P<cure>.+?) \| (?P<log>.*?) \|$",
                 re.M)


def reasons_problems(messages):
    """What differs between simulator/verdict/causes.h, the page's tables and the schema."""
    header = (ROOT / "simulator/verdict/causes.h").read_text()
    causes = [tuple(joined(part).replace('\\"', '"') for part in row) for row in CAUSE.findall(header)]
    page = (ROOT / "docs/messages.md").read_text()
    rows = [(row["code"], row["reason"], row["cure"]) for row in ROW.finditer(page)]
    schema = json.loads((ROOT / "docs/journal.schema.json").read_text())
    problems = [f"the page lacks or differs in {cause}" for cause in causes if cause not in rows]
    problems += [f"not in the sources: {row}" for row in rows if row not in causes]
    if len(causes) != header.count("Cause k") or len({code for code, *_ in causes}) != len(causes):
        problems.append("simulator/verdict/causes.h: a row does not read, or has another's code")
    if schema["$defs"]["reason"]["enum"] != [code for code, *_ in causes]:
        problems.append("the codes of docs/journal.schema.json are not those of the sources")
    for row in ROW.finditer(page):
        problems += [f"{row['code']}: no message {text}" for text in re.findall(r"`([^`]+)`", row["log"])
                     if not any(text in message for message in messages)]
    return problems


def main():
    in_sources, in_page = written(), documented()
    problems = [f"not in docs/messages.md: {entry}" for entry in sorted(in_sources - in_page)]
    problems += [f"not in the sources: {entry}" for entry in sorted(in_page - in_sources)]
    problems += reasons_problems({text for text, _, _ in in_page})
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
