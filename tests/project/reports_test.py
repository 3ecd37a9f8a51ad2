#!/usr/bin/env python3
"""Reads the JUnit reports and SARIF logs of real runs. Some of the checked files have odd names.

Arguments: the directory of the golden packages (made by tests/journeys/make_golden_packages), and the
command line that starts apktoolkit-sim.

junitparser reads the JUnit reports. A SARIF log is checked with the schema SARIF below. The schema
has those objects and properties of the standard (OASIS, SARIF 2.1.0) that the simulator writes. The
schema has the standard's constraints on them: types, required properties, enumerated values,
minimum values, and unique items. Any other property outside `hashes` is an error, so that the
simulator writes no unchecked property. A schema cannot express all rules; the test itself checks
the indices (§3.4.5, §3.52.4) and the URIs (§3.4.3).
"""

import json
import pathlib
import shutil
import subprocess
import sys
import tempfile
import urllib.parse
import zipfile

import jsonschema
import junitparser

from messages_test import causes
from sources import report

# The codes of refusals that follow from another refusal.
FOLLOWING = {row["code"] for row in causes() if row["severity"] == "kFollows"}


def record(required, **properties):
    return {"type": "object", "required": required, "properties": properties,
            "additionalProperties": False}


def listing(items, unique=False):
    return {"type": "array", "items": items, "uniqueItems": unique}


TEXT = {"type": "string"}
INDEX = {"type": "integer", "minimum": 0}
LEVEL = {"enum": ["none", "note", "warning", "error"]}  # §3.27.10
MESSAGE = record(["text"], text=TEXT)  # §3.11, §3.12
URI = {"type": "string", "format": "uri-reference"}
LOCATION = record(["physicalLocation"], physicalLocation=record(  # §3.28, §3.29
    ["artifactLocation"], artifactLocation=record(["uri"], uri=URI, index=INDEX)))  # §3.4
RULE = record(["id"], id=TEXT, shortDescription=MESSAGE, help=MESSAGE,  # §3.49
              defaultConfiguration=record([], level=LEVEL))  # §3.50
DRIVER = record(["name"], name=TEXT, version=TEXT, rules=listing(RULE, unique=True))  # §3.19
NOTIFICATION = record(["message"], message=MESSAGE, level=LEVEL, locations=listing(LOCATION))  # §3.58
INVOCATION = record(["executionSuccessful"], executionSuccessful={"type": "boolean"},  # §3.20
                    toolExecutionNotifications=listing(NOTIFICATION))
ARTIFACT = record([], location=record([], uri=URI), length={"type": "integer", "minimum": -1},  # §3.24
                  hashes={"type": "object", "additionalProperties": TEXT},
                  roles=listing({"enum": ["analysisTarget"]}, unique=True))
RESULT = record(["message"], ruleId=TEXT, ruleIndex=INDEX, level=LEVEL, message=MESSAGE,  # §3.27
                locations=listing(LOCATION))
RUN = record(["tool"], tool=record(["driver"], driver=DRIVER), invocations=listing(INVOCATION),  # §3.14
             artifacts=listing(ARTIFACT, unique=True), results=listing(RESULT))
SARIF = record(["version", "runs"], **{"$schema": URI}, version={"enum": ["2.1.0"]},  # §3.13
               runs=listing(RUN))


def run(simulator, directory, options, files):
    """The verdict events, the JUnit suites and the SARIF log of one run."""
    junit, sarif = directory / "junit.xml", directory / "log.sarif"
    journal = subprocess.run([*simulator, "--json", "--junit", junit, "--sarif", sarif, *options, *files],
                             capture_output=True, check=False).stdout
    events = [json.loads(line) for line in journal.splitlines()]
    verdicts = [event for event in events if event["event"] == "verdict"]
    return verdicts, junitparser.JUnitXml.fromfile(str(junit)), json.loads(sarif.read_bytes())


def junit_problems(verdicts, suites):
    """Checks that each file has a test case, and that the totals are right. The test case of a file
    must pass if the file's verdict has the status 0, fail if the status is 1, and be an error for
    any other status. If the first item of a verdict is refused and the status is not 3, the type of
    the failure or error must be the code of this item's reason."""
    cases = [case for suite in suites for case in suite]
    problems = [] if len(cases) == len(verdicts) else [f"{len(verdicts)} files, {len(cases)} cases"]
    for verdict, case in zip(verdicts, cases):
        kinds = [type(result) for result in case.result]
        expected = {0: [], 1: [junitparser.Failure]}.get(verdict["status"], [junitparser.Error])
        if kinds != expected:
            problems.append(f"{verdict['file']}: {verdict['verdict']}: the test case has {kinds}, and not {expected}")
        if kinds and verdict["items"][0]["state"] == "refused" and case.result[0].type != \
                verdict["items"][0]["reason"] and verdict["status"] != 3:
            problems.append(f"{verdict['file']}: the failure or error has the type {case.result[0].type}, "
                            f"and not {verdict['items'][0]['reason']}")
    counts = (suites.tests, suites.failures, suites.errors)
    expected = (len(verdicts), sum(verdict["status"] == 1 for verdict in verdicts),
                sum(verdict["status"] > 1 for verdict in verdicts))
    return problems + ([] if counts == expected else [f"counts {counts}, and not {expected}"])


def sarif_problems(verdicts, log):
    """Checks that the log follows the standard and agrees with the verdicts."""
    problems = [f"{error.json_path}: {error.message}"
                for error in jsonschema.Draft202012Validator(SARIF).iter_errors(log)]
    (made,) = log["runs"]
    for result in made["results"]:
        place = result["locations"][0]["physicalLocation"]["artifactLocation"]
        if made["artifacts"][place["index"]]["location"]["uri"] != place["uri"]:
            problems.append(f"the index of {place} belongs to another artifact")
        if made["tool"]["driver"]["rules"][result["ruleIndex"]]["id"] != result["ruleId"]:
            problems.append(f"the rule index of {result['ruleId']} belongs to another rule")
    found = [(result["ruleId"], result["level"]) for result in made["results"]]
    expected = []
    for verdict in verdicts:
        refused = [item["reason"] for item in verdict["items"] if item["state"] == "refused"]
        origins = [reason for reason in refused if reason not in FOLLOWING]
        expected += [(reason, "error") for reason in origins or refused]
        expected += [(warning["reason"], "warning") for warning in verdict["warnings"]]
    if found != expected:
        problems.append(f"results {found}, and not {expected}")
    if made["invocations"][0]["executionSuccessful"] != all(v["status"] < 3 for v in verdicts):
        problems.append("executionSuccessful does not agree with the verdicts")
    return problems


def odd_files(package, directory):
    """Copies of a package. Their names have characters that are special in XML, JSON or URIs, or bytes
    that are not UTF-8."""
    for name in (b"a b&<>\"'.apk", b"]]>.apk", b"http:x?a#b%41.apk", b"line\nend\x01.apk", b"\xe9\xff.apk",
                 "\u202egr\u00fcn\ufffe\U0001f600.apk".encode()):
        path = directory / name.decode(errors="surrogateescape")
        shutil.copy(package, path)
        yield path


def main():
    golden, *simulator = sys.argv[1:]
    packages = sorted(pathlib.Path(golden).glob("*/base.apk"))
    problems = []
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        jar = directory / "library.jar"
        with zipfile.ZipFile(jar, "w") as archive:
            archive.writestr("a.txt", "a")
        package = pathlib.Path(golden) / "apksigner-sha256-2048/base.apk"
        odd = list(odd_files(package, directory))
        files = [*packages, *odd, jar, directory / "absent.apk", directory, package, package]
        seen = set()
        for options, some in ([], files), (["--werror", "--signer", "0" * 64], files), \
                (["--integrity", "ffffffff", "--timeout", "0.5"], [package]), ([], [package]):
            verdicts, suites, log = run(simulator, directory, options, some)
            if len(verdicts) != len(some):
                problems.append(f"{len(some)} files, {len(verdicts)} verdicts")
            problems += junit_problems(verdicts, suites) + sarif_problems(verdicts, log)
            seen |= {verdict["status"] for verdict in verdicts}
            paths = [urllib.parse.unquote_to_bytes(artifact["location"]["uri"]).removeprefix(b"file://")
                     for artifact in log["runs"][0]["artifacts"]]
            for file in some:
                if str(file).encode(errors="surrogateescape") not in paths:
                    problems.append(f"the log has no artifact for {file!r}")
        if seen != {0, 1, 3, 4}:
            problems.append(f"the statuses are {seen}, and not 0, 1, 3 and 4")
    return report(problems, "simulator/show/junit.cpp, simulator/show/sarif.cpp; if the simulator writes a new property, "
                            "also SARIF in tests/project/reports_test.py")


if __name__ == "__main__":
    sys.exit(main())
