#!/usr/bin/env python3
"""trial_test.py PROGRAMS GOLDEN: runs integration/phone/try-on-phone with a stand-in for adb
(tests/phone/adb), on phones that work and on phones that do not.

PROGRAMS is the directory of the built programs. GOLDEN is the directory of the golden packages.
"""

import os
import pathlib
import shutil
import subprocess
import sys
import tempfile

HERE = pathlib.Path(__file__).resolve().parent
ROOT = HERE.parents[1]
sys.path.insert(0, str(ROOT / "tests/project"))
from sources import report  # noqa: E402

TRY_ON_PHONE = ROOT / "integration/phone/try-on-phone"


def trial(programs, package, mood=""):
    """Runs try-on-phone on a new phone, with `mood` as its STUB_MOOD (tests/phone/adb). Returns the
    exit status, the output, and the files that try-on-phone left on the phone."""
    with tempfile.TemporaryDirectory() as name:
        phone = pathlib.Path(name) / "phone"
        built = pathlib.Path(name) / "system"
        shutil.copytree(programs, built / "bin")
        shutil.copytree(programs / "../lib/apktoolkit", built / "lib64")
        environment = {**os.environ, "STUB_PHONE": str(phone), "STUB_MOOD": mood,
                       "STUB_SIMULATOR": str(programs / "apktoolkit-sim"),
                       "PATH": f"{HERE}:{os.environ['PATH']}"}
        result = subprocess.run([TRY_ON_PHONE, built / "bin", package], text=True, check=False,
                                stdout=subprocess.PIPE, stderr=subprocess.STDOUT, env=environment)
        left = [path for path in phone.glob("data/local/tmp/*")]
        return result.returncode, result.stdout, left


def check_trial(programs, golden):
    problems = []

    def expect(name, found, status, *texts):
        if found[0] != status or found[2] or not all(text in found[1] for text in texts):
            problems.append(f"{name}: status {found[0]}, left {found[2]}:\n{found[1]}")

    good = golden / "apksigner-sha256-2048"
    expect("a good package", trial(programs, good), 0, "integrity value: 1f\n",
           "I/ApkToolkit: VeltSign finished: 0.\n", "base.apk: trusted\nlib/arm/libvault.so: trusted\n"
           "lib/arm64/libvault.so: trusted\n")
    expect("a package that is refused", trial(programs, golden / "changed-dex"), 1,
           "base.apk: not trusted (errno 126, ENOKEY)\n")
    expect("a kernel that refuses", trial(programs, good, "--sign-errno EPERM"), 1,
           "E/ApkToolkit: VELT can't sign a file (result=10000, errno 1", "base.apk: not trusted")
    expect("no phone", trial(programs, good, "no phone"), 2, "try-on-phone: adb finds no phone: connect one, or start adb\n")
    expect("no root", trial(programs, good, "no root"), 2, "install a userdebug build on the phone\n")
    expect("a full phone", trial(programs, good, "full"), 2, "adb: no space left on device\n",
           "try-on-phone: this failed: adb push")
    expect("no package", trial(programs, golden), 2, "usage: try-on-phone")
    with tempfile.TemporaryDirectory() as name:
        changed = pathlib.Path(name) / "package"
        shutil.copytree(good, changed)
        (changed / "lib/arm/libvault.so").write_text("other bytes")
        expect("another library", trial(programs, changed), 1, "File not verified", "base.apk: trusted\n"
               "lib/arm/libvault.so: not trusted (errno 126, ENOKEY)\nlib/arm64/libvault.so: trusted\n")
    return problems


if __name__ == "__main__":
    found = check_trial(*(pathlib.Path(word).resolve() for word in sys.argv[1:]))
    sys.exit(report(found, "correct integration/phone/try-on-phone, or the stand-in tests/phone/adb"))
