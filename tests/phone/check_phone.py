#!/usr/bin/env python3
"""check_phone.py: compares integration/phone with the blueprints (Android.bp files), and METADATA
with metadata.proto and CHANGES.md."""

import datetime
import pathlib
import re
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


def main():
    problems = [*check_makefile(), *check_service(), *check_tests(), *check_license(), *check_metadata()]
    for problem in problems:
        print(problem)
    if not problems:
        print("phone: the files agree with the blueprints")
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main())
