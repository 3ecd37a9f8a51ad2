#!/usr/bin/env python3
"""check_phone.py PROGRAMS GOLDEN: compares integration/phone with the blueprints (Android.bp
files), and METADATA with metadata.proto and CHANGES.md. Tries try-on-phone with a stand-in for adb
(tests/phone/adb), on phones that work and on phones that do not.

PROGRAMS is the directory of the built programs. GOLDEN is the directory of the golden packages.
"""

import datetime
import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile
import xml.etree.ElementTree

HERE = pathlib.Path(__file__).resolve().parent
ROOT = HERE.parents[1]
KIT = ROOT / "integration/phone"
sys.path.insert(0, str(ROOT / "tests/project"))
from blueprint import Blueprint  # noqa: E402

PROGRAMS = {"apktoolkit", "apktoolkit-all", "apktoolkit-bound", "apktoolkit-verify"}


def modules(path, kind):
    return {module["name"]: module for module in Blueprint(path).modules if module["type"] == kind}


def check_makefile():
    """A product's makefile gets exactly the programs that Android.bp builds."""
    text = f"include {KIT}/apktoolkit.mk\n$(info $(PRODUCT_PACKAGES))\nall:;@:\n"
    result = subprocess.run(["make", "--silent", "-f", "-"], input=text, text=True, check=True,
                            stdout=subprocess.PIPE)
    named, built = set(result.stdout.split()), set(modules(ROOT / "Android.bp", "cc_binary"))
    return [] if named == built == PROGRAMS else [f"apktoolkit.mk: {named}, Android.bp: {built}"]


def check_service():
    """Android.bp installs the service together with its program. init starts the service only on
    request, and does not restart it when it ends."""
    lines = [line.split() for line in (KIT / "apktoolkit.rc").read_text().splitlines()
             if line and not line.startswith("#")]
    problems = []
    if lines[0][:3] != ["service", "apktoolkit-all", "/system/bin/apktoolkit-all"] or len(lines[0]) != 5:
        problems.append(f"apktoolkit.rc: {lines[0]}")
    if {"disabled", "oneshot"} - {word for line in lines[1:] for word in line}:
        problems.append("apktoolkit.rc: the service would start by itself, or again and again")
    owner = modules(ROOT / "Android.bp", "cc_binary")["apktoolkit-all"]
    if owner.get("init_rc") != ["integration/phone/apktoolkit.rc"]:
        problems.append("Android.bp: apktoolkit-all does not install its service")
    return problems


def check_tests():
    """AndroidTest.xml pushes each test of tests/Android.bp to the phone, and runs the tests in the
    directory to which it pushes them."""
    tree = xml.etree.ElementTree.parse(KIT / "AndroidTest.xml")
    options = [(option.get("name"), option.get("value")) for option in tree.iter("option")]
    pushed = {value for name, value in options if name == "push"}
    run = [value for name, value in options if name == "module-name"]
    built = sorted(modules(ROOT / "tests/Android.bp", "cc_test"))
    problems = []
    if run != built:
        problems.append(f"AndroidTest.xml runs {run}, tests/Android.bp builds {built}")
    if pushed != {f"{name}->/data/local/tmp/{name}" for name in built}:
        problems.append(f"AndroidTest.xml pushes {pushed}")
    if {value for name, value in options if name == "native-test-device-path"} != {"/data/local/tmp"}:
        problems.append("AndroidTest.xml does not run the tests in /data/local/tmp")
    return problems


def check_license():
    """For trees of Android 12 and later, license.bp and package.bp are appended to Android.bp.
    Android.bp then has one license for all of its modules, and the license's text exists."""
    problems = []
    with tempfile.TemporaryDirectory(dir=ROOT / "build") as name:
        both = pathlib.Path(name) / "Android.bp"
        both.write_text("".join((path).read_text() for path in
                                (ROOT / "Android.bp", KIT / "license.bp", KIT / "package.bp")))
        licenses, packages = modules_of(both, "license"), modules_of(both, "package")
    if len(licenses) != 1 or [p["default_applicable_licenses"] for p in packages] != [[licenses[0]["name"]]]:
        problems.append(f"license: {licenses}, package: {packages}")
    for text in licenses[0]["license_text"]:
        if not (ROOT / text).is_file():
            problems.append(f"license.bp: there is no {text}")
    return problems


def modules_of(path, kind):
    return [module for module in Blueprint(path).modules if module["type"] == kind]


def check_metadata():
    """METADATA has the form of metadata.proto. Its version and day are those of the newest heading
    in CHANGES.md."""
    with (ROOT / "METADATA").open() as metadata:
        result = subprocess.run(["protoc", f"--proto_path={HERE}", "--encode=Metadata",
                                 HERE / "metadata.proto"], stdin=metadata, capture_output=True, check=False)
    if result.returncode != 0:
        return [f"METADATA: {result.stderr.decode()}"]
    heading = re.search(r"^## ([\d.]+), (?:in preparation since )?(.*)$",
                        (ROOT / "CHANGES.md").read_text(), re.M)
    day = datetime.datetime.strptime(heading[2], "%d %B %Y")
    text = (ROOT / "METADATA").read_text()
    wanted = (f'version: "{heading[1]}"',
              f"last_upgrade_date {{ year: {day.year} month: {day.month} day: {day.day} }}")
    return [f"METADATA does not have {line}" for line in wanted if line not in text]


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
        result = subprocess.run([KIT / "try-on-phone", built / "bin", package], text=True, check=False,
                                stdout=subprocess.PIPE, stderr=subprocess.STDOUT, env=environment)
        left = [path for path in phone.glob("data/local/tmp/*")]
        return result.returncode, result.stdout, left


def check_trial(programs, golden):
    problems = []

    def expect(name, found, status, *texts):
        if found[0] != status or found[2] or not all(text in found[1] for text in texts):
            problems.append(f"try-on-phone, {name}: status {found[0]}, left {found[2]}:\n{found[1]}")

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


def main():
    programs, golden = (pathlib.Path(word).resolve() for word in sys.argv[1:])
    problems = [*check_makefile(), *check_service(), *check_tests(), *check_license(), *check_metadata(),
                *check_trial(programs, golden)]
    for problem in problems:
        print(problem)
    if not problems:
        print("phone: the files agree with the blueprints; try-on-phone did what it says, with a stand-in "
              "for adb")
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main())
