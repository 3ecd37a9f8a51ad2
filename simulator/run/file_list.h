// The files that the tool is run for: named on the command line or in a list, or found below a
// directory. Everything is listed before the first run.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

namespace simulator {

struct FileListOptions {
  std::vector<std::string> names;  // of the command line
  std::string list;                // a file with more names, "-": standard input; empty: none
  bool has_nul = false;            // a name of the list ends with a NUL byte, else with its line
  bool is_recursive = false;       // a directory stands for the packages below it
};

struct ListedFile {
  enum class State {
    kToRun,            // the tool is run for it
    kUnreadable,       // a directory that is walked, and cannot be read to its end: `error`
    kWithoutPackages,  // a directory that is walked, with no package in it or below it
  };

  std::string name;
  State state = State::kToRun;
  int error = 0;  // errno
};

struct FileList {
  std::vector<ListedFile> files;
  size_t others = 0;  // files below the walked directories that have no package's name
};

// Lists the files of the command line and then those of the list, in their order. With
// `is_recursive` a directory stands for the files below it whose names are a package's
// (IsPackageName), sorted by their paths, byte by byte. Symbolic links to directories are followed
// if they are named, and not if they are met on the walk. Empty names of a list do not count.
// None when that is done; else why it cannot be: the list cannot be read, names nothing, or has NUL
// bytes where its names end with a line.
std::optional<std::string> ListFiles(const FileListOptions& options, FileList* list);

}  // namespace simulator
