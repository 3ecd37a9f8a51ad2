#!/usr/bin/env python3
"""Runs the commands of docs/store.md over a few hundred packages on this machine. Kills all jobs
in the middle, and continues the work. The journals must then have the verdict on each package
exactly once. The name of a whole journal is that of its list of packages. A journal that was cut
off must not get this name.

Arguments: the directory of the golden packages, and the command line that starts apktoolkit-sim.
"""

import json
import os
import pathlib
import re
import shutil
import signal
import subprocess
import sys
import tempfile
import time

from sources import ROOT, Shell, report

PAGE = ROOT / "docs/store.md"
BLOCK = re.compile(r"^```\n(\$ .*?)\n```$", re.M | re.S)

# Package, verdict, and number of copies.
PACKAGES = [("apksigner-sha256-2048/base.apk", "signed", 150), ("unsigned.apk", "refused", 90),
            ("foreign-manifest/base.apk", "not-installable", 60)]
# The page uses long lists of packages and several machines. This test uses short lists and only
# this machine.
HERE = [("--lines=200", "--lines=20"), ("8/:\n16/worker1\n16/worker2\n", "2/:\n")]
LISTS = 15


def commands():
    """The commands of the page, in order, changed for this machine."""
    text = PAGE.read_text()
    for there, here in HERE:
        if there not in text:
            raise ValueError(f"docs/store.md has no {there!r}")
        text = text.replace(there, here)
    blocks = [block.removesuffix("\n...") for block in BLOCK.findall(text)]
    return [command for block in blocks for command in re.split(r"^\$ ", block, flags=re.M)[1:]]


def prepare(golden, directory):
    """Makes the store, a tree of packages. Returns the expected number of each verdict."""
    number = 0
    for source, _, count in PACKAGES:
        for _ in range(count):
            place = directory / f"store/{number % 7}"
            place.mkdir(parents=True, exist_ok=True)
            # One name has a blank and one has a line end, because uploaded files may have such
            # names.
            name = {3: "a b.apk", 5: "two\nlines.apk"}.get(number, f"{number}.apk")
            shutil.copy(golden / source, place / name)
            number += 1
    return {verdict: count for _, verdict, count in PACKAGES}


class Store(Shell):
    """A shell whose commands can be killed. Their journals are in the shell's directory."""

    def __init__(self, directory, simulator):
        super().__init__(directory, simulator)
        self.environment["HOME"] = str(directory)

    def start(self, command):
        return subprocess.Popen(["bash", "-c", command], cwd=self.directory, env=self.environment,
                                stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                                stderr=subprocess.PIPE, text=True, start_new_session=True)

    def run(self, command):
        """Returns the command's output, and the problems: a failure, or text on standard error."""
        process = self.start(command)
        output, errors = process.communicate()
        problems = []
        if process.returncode or errors:
            problems = [f"$ {command}", f"ends with {process.returncode}: {output}{errors}"]
        return output, problems

    def journals(self):
        """The names of the finished lists. Only a whole journal has the name of its list."""
        return sorted(path.name for path in (self.directory / "journals").glob("??????"))


def kill_session(leader):
    """Kills every process of the leader's session, as if the machine were switched off."""
    for entry in pathlib.Path("/proc").glob("[0-9]*"):
        try:
            session = int((entry / "stat").read_text().rsplit(")", 1)[1].split()[3])
            if session == leader.pid:
                os.kill(int(entry.name), signal.SIGKILL)
        except (OSError, ValueError, IndexError):
            continue
    leader.communicate()


def run_and_kill(shell, command):
    """Runs the command, and kills its work when at least 4 lists are done. Returns problems."""
    process = shell.start(command)
    while process.poll() is None and len(shell.journals()) < 4:
        time.sleep(0.05)
    if process.poll() is not None:
        return [f"$ {command}", "ended before it was killed:", *process.communicate()]
    kill_session(process)
    done = shell.journals()
    problems = [f"the journal {name} is not whole" for name in done if not is_whole(shell, name)]
    if not 0 < len(done) < LISTS:
        problems.append(f"{len(done)} of {LISTS} lists were done when the work was killed")
    return problems


def is_whole(shell, name):
    """True if the journal has a verdict for each package of its list."""
    lines = (shell.directory / "journals" / name).read_text().splitlines()
    verdicts = sum(line.startswith('{"event":"verdict"') for line in lines)
    return verdicts == (shell.directory / "batches" / name).read_bytes().count(b"\0")


def cut_journal_problems(shell):
    """Checks that a journal that was cut off, for example by a full disk, does not get the name of
    its list."""
    command = shell.directory / "bin/apktoolkit-sim"
    whole = command.rename(command.with_name("whole"))
    command.write_text(f'#!/bin/sh\n{whole} "$@"; status=$?\nfor last; do :; done\n'
                       'truncate -s -20 "$last"; exit $status\n')
    command.chmod(0o755)
    (shell.directory / "journals/000000").unlink()
    process = shell.start("./check-batch 000000")
    _, errors = process.communicate()
    if process.returncode == 0 or "000000" in shell.journals():
        return ["a job whose journal was cut off must fail and must not rename the journal, "
                f"but the job ends with {process.returncode}: {errors}"]
    return []


def check(directory, simulator, expected):
    shell = Store(directory, simulator)
    problems, printed = [], {}
    for command in commands():
        if "| parallel " in command:
            problems += run_and_kill(shell, command)
            first = {name: (directory / "journals" / name).stat().st_mtime_ns
                     for name in shell.journals()}
        printed[command], found = shell.run(command)
        problems += found
    again = [name for name, when in first.items()
             if (directory / "journals" / name).stat().st_mtime_ns != when]
    # Two jobs run at once. If both end just before the kill, joblog lacks their lines, and
    # `parallel` runs both lists again.
    if len(again) > 2:
        problems.append(f"these lists were done, and were run again: {again}")
    counts = [output for command, output in printed.items() if "group_by" in command]
    if [json.loads(text) for text in counts] != [expected]:
        problems.append(f"the summary is {counts}, not {expected}")
    refused = [output for command, output in printed.items() if "reason" in command]
    if len(refused) != 1 or refused[0].count("unsigned store/") != expected["refused"]:
        problems.append(f"the refusals are {refused}")
    return problems + cut_journal_problems(shell)


def main():
    golden, *simulator = sys.argv[1:]
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name).resolve()
        expected = prepare(pathlib.Path(golden), directory)
        return report(check(directory, simulator, expected), "the commands of docs/store.md")


if __name__ == "__main__":
    sys.exit(main())
