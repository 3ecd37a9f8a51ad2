#!/usr/bin/env python3
"""Compiles integration/sepolicy for each API level in LEVELS. platform.conf, platform_end.conf and
zu.conf take the place of the platform's policy. The policy must grant exactly the permissions of
GRANTED, and with libzu also those of GRANTED_WITH_ZU. Permissions that the level does not know are
left out. If a rule of REFUSED is added, a neverallow rule must make the compilation fail.

file_contexts must be valid. The path of each installed program must match exactly one pattern of
file_contexts, and each pattern must match a program. m4, checkpolicy, secilc and setfiles are
Debian's.
"""

import pathlib
import re
import subprocess
import sys
import tempfile

HERE = pathlib.Path(__file__).resolve().parent
KIT = HERE.parents[1] / "integration/sepolicy"
ALLOW = re.compile(r"\(allow (\S+) (\S+) \((\S+) \(([^)]*)\)\)\)")

# By API level: the product's definitions for m4, and the permissions and attributes that the
# platform's policy of this level does not declare.
LEVELS = {27: (["-Dapktoolkit_level=27"], {"map", "system_file_type"}),
          28: (["-Dapktoolkit_level=28"], {"system_file_type"}),
          29: ([], set()),
          36: ([], set())}

# The permissions of each domain, as "target:class permissions", including those from the macros.
GRANTED = {
    "apktoolkit": [
        "apktoolkit_exec:file entrypoint execute execute_no_trans getattr map open read",
        "system_data_file:dir search",
        "apk_data_file:dir search",
        "mnt_expand_file:dir search",
        "apk_data_file:file getattr map open read",
        "labeledfs:filesystem getattr",
        "apktoolkit_jar_file:dir search",
        "apktoolkit_jar_file:file getattr map open read",
        "installd:fd use",
        "installd:process sigchld",
        "apktoolkit_all:fd use",
        "apktoolkit_all:process sigchld",
    ],
    "apktoolkit_all": [
        "apktoolkit_all_exec:file entrypoint execute getattr map open read",
        "apktoolkit_exec:file execute getattr map open read",
        "apktoolkit:process rlimitinh sigkill siginh transition",
        "self:process setrlimit",
        "system_data_file:dir search",
        "system_data_file:file getattr open read",
    ],
    "installd": [
        "apktoolkit_exec:file execute getattr map open read",
        "apktoolkit:process rlimitinh sigkill siginh transition",
        "self:process setrlimit",
    ],
    "init": [
        "apktoolkit_all_exec:file execute getattr map open read",
        "apktoolkit_all:process rlimitinh siginh transition",
    ],
}
GRANTED_WITH_ZU = {
    "apktoolkit": GRANTED["apktoolkit"] + [
        "servicemanager:binder call transfer",
        "zu_server:binder call transfer",
        "zu_server:fd use",
        "zu_service:service_manager find",
    ],
    "zu_server": ["apktoolkit:binder transfer"],
}

# Rules that the neverallow rules of integration/sepolicy must refuse in any product's policy.
REFUSED = [
    "allow apktoolkit apk_data_file:file write;",
    "allow apktoolkit system_file:file append;",
    "allow apktoolkit self:capability dac_override;",
    "allow servicemanager apktoolkit:process transition;",
]


def run(*command, **options):
    return subprocess.run(command, text=True, stdout=subprocess.PIPE, stderr=subprocess.STDOUT,
                          check=False, **options)


def expand(level, defines, parts):
    result = run("m4", "-E", f"-Dplatform_level={level}", *defines, *parts)
    if result.returncode != 0:
        sys.exit(f"m4: {result.stdout}")
    return result.stdout


def compiled(directory, level, parts, more=""):
    """Returns the policy in CIL and an empty text, or None and the compiler's error. `more` has further
    rules."""
    text = directory / "policy.conf"
    rules = expand(level, LEVELS[level][0], [HERE / "platform.conf", *parts])
    text.write_text(rules + more + (HERE / "platform_end.conf").read_text())
    for options in (["-o", directory / "binary"], ["-C", "-o", directory / "cil"]):
        result = run("checkpolicy", "-M", "-c", "30", *options, text)
        if result.returncode != 0:
            return None, result.stdout
    result = run("secilc", "-c", "30", "-o", directory / "policy", "-f", "/dev/null", directory / "cil")
    if result.returncode != 0:
        return None, result.stdout
    return (directory / "cil").read_text(), ""


def grants(cil):
    """For each source, the set of (target, class, permission) that the policy allows."""
    found = {}
    for source, target, kind, permissions in ALLOW.findall(cil):
        for permission in permissions.split():
            found.setdefault(source, set()).add((target, kind, permission))
    return found


def wanted(listed, unknown):
    result = {}
    for source, lines in listed.items():
        for line in lines:
            place, *permissions = line.split()
            target, kind = place.split(":")
            result.setdefault(source, set()).update(
                (target, kind, permission) for permission in permissions if permission not in unknown)
    return result


def difference(name, found, expected):
    return [f"{name}: {source} {word} {' '.join(rule)}"
            for source in sorted(found.keys() | expected.keys())
            for word, rules in (("also gets", found.get(source, set()) - expected.get(source, set())),
                                ("does not get", expected.get(source, set()) - found.get(source, set())))
            for rule in sorted(rules)]


def check(directory, level):
    unknown = LEVELS[level][1]
    tool, zu = KIT / "apktoolkit.te", KIT / "apktoolkit_zu.te"
    problems = []
    for name, parts, listed in (
            (f"level {level}", [tool], GRANTED),
            (f"level {level} with libzu", [HERE / "zu.conf", tool, zu], {**GRANTED, **GRANTED_WITH_ZU})):
        cil, complaint = compiled(directory, level, parts)
        if cil is None:
            problems.append(f"{name}: {complaint}")
            continue
        problems += difference(name, grants(cil), wanted(listed, unknown))
        if ("typeattributeset system_file_type" in cil) == ("system_file_type" in unknown):
            problems.append(f"{name}: system_file_type must be used if and only if the level knows it")
        labels = run("setfiles", "-c", directory / "policy", KIT / "file_contexts")
        if labels.returncode != 0:
            problems.append(f"{name}: file_contexts: {labels.stdout}")
    for rule in REFUSED:
        cil, complaint = compiled(directory, level, [tool], rule + "\n")
        if cil is not None or "neverallow" not in complaint:
            problems.append(f"level {level}: '{rule}' is not refused by a neverallow rule: {complaint}")
    return problems


def check_names():
    """Checks that each installed program matches exactly one pattern of file_contexts, and that
    each pattern matches a program."""
    programs = ["apktoolkit", "apktoolkit-all", "apktoolkit-bound", "apktoolkit-verify"]
    patterns = [line.split()[0] for line in (KIT / "file_contexts").read_text().splitlines()
                if line and not line.startswith("#")]
    problems = []
    for name in programs:
        count = sum(bool(re.fullmatch(p, f"/system/bin/{name}")) for p in patterns)
        if count != 1:
            problems.append(f"/system/bin/{name} matches {count} patterns of file_contexts, not 1")
    for pattern in patterns:
        if not any(re.fullmatch(pattern, f"/system/bin/{name}") for name in programs):
            problems.append(f"file_contexts: {pattern} matches no installed program")
    return problems


def main():
    problems = check_names()
    with tempfile.TemporaryDirectory() as name:
        for level in LEVELS:
            problems += check(pathlib.Path(name), level)
    for problem in problems:
        print(problem)
    if not problems:
        print(f"policy: {len(LEVELS)} kinds of release, each grants what is listed and nothing else")
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main())
