"""What the tests of this folder read from the project's own files."""

import pathlib
import re

ROOT = pathlib.Path(__file__).resolve().parents[2]
ROOMS = ("sign", "apk", "crypto", "util")


def tool_sources():
    """Every .cpp file of the tool, relative to the root."""
    for room in ROOMS:
        for path in sorted((ROOT / room).glob("*.cpp")):
            yield path.relative_to(ROOT)


def without_comments(text):
    """C++ text with its comments removed; string literals stay whole."""
    token = re.compile(r'"(?:[^"\\\n]|\\.)*"|//[^\n]*|/\*.*?\*/', re.S)
    return token.sub(lambda match: match[0] if match[0].startswith('"') else " ", text)


def report(problems):
    """Prints the problems; the exit status of the test."""
    for problem in problems:
        print(problem)
    return 1 if problems else 0
