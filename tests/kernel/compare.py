#!/usr/bin/env python3
"""compare.py FILES EXPECTED KERNEL...: compares runs of programs on real kernels with the same runs
in the simulated phone, and prints a table.

The directory FILES has the files of the runs, and the directory EXPECTED has the simulator's
journals. Each directory KERNEL has `results`, which tests/kernel/init wrote, and `disk.img`. Fails
if anything differs: an event, its place in the order, a line of output, or a result of the probe
(tests/simulator/phone/probe.cpp). An event is a log record, a reading of the integrity value, a
call to the kernel (with its payload, result and errno), a registration, or an exit status. Also
fails if the kernel complained, or if the disk lacks the payload of a signed file or the digest of
the bytes that were signed. With an SELinux policy, the number of entries into the tool's domain
must equal the number of confined runs (tests/kernel/runs.py)."""

import difflib
import hashlib
import json
import pathlib
import re
import subprocess
import sys
import tempfile

import runs

PRIORITIES = {"V": 2, "D": 3, "I": 4, "W": 5, "E": 6, "F": 7}
# A log record that the workstation's liblog writes to standard error: tag, priority, date, time,
# process id, thread id, text.
RECORD = re.compile(r"(\S+) ([VDIWEF]) \d\d-\d\d \d\d:\d\d:\d\d +\d+ +\d+ (.*)", re.S)
# Events that only the simulator records. The lines of output ("stdout") are compared separately,
# because a run on a real kernel does not record their position among the events.
OF_SIMULATION = {"journal", "start", "attached", "verdict", "stdout"}
SEEN_BY_MODULE = {"integrity", "sign", "verify"}
INFORMATION = 4  # the workstation's liblog drops records of a lower priority
COMPLAINT = re.compile(r"BUG:|WARNING:|Oops|Call [Tt]race|refcount_t|general protection|avc: +denied")
# The message of a kernel with an SELinux policy when a process of the installer's domain starts a
# program in the tool's domain.
ENTRY = re.compile(r"avc: +granted +{ transition } .* scontext=u:r:installd:s0 tcontext=u:r:apktoolkit:s0 ")


class Kernel:
    """The results of one kernel."""

    def __init__(self, directory):
        self.name = directory.name
        self.results = directory / "results"
        self.disk = directory / "disk.img"
        lines = (self.results / "facts").read_text().splitlines()
        self.facts = dict(line.split(" ", 1) for line in lines)
        self.messages = (self.results / "dmesg").read_text(errors="replace").splitlines()
        self.problems = [f"the kernel complains: {line}" for line in self.messages if COMPLAINT.search(line)]
        self.has_policy = (directory / "root/policy").exists()
        self.verdicts = {}  # "same" or "DIFFERS", by the name of the run

    def events(self, run):
        """All events of a run except its output, in order. Log records are events too."""
        events = []
        for line in (self.results / f"{run.name}.journal").read_text().split("\n")[:-1]:
            record = RECORD.fullmatch(line)
            if line.startswith('{"event":'):
                events.append(json.loads(line))
            elif record:
                events.append({"event": "log", "priority": PRIORITIES[record[2]], "tag": record[1],
                               "text": record[3]})
            elif events and events[-1]["event"] == "log":
                # The text of a log record can have a line end within it or at its end.
                events[-1]["text"] += "\n" + line
            else:
                events.append({"event": "unknown", "text": line})
        return events

    def output(self, run):
        return (self.results / f"{run.name}.output").read_text()


def simulated(expected, run):
    """The events of a simulated run that a run on a real kernel also has, and the simulated output."""
    lines = (expected / f"{run.name}.journal").read_text().splitlines()
    events = [json.loads(line) for line in lines]
    output = "".join(event["text"] for event in events if event["event"] == "stdout")
    unseen = OF_SIMULATION | (set() if run.feature else SEEN_BY_MODULE)
    return [event for event in events
            if event["event"] not in unseen and event.get("priority", INFORMATION) >= INFORMATION], output


def as_lines(events, output):
    return [json.dumps(event) for event in events] + [f"output: {line}" for line in output.splitlines()]


def compare(kernel, expected, run):
    wanted = as_lines(*simulated(expected, run))
    found = as_lines(kernel.events(run), kernel.output(run))
    kernel.verdicts[run.name] = "same" if found == wanted else "DIFFERS"
    if found != wanted:
        kernel.problems += [f"{run.name}:", *difflib.unified_diff(wanted, found, "simulated", kernel.name,
                                                                 lineterm="")]


def probe_answers(kernel, files, run):
    """Compares the result and errno of each call of the probe with those of the simulated run."""
    wanted = (files / f"{run.file}.out").read_text().splitlines()
    found = (kernel.results / f"{run.name}.out").read_text().splitlines()
    if found != wanted:
        kernel.verdicts[run.name] = "DIFFERS"
        kernel.problems += [f"{run.name}:", *difflib.unified_diff(wanted, found, "simulated", kernel.name,
                                                                 lineterm="")]


def last_payloads(kernel, all_runs):
    """Maps the path of each signed file to the payload with which the file was last signed."""
    return {event["path"]: bytes.fromhex(event["payload"])
            for run in all_runs for event in kernel.events(run)
            if event["event"] == "sign" and event["result"] == 0}


def check_disk(kernel, files, all_runs):
    """Checks that the disk keeps the payload of each signed file, and the digest of the bytes that
    were signed. Reads the disk with debugfs of e2fsprogs. A run changes changed.jar after this file
    was signed, so the kept digest must differ from the digest of the file's present bytes. Returns
    the number of signed files."""
    payloads = last_payloads(kernel, all_runs)
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        commands = []
        for number, path in enumerate(payloads):
            inside = "/" + str(pathlib.Path(path).relative_to(files))
            commands += [f"dump {inside} {directory}/{number}.bytes",
                         f"ea_get -f {directory}/{number}.kept {inside} security.integrity_stand_in"]
        (directory / "commands").write_text("\n".join(commands) + "\n")
        subprocess.run(["debugfs", "-f", directory / "commands", kernel.disk], check=True,
                       stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        for number, (path, payload) in enumerate(payloads.items()):
            digest = hashlib.sha256((directory / f"{number}.bytes").read_bytes()).digest()
            kept = directory / f"{number}.kept"
            is_changed = path.endswith("/changed.jar")
            if not kept.exists() or kept.read_bytes()[32:] != payload:
                kernel.problems.append(f"{path} does not keep its payload on the disk")
            elif (kept.read_bytes()[:32] == digest) == is_changed:
                kernel.problems.append(f"{path} does not keep the digest of the bytes that were signed")
    return len(payloads)


def check_domain(kernel, all_runs):
    """With an SELinux policy, checks that the number of entries into the tool's domain equals the
    number of confined runs."""
    entered = sum(bool(ENTRY.search(line)) for line in kernel.messages)
    confined = sum(run.confined for run in all_runs)
    if kernel.has_policy and entered != confined:
        kernel.problems.append(f"the tool's domain was entered {entered} times in {confined} confined runs")


def summary(expected, run):
    """Counts the answers of the simulated kernel and of libzu in this run. The result is a text such
    as "3 signed, 1 registered"."""
    events, _ = simulated(expected, run)
    answers = {}
    for event in events:
        if event["event"] in ("sign", "verify"):
            answer = {"sign": "signed", "verify": "trusted"}[event["event"]]
            if event["result"] != 0:
                answer = f"{event['event']}: {runs.error_name(event['errno'])}"
        elif event["event"] == "register":
            answer = "registered" if event["result"] == 0 else f"register: {event['result']}"
        else:
            continue
        answers[answer] = answers.get(answer, 0) + 1
    return ", ".join(f"{count} {answer}" for answer, count in answers.items()) or "no answers"


def print_table(kernels, expected, all_runs):
    rows = [["", "answers of the simulated phone"] + [kernel.facts["release"] for kernel in kernels]]
    rows += [["", ""] + [f"{k.facts['machine']}, {k.facts['page']} pages" for k in kernels]]
    rows += [["", ""] + ["SELinux enforcing" if k.has_policy else "" for k in kernels]]
    rows += [["", "seconds to boot, and to run"] +
             [f"{float(k.facts['booted']):.0f} + {float(k.facts['ended']) - float(k.facts['booted']):.0f}"
              for k in kernels]]
    rows += [[run.name, summary(expected, run)] + [k.verdicts[run.name] for k in kernels]
             for run in all_runs]
    widths = [max(len(row[column]) for row in rows) for column in range(len(rows[0]))]
    for row in rows:
        print("  ".join(cell.ljust(width) for cell, width in zip(row, widths)).rstrip())


def main():
    files, expected, *directories = [pathlib.Path(word).resolve() for word in sys.argv[1:]]
    all_runs = runs.all_runs(runs.golden_names(files))
    kernels = [Kernel(directory) for directory in directories]
    kept = 0
    for kernel in kernels:
        for run in all_runs:
            compare(kernel, expected, run)
            if run.program == runs.PROBE:
                probe_answers(kernel, files, run)
        kept += check_disk(kernel, files, all_runs)
        check_domain(kernel, all_runs)
    print_table(kernels, expected, all_runs)
    problems = [f"{kernel.name}: {problem}" for kernel in kernels for problem in kernel.problems]
    if problems:
        print(f"FAILED: {len(all_runs)} runs on {len(kernels)} kernels", *problems, sep="\n")
        return 1
    print(f"{len(all_runs)} runs on {len(kernels)} kernels: all results and payloads equal the "
          f"simulator's, and {kept} signed files keep their payloads on the disk")
    return 0


if __name__ == "__main__":
    sys.exit(main())
