#!/usr/bin/env python3
"""Runs each "keytool -genkeypair" command that README.md, docs/guide.md and man/apktoolkit.1 show.
The certificate that each command makes must be signed with SHA-256. The pages also name the default
algorithms of JDK 17 and JDK 21. If JDK 17 or JDK 21 is installed, its keytool must use the
algorithms that the pages name."""

import re
import subprocess
import sys
import tempfile

from sources import ROOT, report

PAGES = ("README.md", "docs/guide.md", "man/apktoolkit.1")
COMMAND = re.compile(r"keytool -genkeypair (?:.*\\\n)*.*")
# JDK -> length of an RSA key in bits -> the signature algorithm that keytool uses by default.
OWN_CHOICE = {17: {"3072": "sha256WithRSAEncryption", "3073": "sha384WithRSAEncryption"},
              21: {"2048": "sha384WithRSAEncryption"}}


def shown_commands(page):
    """The page's commands, each on one line. A manual page writes a backslash as \\e."""
    text = (ROOT / page).read_text().replace("\\e\n", "\\\n")
    return [re.sub(r"\\\n\s*", "", command) for command in COMMAND.findall(text)]


def signature_algorithm(command):
    """The signature algorithm of the certificate that the command makes, as openssl prints it."""
    with tempfile.TemporaryDirectory() as directory:
        run = subprocess.run(["bash", "-c", f"{command} -dname CN=Example -storepass android && "
                              "openssl pkcs12 -in release.p12 -passin pass:android -nokeys |"
                              "openssl x509 -noout -text"],
                             cwd=directory, capture_output=True, text=True, check=False)
    found = re.search(r"Signature Algorithm: (\w+)", run.stdout)
    return found[1] if found else run.stdout + run.stderr


def page_problems():
    problems = []
    for page in PAGES:
        commands = shown_commands(page)
        if not commands:
            problems.append(f"{page} shows no command that makes a key")
        for command in commands:
            # keytool asks for the values of -dname and -storepass if they are missing, so
            # signature_algorithm() adds them. The page's own values are removed, because keytool
            # warns about an option that is given twice.
            command = re.sub(r" -(dname|storepass) \S+| 2>.*", "", command)
            if (found := signature_algorithm(command)) != "sha256WithRSAEncryption":
                problems.append(f"{page}: the certificate of {command} is signed with {found}")
    return problems


def jdk_problems():
    version = subprocess.run(["java", "-version"], capture_output=True, text=True, check=True).stderr
    jdk = int(re.search(r'version "(\d+)', version)[1])
    for size, expected in OWN_CHOICE.get(jdk, {}).items():
        found = signature_algorithm(f"keytool -genkeypair -keyalg RSA -keysize {size} -alias release "
                                    "-keystore release.p12")
        if found != expected:
            yield f"JDK {jdk} signs the certificate of a key of {size} bits with {found}"


if __name__ == "__main__":
    sys.exit(report([*page_problems(), *jdk_problems()], "correct the command on the page, or the page's text about the JDK"))
