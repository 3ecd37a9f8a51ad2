#!/usr/bin/env python3
"""Reads Android.bp files: their modules, and how a platform's build compiles each source.

blueprint.py FILE... prints the module, the path and the compiler's flags of every .cpp source in these files.
"""

import re
import sys

from sources import ROOT, without_comments

TOKEN = re.compile(r'"((?:[^"\\]|\\.)*)"|([A-Za-z_]\w*|\d+)|([{}\[\]:,=+])|(\S)')

# The C++ standard of Android 8.1 for a module without cpp_std.
DEFAULT_STANDARD = "gnu++14"


class Blueprint:
    """The modules and variables of a file. A module is a dictionary of its properties. Blueprint adds
    the key "type" for the module's type, and the key "directory" for the file's directory."""

    def __init__(self, path):
        self.path = path
        self.directory = path.parent.relative_to(ROOT)
        self.tokens = [(m[1], m[2] or m[3] or m[4])
                       for m in TOKEN.finditer(without_comments(path.read_text()))]
        self.modules = []
        self.variables = {}
        while self.tokens:
            name = self.word()
            if self.tokens[0][1] == "=":
                self.word("=")
                self.variables[name] = self.value()
            else:
                self.modules.append({"type": name, "directory": self.directory, **self.value()})

    def word(self, expected=None):
        text, word = self.tokens.pop(0)
        if text is not None or (expected and word != expected):
            sys.exit(f"{self.path}: found {text or word!r} where {expected or 'a word'} should be")
        return word

    def value(self):
        text, word = self.tokens.pop(0)
        if text is not None:
            return re.sub(r"\\(.)", r"\1", text)
        if word == "[":
            return list(self.items("]", self.value))
        if word == "{":
            return dict(self.items("}", self.property))
        return {"true": True, "false": False}.get(word, word)

    def property(self):
        key = self.word()
        self.word(":")
        return key, self.value()

    def items(self, end, read):
        while self.tokens[0][1] != end:
            yield read()
            if self.tokens[0][1] != end:
                self.word(",")
        self.word(end)

    def module(self, name):
        found = [m for m in self.modules if m.get("name") == name]
        if len(found) != 1:
            sys.exit(f"{self.path}: {len(found)} modules are named {name}")
        return found[0]

    def all_sources(self, kind):
        return [source for module in self.modules if module["type"] == kind
                for source in sources(module)]


def sources(module):
    """The module's .cpp files, relative to the root."""
    return [str(module["directory"] / source) for source in module.get("srcs", [])
            if source.endswith(".cpp")]


class Tree:
    """The modules of several files. A module can name other modules in "defaults" and "static_libs"."""

    def __init__(self, paths):
        self.modules = [module for path in paths for module in Blueprint(path).modules]

    def flags(self, module):
        """The compiler flags that the module's properties set for each of its sources."""
        module = self.with_defaults(module)
        directories = self.include_directories(module)
        return [f"-std={module.get('cpp_std', DEFAULT_STANDARD)}", *module.get("cflags", []),
                *(f"-I{directory}" for directory in directories)]

    def with_defaults(self, module):
        """The module, merged with the modules in its "defaults". A list of the module is appended
        to the defaults' lists of the same name. Any other property of the module replaces the
        defaults' property of the same name."""
        merged = {}
        for part in [*map(self.with_defaults, self.named(module.get("defaults", []))), module]:
            for key, value in part.items():
                merged[key] = merged.get(key, []) + value if isinstance(value, list) else value
        return merged

    def include_directories(self, module):
        """The module's own include directories, and those that its static libraries export."""
        own = [module["directory"] / name for key in ("local_include_dirs", "export_include_dirs")
               for name in module.get(key, [])]
        return own + [library["directory"] / name
                      for library in self.named(module.get("static_libs", []))
                      for name in library.get("export_include_dirs", [])]

    def named(self, names):
        """The modules of this tree that have these names. A name that no module of this tree has,
        for example the name of a platform's module, is skipped."""
        return [module for name in names for module in self.modules if module["name"] == name]


def main():
    tree = Tree([ROOT / path for path in sys.argv[1:]])
    for module in tree.modules:
        for source in sources(module):
            print(module["name"], source, *tree.flags(module))


if __name__ == "__main__":
    main()
