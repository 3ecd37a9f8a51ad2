#!/usr/bin/env python3
"""Runs the commands of docs/store.md over a few hundred packages on this machine, kills all of it in
the middle, and takes it up again: nothing may be lost, and nothing may be there twice.

Arguments: the directory of the golden packages, and the words that start apktoolkit-sim.
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

# Package, verdict, and how many of them.
PACKAGES = [("apksigner-sha256-2048/base.apk", "signed", 150), ("unsigned.apk", "refused", 90),
            ("foreign-manifest/base.apk", "not-installable", 60)]
# The page speaks of large lists and of several machines; here the lists are many and the machine is
# this one.
HERE = [("--lines=200", "--lines=20"), ("8/:\n16/worker1\n16/worker2\n", "2/:\n")]
LISTS = 15


def commands():
    """The commands of the page, in order, as they are for this machine."""
    text = PAGE.read_text()
    for there, here in HERE:
        if there not in text:
            raise ValueError(f"docs/store.md has no {there!r}")
        text = text.replace(there, here)
    blocks = [block.removesuffix("\n...") for block in BLOCK.findall(text)]
    return [command for block in blocks for command in re.split(r"^\$ ", block, flags=re.M)[1:]]


def prepare(golden, directory):
    """The store; returns the number of packages of each verdict."""
    number = 0
    for source, _, count in PACKAGES:
        for _ in range(count):
            place = directory / f"store/{number % 7}"
            place.mkdir(parents=True, exist_ok=True)
            # A name with a blank and one with a line end, as anybody may upload them.
            name = {3: "a b.apk", 5: "two\nlines.apk"}.get(number, f"{number}.apk")
            shutil.copy(golden / source, place / name)
            number += 1
    return {verdict: count for _, verdict, count in PACKAGES}


class Store(Shell):
    """Its commands can be killed, and leave their journals in its directory."""

    def __init__(self, directory, simulator):
        super().__init__(directory, simulator)
        self.environment["HOME"] = str(directory)

    def start(self, command):
        return subprocess.Popen(["bash", "-c", command], cwd=self.directory, env=self.environment,
                                stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                                stderr=subprocess.PIPE, text=True, start_new_session=True)

    def run(self, command):
        """What the command prints; a complaint or a failure is a problem."""
        process = self.start(command)
        output, errors = process.communicate()
        problems = []
        if process.returncode or errors:
            problems = [f"$ {command}", f"ends with {process.returncode}: {output}{errors}"]
        return output, problems

    def journals(self):
        """The lists that are done."""
        return sorted(path.name for path in (self.directory / "journals").glob("??????"))


def kill_session(leader):
    """Kills all that was started from this process, as a machine does that is switched off."""
    for entry in pathlib.Path("/proc").glob("[0-9]*"):
        try:
            session = int((entry / "stat").read_text().rsplit(")", 1)[1].split()[3])
            if session == leader.pid:
                os.kill(int(entry.name), signal.SIGKILL)
        except (OSError, ValueError, IndexError):
            continue
    leader.communicate()


def run_and_kill(shell, command):
    """Kills the work once some lists are done; returns the problems."""
    process = shell.start(command)
    while process.poll() is None and len(shell.journals()) < 4:
        time.sleep(0.05)
    if process.poll() is not None:
        return [f"$ {command}", "ended before it was killed:", *process.communicate()]
    kill_session(process)
    done = shell.journals()
    problems = [f"the journal {name} is not whole" for name in done if not is_whole(shell, name)]
    if not 0 < len(done) < LISTS:
        problems.append(f"{len(done)} of {LISTS} lists were done when it was killed")
    return problems


def is_whole(shell, name):
    """Whether the journal has a verdict for each package of its list."""
    lines = (shell.directory / "journals" / name).read_text().splitlines()
    verdicts = sum(line.startswith('{"event":"verdict"') for line in lines)
    return verdicts == (shell.directory / "batches" / name).read_bytes().count(b"\0")


def cut_journal_problems(shell):
    """A journal that the disk had no room for does not get the name of its list."""
    command = shell.directory / "bin/apktoolkit-sim"
    whole = command.rename(command.with_name("whole"))
    command.write_text(f'#!/bin/sh\n{whole} "$@"; status=$?\nfor last; do :; done\n'
                       'truncate -s -20 "$last"; exit $status\n')
    command.chmod(0o755)
    (shell.directory / "journals/000000").unlink()
    process = shell.start("./check-batch 000000")
    _, errors = process.communicate()
    if process.returncode == 0 or "000000" in shell.journals():
        return [f"a cut journal ends with {process.returncode}: {errors}"]
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
    if len(again) > 2:  # a job may have ended before parallel wrote it down, one for each worker
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
        return report(check(directory, simulator, expected))


if __name__ == "__main__":
    sys.exit(main())
