#!/usr/bin/env python3
"""Compares the file lists of the platform's build with those of CMake. With --write, corrects the
platform's lists. Also compares other parts of the two builds: the warnings, and the functions that
the linker wraps for a test. Also checks that Android 8.1 knows every type of module and every
property in Android.bp and tests/Android.bp."""

import json
import pathlib
import re
import sys

from blueprint import Blueprint
from sources import ROOMS, ROOT, report, tool_sources

# Sources that only the workstation's build has, each with the reason.
WORKSTATION_ONLY = {
    "tests/apk/manifest_mf_test.cpp": "runs the JDK",
    "tests/crypto/mpi_mod_mpi_test.cpp": "compares with GMP",
    "tests/crypto/mpi_pow_mod_test.cpp": "compares with GMP",
    "tests/crypto/mpi_test.cpp": "compares with GMP",
    "tests/crypto/pkcs7_signer_test.cpp": "runs openssl",
    "tests/crypto/rsa_set_key_test.cpp": "signs with GMP",
    "tests/crypto/rsa_test.cpp": "compares with GMP",
    "tests/crypto/x509_authorities_test.cpp": "runs openssl",
    "tests/util/digest_test.cpp": "runs openssl",
    "tests/verify/error_name_test.cpp": "compares with the workstation's C library",
    "fuzz/compiled_manifest_fuzz.cpp": "replaces the program's operator new",
    "fuzz/explanation_fuzz.cpp": "reads with the simulator",
    "fuzz/integrity_fuzz.cpp": "has the linker wrap calls of the C library",
    "fuzz/journal_fuzz.cpp": "reads with the simulator",
    "fuzz/mpi_fuzz.cpp": "compares with GMP",
    "fuzz/package_fuzz.cpp": "has the linker wrap a call of the zip library",
    "fuzz/verdict_fuzz.cpp": "judges with the simulator",
}

# The types and properties of modules that the build of Android 8.1 knows. An unknown type or
# property stops the build of the whole platform.
KNOWN_TYPES = {"cc_binary", "cc_defaults", "cc_library_shared", "cc_library_static", "cc_test",
               "filegroup"}
KNOWN_PROPERTIES = {"cflags", "compile_multilib", "cpp_std", "data", "defaults",
                    "export_include_dirs", "init_rc", "ldflags", "local_include_dirs", "name", "shared_libs",
                    "srcs", "static_libs"}

# -Wno-sign-conversion is for headers that are system headers in CMake's build but not in the
# platform's. In CMake's build, a variable in the presets takes the place of -Werror.
PLATFORM_ONLY_FLAGS = {"-Wno-sign-conversion", "-Werror"}


# A blueprint is a file Android.bp or cc_fuzz.bp. For each blueprint: the modules whose sources come
# from targets of CMake, with these targets. A target is DIRECTORY:NAME, or NAME for a target in the
# root. In a blueprint, paths are relative to the blueprint's directory.
MODULES = {
    "Android.bp": {"apktoolkit_core": ["apktoolkit_core"], "apktoolkit": ["apktoolkit"],
                   "apktoolkit-verify": ["apktoolkit-verify"],
                   "apktoolkit_verification": ["apktoolkit_verification"], "libzu": ["zu"],
                   "apktoolkit-all": ["integration:apktoolkit-all", "integration:apktoolkit_caller"],
                   "apktoolkit-bound": ["integration:apktoolkit-bound"]},
    "tests/Android.bp": {"apktoolkit_test_support": ["tests/support:test_support"],
                         **{f"apktoolkit_{room}_test": [f"tests/{room}:{room}_test"]
                            for room in ROOMS if room != "verify"}},
    "fuzz/cc_fuzz.bp": {"apktoolkit_fuzz_support": ["fuzz:fuzz_support"]},
}
# More sources of a module. CMake has them in separate libraries.
MORE = {"apktoolkit_sign_test": ["tests/support/phone.cpp"]}

FIX = f"the lists and tables at the head of {__file__}, or the file that the printed problem names"


def main():
    problems = []
    pages = {ROOT / name: with_sources(name, modules) for name, modules in MODULES.items()}
    platform, tests, fuzz = (Blueprint(path) for path in pages)
    compare("CMakeLists.txt and the tool's directories", map(str, tool_sources()),
            sum(map(cmake_sources, ("apktoolkit_core", "apktoolkit", "apktoolkit-verify", "zu")), []), problems)
    there = {str(path.relative_to(ROOT)) for path in ROOT.glob("fuzz/*_fuzz.cpp")}
    compare("the sources on disk, and those in WORKSTATION_ONLY and fuzz/cc_fuzz.bp",
            {*WORKSTATION_ONLY, *fuzz.all_sources("cc_fuzz")},
            {"fuzz/quiet_log.cpp", *there, *(path for path in WORKSTATION_ONLY if (ROOT / path).exists())}, problems)
    hold_flags(platform, problems)
    hold_wraps(tests, problems)
    hold_words(platform, tests, problems)
    return report(problems, FIX, pages)


def with_sources(name, modules):
    """The blueprint's text, with the correct sources of these modules."""
    path = ROOT / name
    text = path.read_text()
    for module, targets in modules.items():
        wanted = sum(map(cmake_sources, targets), MORE.get(module, []))
        wanted = sorted(str((ROOT / source).relative_to(path.parent)) for source in wanted
                        if source not in WORKSTATION_ONLY)
        lines = "".join(f'        "{source}",\n' for source in wanted)
        srcs = f"[\n{lines}    ]" if len(wanted) > 1 else f'["{wanted[0]}"]'
        text, count = re.subn(rf'(name: "{module}",(?:(?!\n}}).)*?srcs: )\[[^]]*\]', rf"\g<1>{srcs}", text,
                              flags=re.S)
        if count != 1:
            sys.exit(f"{path} has no module {module} with srcs: add the module, with the line `srcs: [],`")
    return text


def hold_flags(platform, problems):
    settings = without_comments_of_cmake(ROOT / "cmake/CompilerSettings.cmake")
    lists = re.findall(r"(?:add_compile_options|set)\((?:APKTOOLKIT_TOOL_OPTIONS )?(-[^)]*)\)", settings)
    warnings = {flag for text in lists for flag in text.split() if flag.startswith("-W")}
    flags = set(platform.module("apktoolkit_defaults")["cflags"])
    compare("the warnings in Android.bp and in cmake/CompilerSettings.cmake",
            flags ^ PLATFORM_ONLY_FLAGS, warnings, problems)
    presets = json.loads((ROOT / "CMakePresets.json").read_text())["configurePresets"]
    base = next(preset for preset in presets if preset["name"] == "base")
    if base["cacheVariables"].get("CMAKE_COMPILE_WARNING_AS_ERROR") != "ON":
        problems.append("the preset base does not set CMAKE_COMPILE_WARNING_AS_ERROR to ON")


def hold_wraps(tests, problems):
    wrapped = {}
    for path in sorted((ROOT / "tests").glob("*/CMakeLists.txt")):
        for target, options in re.findall(r"target_link_options\((\w+) ([^)]*)\)", without_comments_of_cmake(path)):
            wrapped[target] = re.findall(r"--wrap=(\w+)", options)
    for module in (module for module in tests.modules if module["type"] == "cc_test"):
        name = module["name"]
        target = "phone" if name in MORE else name.replace("apktoolkit_", "")
        compare(f"the functions wrapped for {name} in tests/Android.bp and in CMake's build",
                re.findall(r"--wrap=(\w+)", str(module.get("ldflags"))), wrapped.get(target, []), problems)


def hold_words(platform, tests, problems):
    for module in platform.modules + tests.modules:
        words = {module["type"]} - KNOWN_TYPES
        words |= set(module) - {"type", "directory"} - KNOWN_PROPERTIES
        problems += [f"{module['name']}: Android 8.1 does not know {word}" for word in sorted(words)]
        if module.get("cpp_std", "c++1z") != "c++1z":
            problems.append(f"{module['name']}: Android 8.1 does not know {module['cpp_std']}")
    # Android 8.1 reads only the blueprints of the directories in `subdirs`. Later releases read all
    # blueprints that they find.
    compare("subdirs in Android.bp, and the directories with an Android.bp", platform.variables["subdirs"],
            [path.parent.name for path in ROOT.glob("*/Android.bp")], problems)


def cmake_sources(target):
    """The sources of a target. `target` is DIRECTORY:NAME, or NAME for a target in the root."""
    directory, _, name = target.rpartition(":")
    path = ROOT / directory / "CMakeLists.txt"
    found = re.search(rf"(?:add_library|add_executable|apktoolkit_add_test)\({name}\s+([^)]*)\)",
                      without_comments_of_cmake(path))
    if not found:
        sys.exit(f"{path} has no target {name}")
    return sorted(str(pathlib.Path(directory, word)) for word in found[1].split() if word.endswith(".cpp"))


def without_comments_of_cmake(path):
    return re.sub(r"#.*", "", path.read_text())


def compare(name, left, right, problems):
    for item in sorted(set(left) ^ set(right)):
        problems.append(f"{name}: only one of the two has {item}")


if __name__ == "__main__":
    sys.exit(main())
