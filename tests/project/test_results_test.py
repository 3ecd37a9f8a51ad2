#!/usr/bin/env python3
"""Runs scripts/test-results on files in the form of ctest's JUnit files. The tests in these files
passed, failed, timed out, were skipped or disabled, or could not be started. One file has no tests."""

import subprocess
import sys
import tempfile

from sources import ROOT, report

FRAME = """Running main() from gtest_main.cc
Note: Google Test filter = A.Test
[==========] Running 1 test from 1 test suite.
[ RUN      ] A.Test
%s
[  FAILED  ] A.Test (0 ms)
[  PASSED  ] 0 tests.

 1 FAILED TEST
"""
PASSED = '<testcase name="A.Good" status="run"><system-out>all well</system-out></testcase>'
SKIPPED = ('<testcase name="A.Skipped" status="notrun">'
           '<skipped message="SKIP_REGULAR_EXPRESSION_MATCHED"/><system-out>%s</system-out>'
           '</testcase>' % (FRAME % "a_test.cpp:7: Skipped\nno such kernel"))
DISABLED = '<testcase name="A.Disabled" status="disabled"/>'
FAILED = ('<testcase name="A.Bad" status="fail"><failure message=""/><system-out>%s</system-out>'
          '</testcase>' % (FRAME % "a_test.cpp:9: Failure\nWhich is: 256"))
TIMEOUT = ('<testcase name="A.Slow" status="fail"><failure message="Timeout"/><system-out/>'
           '</testcase>')
NOT_BUILT = ('<testcase name="A.Absent" status="notrun">'
             '<skipped message="Unable to find executable"/></testcase>')

CASES = [  # the tests in the file, the expected lines, the expected exit status
    ([PASSED, PASSED], ["2 passed, 0 failed, 0 skipped"], 0),
    ([PASSED, SKIPPED], ["skipped A.Skipped: no such kernel", "1 passed, 0 failed, 1 skipped"], 0),
    ([PASSED, DISABLED], ["skipped A.Disabled: disabled", "1 passed, 0 failed, 1 skipped"], 0),
    ([PASSED, FAILED], ["FAILED A.Bad: a_test.cpp:9: Failure", "    Which is: 256",
                        "1 passed, 1 failed, 0 skipped"], 1),
    ([PASSED, TIMEOUT], ["FAILED A.Slow: Timeout", "1 passed, 1 failed, 0 skipped"], 1),
    ([PASSED, NOT_BUILT], ["FAILED A.Absent: Unable to find executable", "1 passed, 1 failed, 0 skipped"], 1),
    # A run fails if no test passed, even if no test failed.
    ([SKIPPED], ["skipped A.Skipped: no such kernel", "0 passed, 0 failed, 1 skipped"], 1),
    ([], ["0 passed, 0 failed, 0 skipped"], 1),
]


def main():
    problems = []
    for cases, expected, status in CASES:
        with tempfile.NamedTemporaryFile("w", suffix=".xml") as results:
            results.write(f"<testsuite>{''.join(cases)}</testsuite>")
            results.flush()
            run = subprocess.run([ROOT / "scripts/test-results", results.name], capture_output=True, text=True)
        if (run.stdout.splitlines(), run.returncode) != (expected, status):
            problems += [f"status {run.returncode}, expected {status} and {expected}:", run.stdout, run.stderr]
    return report(problems, "scripts/test-results")


if __name__ == "__main__":
    sys.exit(main())
