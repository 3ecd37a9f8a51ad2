#!/usr/bin/env python3
"""Checks that journals of real runs follow docs/journal.schema.json, and that docs/journal.md names
every member and value of the schema.

Arguments: the directory of a good package that asks for the registration of its key, and the
command line that starts apktoolkit-sim.
"""

import json
import pathlib
import shutil
import subprocess
import sys
import tempfile
import zipfile

import jsonschema

from sources import ROOT, changed_zip, report

SCHEMA = json.loads((ROOT / "docs/journal.schema.json").read_text())


def runs(package, directory):
    """Command lines of the simulator. Together they cause every event and every verdict."""
    directory = pathlib.Path(directory)
    jar = directory / "library.jar"
    with zipfile.ZipFile(jar, "w") as archive:
        archive.writestr("a.txt", "a")
    damaged = directory / "damaged.apk"
    changed_zip(package, lambda name, content: b"no signature block" if name.endswith(".RSA") else content, damaged)
    odd_name = directory / b"\xe9t\xc3\xa9.txt".decode(errors="surrogateescape")
    odd_name.write_text("no archive")
    yield [package]
    yield ["--strict", "--jobs", "2", *sorted(package.parent.parent.glob("*/base.apk")), package]
    yield ["--sign-errno", "EPERM", "--zu-result", "7", package]
    yield ["--integrity", "missing", package]
    yield ["--integrity", "ffffffff", "--timeout", "1", package]
    yield [jar, directory / "absent.apk"]
    yield ["--trust", jar, jar]
    alone = directory / "alone.apk"
    shutil.copy(package, alone)
    yield ["--strict", "--install=no", alone]
    yield ["--signer", "0" * 64, alone]
    yield ["--install", alone]
    (directory / "empty").mkdir()
    yield ["--recursive", directory / "empty"]
    yield [damaged]
    yield [odd_name]


def words_of(schema, name=""):
    """The members of objects, and the values of enumerations. Leaves out the values of `reason`,
    because docs/messages.md explains them."""
    if isinstance(schema, list):
        schema = dict(enumerate(schema))
    if not isinstance(schema, dict) or name == "reason":
        return set()
    words = set(schema.get("properties", ())) | {word for word in schema.get("enum", ()) if isinstance(word, str)}
    return words.union(*(words_of(part, key) for key, part in schema.items()))


def main():
    package = pathlib.Path(sys.argv[1]) / "base.apk"
    validator = jsonschema.Draft202012Validator(SCHEMA)
    problems, seen, verdicts = [], {}, set()
    with tempfile.TemporaryDirectory() as directory:
        for run in runs(package, directory):
            journal = subprocess.run([*sys.argv[2:], "--json", *run], capture_output=True).stdout
            for line in journal.splitlines():
                event = json.loads(line)
                problems += [f"{line}: {error.message}" for error in validator.iter_errors(event)]
                seen[event["event"], "signal" in event] = event
                verdicts.add(event.get("verdict"))

    kinds = {branch["properties"]["event"]["const"] for branch in SCHEMA["$defs"].values()
             if "event" in branch.get("properties", {})}
    problems += [f"no run had the event {kind}" for kind in kinds - {kind for kind, _ in seen}]
    known = set(SCHEMA["$defs"]["verdict"]["properties"]["verdict"]["enum"])
    problems += [f"no run had the verdict {verdict}" for verdict in known - verdicts]
    # The schema must refuse an event that lacks a required member. The last event of each kind is
    # tried. All its members are required: only a start event can have an optional member
    # (`installed`), and the last start event does not have it. An exit event with a status and an
    # exit event with a signal are two kinds.
    for event in seen.values():
        for member in event:
            poorer = {key: value for key, value in event.items() if key != member}
            if validator.is_valid(poorer):
                problems.append(f"the schema accepts {poorer}, although {member} is missing")
    page = (ROOT / "docs/journal.md").read_text()
    problems += [f"docs/journal.md does not name `{word}`" for word in words_of(SCHEMA) if f"`{word}`" not in page]
    return report(problems, "docs/journal.md or docs/journal.schema.json; for a new event or verdict, also runs() in tests/project/journal_test.py")


if __name__ == "__main__":
    sys.exit(main())
