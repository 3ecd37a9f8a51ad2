#!/usr/bin/env python3
"""Compares parts of docs/messages.md with the sources: the priority of each message of the tool,
the source files that write it, and the tables of the simulator's reasons. Also compares the codes
of the reasons in docs/journal.schema.json with the sources. With --write, writes all these parts
from the sources instead.

The explanation of each message is written by hand. The test fails if docs/messages.md has no entry
for a message, or an entry for a message that the tool does not have. It also fails if the simulator
or library/verification.cpp looks for a text that the tool does not log.
"""

import re
import sys
import textwrap

from sources import ROOT, report, tool_sources, without_comments

# A message's text is the first argument of LogInfo, LogError or Fail: literals, or the name of a
# constant.
LITERALS = r'(?:"(?:[^"\\]|\\.)*"\s*)+'
CALL = re.compile(r"\b(LogInfo|LogError|Fail)\(\s*(%s|k\w+)" % LITERALS)
CONSTANT = re.compile(r"constexpr char (k\w+)\[\] =\s*(%s)" % LITERALS)

# For each of these functions: the priority and the prefix of its texts. The function Fail of
# crypto/pkcs7.cpp writes to standard output, without a priority.
WRITERS = {
    "LogInfo": ("Info", ""),
    "LogError": ("Error", ""),
    "Fail": ("", "CERT_PARCER [ERROR]: "),
}

# An entry of the page: "### `text`", then a paragraph that starts with the message's priority and
# files, as in "Error, `file`, `file`." This start comes from the sources.
ENTRY = re.compile(r"^### `(.*)`\n\n((?:(?:Info|Error), )?`[^`]+`(?:,\s`[^`]+`)*\.\s)?", re.M)


def joined(literals):
    return "".join(re.findall(r'"((?:[^"\\]|\\.)*)"', literals))


def messages():
    """For each text that the tool writes, the start of its entry's paragraph."""
    found = {}
    for path in tool_sources():
        source = without_comments((ROOT / path).read_text())
        constants = dict(CONSTANT.findall(source))
        for function, argument in CALL.findall(source):
            writer, prefix = WRITERS[function]
            text = prefix + joined(constants.get(argument, argument))
            found.setdefault(text, set()).add((writer, f"`{path}`"))
    return {text: ", ".join([*dict.fromkeys(filter(None, (writer for writer, _ in sorted(places)))),
                             *(path for _, path in sorted(places))]) + "."
            for text, places in found.items()}


# A row of the simulator's table of causes.
CAUSES = ROOT / "simulator/verdict/causes.h"
CAUSE = re.compile(r"inline constexpr Cause (?P<name>k\w+) = \{\s*(?P<code>%s),\s*Group::(?P<group>k\w+),"
                   r"\s*Severity::(?P<severity>k\w+),\s*ChainLink::(?P<link>k\w+),\s*(?P<log>%s),"
                   r"\s*(?P<reason>%s),\s*(?P<cure>%s)\};" % ((LITERALS,) * 4))

# The groups in order, each with the title of its table.
GROUPS = {"kNotLookedAt": "The tool did not look at the file",
          "kSimulation": "The simulation has no result", "kFile": "What the file is",
          "kSignature": "A package's signature", "kKernel": "The kernel", "kLibrary": "A library",
          "kKey": "The key", "kTool": "The tool itself",
          "kInstaller": "The installer of the phones",
          "kGate": "Demands of --signer and --werror, and the demand for one signer of each package", "kWarning": "Warnings"}

# A cause of these groups need not name a broken link of the chain from the key to the entries
# (ChainLink). reasons_problems() has the other exceptions.
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
        sys.exit(f"{CAUSES}: a row cannot be parsed")
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
        problems.append("two causes have the same code")
    chosen = "".join(path.read_text() for path in (ROOT / "simulator").rglob("*.cpp"))
    for row in rows:
        name = row["name"]
        if row["group"] not in GROUPS:
            problems.append(f"{name}: the group has no title")
        if f"&cause::{name}" not in chosen:
            problems.append(f"{name}: no source of the simulator chooses this cause")
        is_absent = row["severity"] in ("kAbsent", "kNothing", "kFollows")
        may_hold = row["group"] in UNBROKEN or row["group"] == "kLibrary" or is_absent
        if row["link"] == "kNone" and not may_hold and row["group"] != "kTool":
            problems.append(f"{name}: names no link of the chain (ChainLink)")
        problems += [f"{name}: the tool has no message {text}" for text in re.findall(r"`([^`]+)`", row["log"])
                     if not any(text in message for message in messages)]
    return problems


# A row of the simulator's table of log texts: the meaning, the format text, and the index of the
# printf conversion whose text is captured (or kNothing).
LOG_LINES = ROOT / "simulator/run/log_lines.cpp"
LOG_TEXT = re.compile(r"\{LogMeaning::k\w+,\s*(%s),\s*(\d+|kNothing)\}" % LITERALS)


def log_problems(messages):
    source = LOG_LINES.read_text()
    rows = LOG_TEXT.findall(source)
    problems = [f"the tool does not log {text}" for text in (joined(text) for text, _ in rows)
                if text not in messages]
    if len(rows) != source.count("{LogMeaning::"):
        problems.append(f"{LOG_LINES}: a row cannot be parsed")
    for text, captured in rows:
        if captured != "kNothing" and int(captured) >= len(re.findall("%", text)):
            problems.append(f"{LOG_LINES}: no conversion has the index {captured} in {joined(text)}")
    return problems


# A row of the table in library/verification.cpp: the start of a message, and the reason that the
# message gives.
LIBRARY = ROOT / "library/verification.cpp"
LIBRARY_TEXT = re.compile(r"\{(%s), Reason::k\w+\}" % LITERALS)


def library_problems(messages):
    source = LIBRARY.read_text()
    starts = [joined(text) for text in LIBRARY_TEXT.findall(source)]
    problems = [f"{LIBRARY}: the tool does not log {start}" for start in starts
                if not any(message.startswith(start) for message in messages)]
    if not starts or len(starts) != source.count(", Reason::k"):
        problems.append(f"{LIBRARY}: a row cannot be parsed")
    return problems


FIX = f"""an entry of {PAGE} is "### `TEXT`", an empty line, and the meaning of the message.
messages_test.py --write adds the message's priority and files. The texts that the simulator looks for are
in {LOG_LINES}. The simulator's reasons are in {CAUSES}."""


def main():
    rows, texts = causes(), messages()
    page = PAGE.read_text()
    entries = [entry[1] for entry in ENTRY.finditer(page)]
    problems = [f"{PAGE} has no entry for this message: {text}" for text in texts if text not in entries]
    problems += [f"nothing writes this message: {text}" for text in entries if text not in texts]
    problems += log_problems(texts) + reasons_problems(rows, texts) + library_problems(texts)
    page = ENTRY.sub(lambda entry: entry[0] if entry[1] not in texts else
                     f"### `{entry[1]}`\n\n{texts[entry[1]]}{(entry[2] or ' ')[-1]}", page)
    page = REASONS.sub(lambda _: tables(rows), page)
    schema = CODES.sub(lambda match: match[1] + codes(rows), SCHEMA.read_text())
    return report(problems, FIX, {PAGE: page, SCHEMA: schema})


if __name__ == "__main__":
    sys.exit(main())
