#!/usr/bin/env python3
"""Compares docs/messages.md with the sources, in both directions.

Of the tool it compares each message's text, priority and file. Of the simulator it compares the
texts that it understands in the tool's log, and the rows of its causes. The tables of reasons on
the page and the codes in docs/journal.schema.json are made from these rows: --write updates both.
"""

import re
import sys
import textwrap

from sources import ROOT, report, tool_sources, without_comments

# A text is the first argument of a function that writes: literals, or the name of a constant.
LITERALS = r'(?:"(?:[^"\\]|\\.)*"\s*)+'
CALL = re.compile(r"\b(LogInfo|LogError|Fail)\(\s*(%s|k\w+)" % LITERALS)
CONSTANT = re.compile(r"constexpr char (k\w+)\[\] =\s*(%s)" % LITERALS)

# For each function: where it writes to, and its prefix to each text (Fail is crypto/pkcs7.cpp's).
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


# A row of the simulator's table of causes.
CAUSES = ROOT / "simulator/verdict/causes.h"
CAUSE = re.compile(r"inline constexpr Cause (?P<name>k\w+) = \{\s*(?P<code>%s),\s*Group::(?P<group>k\w+),"
                   r"\s*Severity::(?P<severity>k\w+),\s*ChainLink::(?P<link>k\w+),\s*(?P<log>%s),"
                   r"\s*(?P<reason>%s),\s*(?P<cure>%s)\};" % ((LITERALS,) * 4))

# The groups in order, each with the title of its table.
GROUPS = {"kNotLookedAt": "The tool did not look at the file",
          "kSimulation": "The simulation could not tell", "kFile": "What the file is",
          "kSignature": "A package's signature", "kKernel": "The kernel", "kLibrary": "A library",
          "kKey": "The key", "kTool": "The tool itself",
          "kInstaller": "The installer of the phones",
          "kGate": "The gate: what the command line demands", "kWarning": "Warnings"}

# Groups of causes that leave the chain from the key to the entries whole. All others must break it.
UNBROKEN = {"kKernel", "kKey", "kInstaller", "kGate", "kWarning"}

PAGE = ROOT / "docs/messages.md"
REASONS = re.compile(r"(?<=\n)%s:\n.*" % GROUPS["kNotLookedAt"], re.S)
SCHEMA = ROOT / "docs/journal.schema.json"
CODES = re.compile(r'("reason": \{\n\s*"enum": )\[.*?\]', re.S)


def causes():
    header = CAUSES.read_text()
    rows = [{field: joined(text).replace('\\"', '"') if text.startswith('"') else text
             for field, text in row.groupdict().items()} for row in CAUSE.finditer(header)]
    if len(rows) != header.count("Cause k"):
        sys.exit(f"{CAUSES}: a row does not read")
    return rows


def tables(rows):
    """The tables of reasons as they should be on the page."""
    parts = []
    for group, title in GROUPS.items():
        lines = [f"| `{row['code']}` | {row['reason']} | {row['cure']} | {row['log']} |"
                 for row in rows if row["group"] == group]
        parts.append("\n".join([f"{title}:", "", "| Code | Reason | What to do | In the log |",
                                "|---|---|---|---|", *lines, ""]))
    return "\n".join(parts)


def codes(rows):
    """The list of codes as it should be in the schema."""
    text = ", ".join(f'"{row["code"]}"' for row in rows)
    return "[\n" + textwrap.fill(text, 100, initial_indent=" " * 8, subsequent_indent=" " * 8,
                                 break_on_hyphens=False) + "\n      ]"


def reasons_problems(rows, messages):
    problems = []
    if len({row["code"] for row in rows}) != len(rows):
        problems.append("a code stands twice")
    chosen = "".join(path.read_text() for path in (ROOT / "simulator").rglob("*.cpp"))
    for row in rows:
        name = row["name"]
        if row["group"] not in GROUPS:
            problems.append(f"{name}: the group has no title")
        if f"&cause::{name}" not in chosen:
            problems.append(f"{name} is chosen nowhere")
        is_absent = row["severity"] in ("kAbsent", "kNothing", "kFollows")
        may_hold = row["group"] in UNBROKEN or row["group"] == "kLibrary" or is_absent
        if row["link"] == "kNone" and not may_hold and row["group"] != "kTool":
            problems.append(f"{name} breaks no link of the chain")
        problems += [f"{name}: no message {text}" for text in re.findall(r"`([^`]+)`", row["log"])
                     if not any(text in message for message in messages)]
    return problems


# A row of the texts that the simulator understands: meaning, text, captured part.
LOG_LINES = ROOT / "simulator/run/log_lines.cpp"
LOG_TEXT = re.compile(r"\{LogMeaning::k\w+,\s*(%s),\s*(\d+|kNothing)\}" % LITERALS)


def log_problems(messages):
    source = LOG_LINES.read_text()
    rows = LOG_TEXT.findall(source)
    problems = [f"the tool does not log {text}" for text in (joined(text) for text, _ in rows)
                if text not in messages]
    if len(rows) != source.count("{LogMeaning::"):
        problems.append(f"{LOG_LINES}: a row does not read")
    for text, captured in rows:
        if captured != "kNothing" and int(captured) >= len(re.findall("%", text)):
            problems.append(f"there is nothing to capture in {joined(text)}")
    return problems


# A row of the starts of messages that the library makes reasons from.
LIBRARY = ROOT / "library/verification.cpp"
LIBRARY_TEXT = re.compile(r"\{(%s), Reason::k\w+\}" % LITERALS)


def library_problems(messages):
    source = LIBRARY.read_text()
    starts = [joined(text) for text in LIBRARY_TEXT.findall(source)]
    problems = [f"{LIBRARY}: the tool does not log {start}" for start in starts
                if not any(message.startswith(start) for message in messages)]
    if not starts or len(starts) != source.count(", Reason::k"):
        problems.append(f"{LIBRARY}: a row does not read")
    return problems


def main():
    rows = causes()
    page, schema = PAGE.read_text(), SCHEMA.read_text()
    right_page = REASONS.sub(lambda _: tables(rows), page)
    right_schema = CODES.sub(lambda match: match[1] + codes(rows), schema)
    if sys.argv[1:] == ["--write"]:
        PAGE.write_text(right_page)
        SCHEMA.write_text(right_schema)
        return 0
    in_sources, in_page = written(), documented()
    messages = {text for text, _, _ in in_sources}
    problems = [f"not in docs/messages.md: {entry}" for entry in sorted(in_sources - in_page)]
    problems += [f"not in the sources: {entry}" for entry in sorted(in_page - in_sources)]
    problems += log_problems(messages) + reasons_problems(rows, messages) + library_problems(messages)
    problems += [f"{path} is not as tests/project/messages_test.py --write makes it"
                 for path, is_right in ((PAGE, page == right_page), (SCHEMA, schema == right_schema))
                 if not is_right]
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
