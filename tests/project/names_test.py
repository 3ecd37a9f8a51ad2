#!/usr/bin/env python3
"""Checks names in the docs. The tests that the docs name and the files to which they link must
exist, and in docs/architecture.md also the named files and functions. Also checks how the names of
tests begin."""

import re
import sys

from sources import ROOT, report, without_comments

DOCS = [*sorted(ROOT.glob("*.md")), *sorted((ROOT / "docs").rglob("*.md"))]

# `Suite.Test` or `Suite.*`. An instantiated suite also has a prefix: `Prefix/Suite.Test`.
NAMED = re.compile(r"`((?:\w+/)?[A-Z]\w+)\.(\*|[A-Z]\w+)`")
DEFINED = re.compile(r"^TEST(?:_F|_P)?\(\s*(\w+),\s*(\w+)\)", re.M)
INSTANTIATED = re.compile(r"INSTANTIATE_TEST_SUITE_P\(\s*(\w+),\s*(\w+),")
PROJECT = re.compile(r"apktoolkit_add_project_test\((\w+) ")
# A test's name must begin with its subject, or with a verb whose subject is the suite. NO_SUBJECT
# lists words with which a name must not begin.
NO_SUBJECT = re.compile(r"(A|An|The|What|Whatever|Of|On|With|Without|By|In|For|That|When|Nothing|No|There|It)[A-Z0-9]")
LINK = re.compile(r"\]\(([^)#:]+)(?:#[^)]*)?\)")

PAGE = ROOT / "docs/architecture.md"
PATH = r"\w[\w/]*/\w+\.(?:cpp|h|md|py)"
# docs/architecture.md names functions with their files in three parts: the steps of the picture
# (STOP), the rows of the table (ROW), and the answers to questions (ANSWER).
STOP = re.compile(rf"^[ |:v]*([\w:]+) +({PATH})", re.M)
ROW = re.compile(rf"^\|[^|]*\| ([^|]*) \| ((?:`{PATH}`(?:, )?)+) \|$", re.M)
ANSWER = re.compile(rf"`([\w:]+)`\s+in\s+`({PATH})`")


def tests_that_there_are():
    """All tests, as (suite, test)."""
    found = set()
    for path in (ROOT / "tests").rglob("*_test.cpp"):
        source = path.read_text()
        found.update(DEFINED.findall(source))
        for prefix, suite in INSTANTIATED.findall(source):
            found.update((f"{prefix}/{suite}", test)
                         for name, test in DEFINED.findall(source) if name == suite)
    lists = (ROOT / "tests/project/CMakeLists.txt").read_text()
    found.update(("Project", test) for test in PROJECT.findall(lists))
    return found


def test_and_link_problems():
    tests = tests_that_there_are()
    suites = {suite for suite, _ in tests}
    count = 0
    for page in DOCS:
        text = page.read_text()
        for suite, test in NAMED.findall(text):
            count += 1
            if (suite not in suites) if test == "*" else ((suite, test) not in tests):
                yield f"{page.relative_to(ROOT)}: there is no test {suite}.{test}"
        for link in LINK.findall(text):
            if not (page.parent / link).exists():
                yield f"{page.relative_to(ROOT)} links to {link}, which does not exist"
    if count < 50:
        yield f"the docs: the pattern NAMED finds only {count} tests, but must find at least 50"


def test_name_problems():
    for suite, test in sorted(tests_that_there_are()):
        if NO_SUBJECT.match(test):
            yield f"{suite}.{test}: the name must begin with a subject or a verb (CONTRIBUTING.md, What a change needs)"


def function_problems():
    text = PAGE.read_text()
    places = STOP.findall(text) + ANSWER.findall(text)
    for functions, files in ROW.findall(text):
        files = re.findall(PATH, files)
        functions = re.findall(r"`([^`]+)`", functions)
        places += zip(functions, files if len(files) > 1 else files * len(functions))
    for function, path in places:
        source = ROOT / path
        name = function.rpartition("::")[2]
        defined = rf"^\S(?:[^;{{}}\n]*[\s*:])?{name}(?:\([^;{{}}]*\)[^;{{}}()]*\{{|\[)"
        if not source.exists() or not re.search(defined, without_comments(source.read_text()), re.M):
            yield f"docs/architecture.md: {path} has no {function}"
    yield from (f"docs/architecture.md: there is no {path}"
                for path in re.findall(PATH, text) if not (ROOT / path).exists())
    if len(places) < 50:
        yield f"docs/architecture.md: the patterns find only {len(places)} functions, but must find at least 50"


if __name__ == "__main__":
    sys.exit(report([*test_and_link_problems(), *test_name_problems(), *function_problems()],
                    "correct the test or the page named above: a page must name only what exists"))
