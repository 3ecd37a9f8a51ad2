#!/usr/bin/env python3
"""Compares the platform's build with CMake's: the file lists of both, also with the directories;
the calls that the linker wraps for a test; and the words that a blueprint may use in Android
8.1."""

import json
import pathlib
import re
import sys

from blueprint import Blueprint
from sources import ROOMS, ROOT, report, tool_sources

# Sources that need more than a phone has. Only the workstation's build has them.
WORKSTATION_ONLY = {
    "tests/apk/manifest_mf_test.cpp": "runs the JDK",
    "tests/crypto/mpi_mod_mpi_test.cpp": "compares with GMP",
    "tests/crypto/mpi_pow_mod_test.cpp": "compares with GMP",
    "tests/crypto/mpi_test.cpp": "compares with GMP",
    "tests/crypto/pkcs7_signer_test.cpp": "runs openssl",
    "tests/crypto/rsa_test.cpp": "compares with GMP",
    "tests/crypto/x509_authorities_test.cpp": "runs openssl",
    "tests/util/digest_test.cpp": "runs coreutils",
    "tests/verify/error_name_test.cpp": "compares with the workstation's C library",
    "fuzz/compiled_manifest_fuzz.cpp": "replaces the program's operator new",
    "fuzz/explanation_fuzz.cpp": "reads with the simulator",
    "fuzz/integrity_fuzz.cpp": "has the linker wrap calls of the C library",
    "fuzz/journal_fuzz.cpp": "reads with the simulator",
    "fuzz/mpi_fuzz.cpp": "compares with GMP",
    "fuzz/package_fuzz.cpp": "has the linker wrap a call of the zip library",
    "fuzz/verdict_fuzz.cpp": "judges with the simulator",
}

# The words that the build of Android 8.1 knows. An unknown word stops the whole tree.
KNOWN_TYPES = {"cc_binary", "cc_defaults", "cc_library_shared", "cc_library_static", "cc_test",
               "filegroup"}
KNOWN_PROPERTIES = {"cflags", "compile_multilib", "cpp_std", "data", "defaults",
                    "export_include_dirs", "init_rc", "ldflags", "local_include_dirs", "name", "shared_libs",
                    "srcs", "static_libs"}

# The first flag is for headers that are system headers in CMake's build but not in the platform's.
# The developers' presets set the second by a variable of CMake's own.
PLATFORM_ONLY_FLAGS = {"-Wno-sign-conversion", "-Werror"}


def main():
    problems = []
    platform = Blueprint(ROOT / "Android.bp")
    tests = Blueprint(ROOT / "tests/Android.bp")
    fuzz = Blueprint(ROOT / "fuzz/cc_fuzz.bp")
    hold_tool(platform, problems)
    hold_tests(tests, fuzz, problems)
    hold_flags(platform, problems)
    hold_wraps(tests, problems)
    hold_words(platform, tests, problems)
    return report(problems)


def hold_tool(platform, problems):
    core = cmake_sources("apktoolkit_core")
    compare("apktoolkit_core", platform.sources("apktoolkit_core"), core, problems)
    compare("apktoolkit_verification", platform.sources("apktoolkit_verification"),
            cmake_sources("apktoolkit_verification"), problems)
    compare("apktoolkit", platform.sources("apktoolkit"), cmake_sources("apktoolkit"), problems)
    compare("apktoolkit-verify", platform.sources("apktoolkit-verify"),
            cmake_sources("apktoolkit-verify"), problems)
    compare("apktoolkit-all", platform.sources("apktoolkit-all"),
            cmake_sources("apktoolkit-all", "integration") +
            cmake_sources("apktoolkit_caller", "integration"), problems)
    compare("apktoolkit-bound", platform.sources("apktoolkit-bound"),
            cmake_sources("apktoolkit-bound", "integration"), problems)
    compare("libzu", platform.sources("libzu"), cmake_sources("zu"), problems)
    listed = core + cmake_sources("apktoolkit") + cmake_sources("apktoolkit-verify")
    listed += cmake_sources("zu")
    compare("the tool's directories", listed, map(str, tool_sources()), problems)


def hold_tests(tests, fuzz, problems):
    compare("apktoolkit_test_support", tests.sources("apktoolkit_test_support"),
            cmake_sources("test_support", "tests/support"), problems)
    compare("apktoolkit_fuzz_support", fuzz.sources("apktoolkit_fuzz_support"),
            cmake_sources("fuzz_support", "fuzz"), problems)
    both = [source for room in ROOMS for source in cmake_sources(f"{room}_test", f"tests/{room}")]
    both += [str(path.relative_to(ROOT)) for path in (ROOT / "fuzz").glob("*_fuzz.cpp")]
    on_phone = tests.all_sources("cc_test") + fuzz.all_sources("cc_fuzz")
    shared = {"tests/support/phone.cpp", "fuzz/quiet_log.cpp"}
    compare("tests and fuzz targets", set(on_phone) - shared | set(WORKSTATION_ONLY), both, problems)
    problems += [f"{source} is in a module, and named as the workstation's own"
                 for source in set(on_phone) & set(WORKSTATION_ONLY)]


def hold_flags(platform, problems):
    settings = without_comments_of_cmake(ROOT / "cmake/CompilerSettings.cmake")
    lists = re.findall(r"(?:add_compile_options|set)\((?:APKTOOLKIT_TOOL_OPTIONS )?(-[^)]*)\)",
                       settings)
    warnings = {flag for text in lists for flag in text.split() if flag.startswith("-W")}
    flags = set(platform.module("apktoolkit_defaults")["cflags"])
    compare("warnings", flags ^ PLATFORM_ONLY_FLAGS, warnings, problems)
    presets = json.loads((ROOT / "CMakePresets.json").read_text())["configurePresets"]
    base = next(preset for preset in presets if preset["name"] == "base")
    if base["cacheVariables"].get("CMAKE_COMPILE_WARNING_AS_ERROR") != "ON":
        problems.append("warnings are no errors in the developers' presets")


def hold_wraps(tests, problems):
    wrapped = {}
    for path in sorted((ROOT / "tests").glob("*/CMakeLists.txt")):
        for target, options in re.findall(r"target_link_options\((\w+) ([^)]*)\)",
                                          without_comments_of_cmake(path)):
            wrapped[target] = re.findall(r"--wrap=(\w+)", options)
    for module in tests.modules:
        if module["type"] != "cc_test":
            continue
        name = module["name"]
        with_phone = "tests/support/phone.cpp" in tests.sources(name)
        compare(f"what is wrapped for {name}",
                re.findall(r"--wrap=(\w+)", str(module.get("ldflags"))),
                wrapped.get("phone" if with_phone else name.replace("apktoolkit_", ""), []),
                problems)


def hold_words(platform, tests, problems):
    for module in platform.modules + tests.modules:
        words = {module["type"]} - KNOWN_TYPES
        words |= set(module) - {"type", "directory"} - KNOWN_PROPERTIES
        problems += [f"{module['name']}: Android 8.1 does not know {word}" for word in sorted(words)]
        if module.get("cpp_std", "c++1z") != "c++1z":
            problems.append(f"{module['name']}: Android 8.1 does not know {module['cpp_std']}")
    # Android 8.1 reads only the named blueprints. Later releases read all that they find.
    compare("blueprints below the first", platform.variables["subdirs"],
            [path.parent.name for path in ROOT.glob("*/Android.bp")], problems)


def cmake_sources(target, directory="."):
    path = ROOT / directory / "CMakeLists.txt"
    found = re.search(r"(?:add_library|add_executable|apktoolkit_add_test)\(%s\s+([^)]*)\)" % target,
                      without_comments_of_cmake(path))
    if not found:
        sys.exit(f"{path} has no target {target}")
    return sorted(str(pathlib.Path(directory, word)) for word in found[1].split()
                  if word.endswith(".cpp"))


def without_comments_of_cmake(path):
    return re.sub(r"#.*", "", path.read_text())


def compare(name, left, right, problems):
    for item in sorted(set(left) ^ set(right)):
        problems.append(f"{name}: {item} stands on one side only")


if __name__ == "__main__":
    sys.exit(main())
