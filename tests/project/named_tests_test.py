#!/usr/bin/env python3
"""Checks that every test which the docs name exists."""

import re
import sys

from sources import ROOT, report

PAGES = [ROOT / "README.md", *sorted((ROOT / "docs").rglob("*.md"))]

# `Suite.Test`, `Suite.*`, or either with the prefix of an instantiated suite.
NAMED = re.compile(r"`((?:\w+/)?[A-Z]\w+)\.(\*|[A-Z]\w+)`")
DEFINED = re.compile(r"^TEST(?:_F|_P)?\(\s*(\w+),\s*(\w+)\)", re.M)
INSTANTIATED = re.compile(r"INSTANTIATE_TEST_SUITE_P\(\s*(\w+),\s*(\w+),")
PROJECT = re.compile(r"apktoolkit_add_project_test\((\w+) ")


def there_are():
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


def main():
    tests = there_are()
    suites = {suite for suite, _ in tests}
    problems, count = [], 0
    for page in PAGES:
        for suite, test in NAMED.findall(page.read_text()):
            count += 1
            if (suite not in suites) if test == "*" else ((suite, test) not in tests):
                problems.append(f"{page.relative_to(ROOT)}: there is no test {suite}.{test}")
    if count < 50:
        problems.append(f"only {count} tests are named: the pattern misses them")
    return report(problems)


if __name__ == "__main__":
    sys.exit(main())
