#!/usr/bin/env python3
"""The runs on the real kernel and in the simulated phone, for scripts/kernel.

runs.py files DIRECTORY GOLDEN           makes the files for the runs. GOLDEN is the directory of the
                                         packages that tests/journeys/make_golden_packages made
runs.py simulate DIRECTORY BUILD OUT     simulates all runs and writes the journals OUT/NAME.journal.
                                         Also writes OUT/runs, a script that makes the same runs under
                                         qemu
"""

import errno
import os
import pathlib
import shutil
import subprocess
import sys
import zipfile

TOOL, VERIFY, PROBE = "apktoolkit", "apktoolkit-verify", "simulator_probe"

GOOD = "golden/apksigner-sha256-2048"

# The probe's calls (tests/simulator/phone/probe.cpp). The tool makes only a few of them, but the
# simulated kernel must answer all of them like a real one.
PROBES = {
    # A phone's kernel trusts the JARs of the phone's system. The kernel under test trusts only
    # files that it signed. The probe therefore signs the JARs below; later runs use them.
    "trust": ["open jars/trusted.jar", "sign 5 0000", "open jars/trusted-marked.jar", "sign 6 0000",
              "open jars/changed.jar", "sign 7 0000", "open jars/refused.jar", "sign 8 0000",
              "verify 5"],
    "calls": ["verify 3", "sign 3 0200abcd", "verify 3", "sign64 3 0000", "verify64 3",
              # the kernel reads exactly as many bytes as the payload's length says
              "sign 3 0100abcdef", "sign 3 d007" + "5a" * 2000,
              # payloads in memory that cannot be read, or of which only the start can be read
              "sign 3 null", "sign 3 wild", "sign 3 cut",
              # descriptors that are not open, or that only name a file (O_PATH)
              "sign 700 0000", "sign -1 0000", "sign 700 null", "verify 700", "verify -1",
              "name .", "sign 5 0000", "verify 5",
              # commands that are not those of the feature
              "fcntl 3 1123 0", "fcntl 3 1126 0", "fcntl64 3 99999 0", "fcntl 700 1126 0", "fcntl 3 1 0",
              # the integrity files, which can only be read
              "fopen /proc/self/integrity/value r", "fopen64 /proc/self/integrity/value r",
              "fopen /proc/1/integrity/value r", "fopen /proc/self/integrity/value w",
              "fopen /proc/self/integrity/value r+", "fopen /proc/self/integrity/values r",
              "fopen /proc/999999999/integrity/value r"],
}


class Run:
    """A run of a program for one file, on a phone that `options` of apktoolkit-sim describe.

    before: a shell command that changes the files before the run, under qemu and in the simulation.
    feature: True if the kernel has the file-integrity feature. mount: how the files are mounted.
    confined: True if the run is in the tool's SELinux domain on a kernel with a policy. Runs that
    open a FIFO or a directory are not confined, because the policy has rules only for regular files.
    Runs of the probe are not confined either: no phone contains the probe, so the policy has no
    rules for it.
    """

    def __init__(self, name, file, *options, program=TOOL, before=None, feature=True, mount="rw",
                 confined=True):
        self.name, self.file, self.options, self.program = name, file, list(options), program
        self.before, self.feature, self.mount = before, feature, mount
        self.confined = confined and program != PROBE


def all_runs(golden):
    """All runs, in order."""
    changed = "printf X | dd of=jars/changed.jar bs=1 seek=40 conv=notrunc 2>/dev/null"
    return [
        Run("no-feature", f"{GOOD}/base.apk", "--integrity", "missing", feature=False),
        Run("no-feature-jar", "jars/trusted.jar", "--verify-errno", "EINVAL", feature=False),
        Run("no-feature-verify", "jars/trusted.jar", "--verify-errno", "EINVAL", program=VERIFY,
            feature=False),
        Run("trust", "probe/trust", program=PROBE),
        Run("calls", "probe/calls", program=PROBE),
        *(Run(name, f"golden/{name}/base.apk") for name in golden),
        Run("unsigned", "golden/unsigned.apk"),
        Run("settles-later", f"{GOOD}/base.apk", "--integrity", "ffffffff,1f"),
        Run("settles-much-later", f"{GOOD}/base.apk", "--integrity", "ffffffff,ffffffff,ffffffff,1f"),
        Run("integrity-0", f"{GOOD}/base.apk", "--integrity", "0"),
        Run("integrity-missing", f"{GOOD}/base.apk", "--integrity", "missing"),
        Run("integrity-is-no-number", f"{GOOD}/base.apk", "--integrity", "settled"),
        Run("kernel-refuses", f"{GOOD}/base.apk", "--sign-errno", "EACCES"),
        Run("jar-trusted", "jars/trusted.jar"),
        Run("jar-trusted-marked", "jars/trusted-marked.jar"),
        Run("jar-not-trusted", "jars/other.jar"),
        Run("jar-not-trusted-marked", "jars/other-marked.jar"),
        Run("jar-marked-empty", "jars/marked-empty.jar"),
        Run("jar-changed-since", "jars/changed.jar", before=changed),
        Run("jar-revoked", "jars/other.jar", "--verify-errno", "EKEYREVOKED"),
        Run("jar-kernel-refuses", "jars/refused.jar", "--sign-errno", "EPERM"),
        Run("library-is-fifo", "fifo-library/base.apk", confined=False),
        Run("link", "other/link.apk"),
        Run("fifo", "other/fifo", confined=False),
        Run("directory", "other", confined=False),
        Run("text", "other/text"),
        Run("empty", "other/empty"),
        Run("not-there", "other/missing"),
        Run("verify-package", f"{GOOD}/base.apk", program=VERIFY),
        Run("verify-library", f"{GOOD}/lib/arm64/libvault.so", program=VERIFY),
        Run("verify-refused-package", "golden/changed-dex/base.apk", program=VERIFY),
        Run("verify-changed-jar", "jars/changed.jar", program=VERIFY),
        Run("verify-revoked", "jars/other.jar", "--verify-errno", "EKEYREVOKED", program=VERIFY),
        Run("verify-fifo", "other/fifo", program=VERIFY, confined=False),
        Run("verify-directory", "other", program=VERIFY, confined=False),
        Run("verify-not-there", "other/missing", program=VERIFY),
        Run("read-only", f"{GOOD}/base.apk", mount="ro"),
        Run("read-only-verify", f"{GOOD}/base.apk", program=VERIFY, mount="ro"),
    ]


def make_files(directory, golden):
    shutil.rmtree(directory, ignore_errors=True)
    directory.mkdir(parents=True)
    shutil.copytree(golden, directory / "golden")
    shutil.copytree(directory / GOOD, directory / "fifo-library")
    library = directory / "fifo-library/lib/arm64/libvault.so"
    library.unlink()
    os.mkfifo(library)
    jars = directory / "jars"
    jars.mkdir()
    for name in ("trusted", "trusted-marked", "changed", "refused", "other", "other-marked", "marked-empty"):
        with zipfile.ZipFile(jars / f"{name}.jar", "w") as archive:
            archive.writestr("name", name * 10)
    for name, value in ("trusted-marked", b"1"), ("other-marked", b"1"), ("marked-empty", b""):
        try:
            os.setxattr(jars / f"{name}.jar", "user.zu", value)
        except OSError as error:
            sys.exit(f"runs: the file system of {jars} does not keep the attribute user.zu: {error}")
    other = directory / "other"
    other.mkdir()
    (other / "link.apk").symlink_to(f"../{GOOD}/base.apk")
    os.mkfifo(other / "fifo")
    (other / "text").write_text("no archive\n" * 10)
    (other / "empty").touch()
    probe = directory / "probe"
    probe.mkdir()
    for name, lines in PROBES.items():
        text = "\n".join(lines) + "\n"
        (probe / name).write_text(text.replace("open jars/", f"open {jars}/").replace("name .", f"name {other}"))


def golden_names(directory):
    return sorted(path.parent.name for path in directory.glob("golden/*/base.apk"))


def simulate(run, directory, build, out):
    """Runs the program in the simulated phone. The journal goes to OUT/NAME.journal."""
    if run.before:
        subprocess.run(run.before, shell=True, cwd=directory, check=True)
    command = [build / "bin/apktoolkit-sim", "--install=no", "--installer=off", "--json",
               "--state", out / "state", *run.options]
    command += ["--verify"] if run.program == VERIFY else ["--tool", build / "bin" / run.program]
    command.append(directory / run.file)
    if run.mount == "ro":
        command = [*namespace(), "sh", "-c",
                   'mount --bind "$0" "$0" && mount -o remount,bind,ro "$0" && exec "$@"', directory,
                   *command]
    result = subprocess.run(command, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, check=False)
    if result.returncode not in (0, 1, 3, 4) or b'"event":"exit"' not in result.stdout:
        sys.exit(f"runs: the simulation of {run.name} ends with {result.returncode}")
    (out / f"{run.name}.journal").write_bytes(result.stdout)


def namespace():
    return ["unshare", "--mount"] if os.geteuid() == 0 else ["unshare", "--mount", "--map-root-user"]


def error_name(number):
    return errno.errorcode[number]


PARAMETERS = {"--integrity": "1f", "--sign-errno": "0", "--verify-errno": "ENOKEY"}


def guest_lines(run, before):
    """The lines of the script OUT/runs for this run; `before` is the previous run. The functions
    that the lines call are in tests/kernel/init."""
    if run.feature and not before.feature:
        yield "load_feature"
    if run.before:
        yield f"(cd $files && {run.before})"
    if run.mount != before.mount:
        yield f"remount {run.mount}"
    if run.feature:
        values = {**PARAMETERS, **dict(zip(run.options[::2], run.options[1::2]))}
        yield "phone " + " ".join(str(getattr(errno, value, value)) for value in values.values())
    yield f"run {run.name} {run.program} $files/{run.file}" + (" $installer" if run.confined else "")


def guest_script(runs):
    lines = []
    before = Run("", "", feature=False)
    for run in runs:
        lines += guest_lines(run, before)
        before = run
    return "\n".join([*lines, "remount rw"]) + "\n"


def main():
    command, *words = sys.argv[1:]
    paths = [pathlib.Path(word).resolve() for word in words]
    if command == "files":
        make_files(*paths)
        return
    directory, build, out = paths
    shutil.rmtree(out, ignore_errors=True)
    out.mkdir(parents=True)
    runs = all_runs(golden_names(directory))
    for run in runs:
        simulate(run, directory, build, out)
    (out / "runs").write_text(guest_script(runs))


if __name__ == "__main__":
    main()
