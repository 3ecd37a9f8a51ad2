#!/usr/bin/env python3
"""Compares debian/changelog with CHANGES.md. With --write as the first argument, rewrites
debian/changelog instead. In both cases, runs scripts/release with good and bad tags in a new
temporary repository. There, stand-ins replace scripts/setup and scripts/reproducible. The stand-ins
install nothing and build no real packages. The last argument is the build's version. The newest
heading of CHANGES.md must have this version.
"""

import os
import pathlib
import re
import shutil
import subprocess
import sys
import tarfile
import tempfile

from sources import ROOT, report

RELEASED = "# Changes\n\n## 1.2.3, 4 May 2026\n\n- It works.\n\n## 1.2.2, 3 May 2026\n"
BUILDER = 'mkdir -p build/package && git rev-parse HEAD >build/package/tool.deb'


def version_problems(version):
    newest = re.search(r"^## (\S+),", (ROOT / "CHANGES.md").read_text(), re.M)[1]
    if newest != version:
        yield f"the newest heading of CHANGES.md has the version {newest}, but the build has {version}"


class Repository:
    def __init__(self, directory):
        self.directory = directory
        self.environment = {**os.environ, "GNUPGHOME": str(directory / "gpg"), "HOME": str(directory),
                            "GIT_AUTHOR_NAME": "A", "GIT_AUTHOR_EMAIL": "a@example.com",
                            "GIT_COMMITTER_NAME": "A", "GIT_COMMITTER_EMAIL": "a@example.com"}
        (directory / "gpg").mkdir(mode=0o700)
        (directory / "scripts").mkdir()
        shutil.copy(ROOT / "scripts/release", directory / "scripts")
        for name, content in (("setup", "true"), ("reproducible", BUILDER)):
            script = directory / "scripts" / name
            script.write_text(f"#!/bin/bash\n{content}\n")
            script.chmod(0o755)
        (directory / ".gitignore").write_text("/build/\n/gpg/\n/.gitconfig\n")
        # scripts/release must not use this setting of the user.
        (directory / ".gitconfig").write_text("[tar]\n\tumask = user\n")
        self.run("gpg", "--batch", "--quiet", "--passphrase", "", "--quick-generate-key",
                 "A <a@example.com>", "ed25519", "sign")
        self.run("git", "init", "--quiet")

    def run(self, *command):
        return subprocess.run(command, cwd=self.directory, env=self.environment, text=True, check=True,
                              stdout=subprocess.PIPE, stderr=subprocess.STDOUT).stdout

    def commit(self, changes):
        (self.directory / "CHANGES.md").write_text(changes)
        self.run("git", "add", ".")
        self.run("git", "commit", "--quiet", "--message", "x")

    def tag(self, name, *options):
        self.run("git", "tag", "--message", "x", *options, name)

    def release(self, name):
        run = subprocess.run(["scripts/release", name], cwd=self.directory, env=self.environment,
                             text=True, capture_output=True, check=False)
        return run.returncode, run.stdout + run.stderr


def refusal_problems(repository):
    repository.commit(RELEASED)
    repository.tag("v1.2.3", "--no-sign")
    repository.tag("v1.2.2", "--sign")
    repository.commit(RELEASED.replace("4 May", "in preparation since 4 May").replace("3,", "4,", 1))
    repository.tag("v1.2.4", "--sign")
    for tag, reason in (("v1.2.3", "the tag v1.2.3 has no signature by a key that gpg knows"),
                        ("v1.2.2", "the version is 1.2.2, but the newest heading of CHANGES.md is "
                                   "'## 1.2.3, 4 May 2026'"),
                        ("v1.2.4", "CHANGES.md says that 1.2.4 is in preparation"),
                        ("v9", "the tag v9 has no signature by a key that gpg knows"),
                        ("1.2.3", "usage: scripts/release TAG, with a tag such as v1.2.3")):
        status, printed = repository.release(tag)
        if status != 1 or f"release: {reason}\n" not in printed:
            yield f"scripts/release {tag} ends with {status}: {printed}"
        if (repository.directory / "build/releases" / tag[1:] / "SHA256SUMS").exists():
            yield f"scripts/release {tag} left files"


def release_problems(repository):
    repository.commit(RELEASED)
    repository.tag("v1.2.3", "--sign", "--force")
    (repository.directory / "CHANGES.md").write_text("not committed")
    out = repository.directory / "build/releases/1.2.3"
    sums = []
    for umask in (0o022, 0o077):
        old = os.umask(umask)
        status, printed = repository.release("v1.2.3")
        os.umask(old)
        if status != 0:
            return [f"a good tag is refused: {printed}"]
        sums.append((out / "SHA256SUMS").read_text())
    problems = [] if sums[0] == sums[1] else [f"two runs make different files: {sums}"]
    found = sorted(path.name for path in out.iterdir())
    if found != ["SHA256SUMS", "apktoolkit-1.2.3.tar.gz", "tool.deb"]:
        problems.append(f"the release has {found}")
    if (out / "apktoolkit-1.2.3.tar.gz").read_bytes()[3:8] != bytes(5):
        problems.append("the tarball's gzip header has a file name or a time")
    with tarfile.open(out / "apktoolkit-1.2.3.tar.gz") as tarball:
        if tarball.extractfile("apktoolkit-1.2.3/CHANGES.md").read().decode() != RELEASED:
            problems.append("CHANGES.md in the tarball differs from CHANGES.md of the tag")
    if (out / "tool.deb").read_text() != repository.run("git", "rev-parse", "v1.2.3^{commit}"):
        problems.append("tool.deb was not built from the tag's commit")
    return problems


def main():
    problems = list(version_problems(sys.argv[1]))
    with tempfile.TemporaryDirectory() as name:
        repository = Repository(pathlib.Path(name))
        problems += refusal_problems(repository)
        problems += release_problems(repository)
        repository.run("gpgconf", "--kill", "all")
    changelog = subprocess.run([ROOT / "scripts/changelog"], capture_output=True, text=True, check=True).stdout
    return report(problems, "scripts/release, or CHANGES.md", {ROOT / "debian/changelog": changelog})


if __name__ == "__main__":
    sys.exit(main())
