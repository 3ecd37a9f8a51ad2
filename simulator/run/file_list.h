// The files for which the tool is run. Each file is named on the command line or in a list, or was
// found below a named directory. All files are listed before the first run.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

namespace simulator {

struct FileListOptions {
  std::vector<std::string> names;  // from the command line
  std::string list;                // a file with more names, "-": standard input; empty: none
  bool has_nul = false;            // names in the list end with NUL bytes, else with line feeds
  bool is_recursive = false;       // directories are replaced by the packages below them
};

struct ListedFile {
  enum class State {
    kToRun,            // the tool is run for it
    kUnreadable,       // a directory to search, or an entry in it, cannot be read: see `error`
    kWithoutPackages,  // a searched directory with no package in it or below it
  };

  std::string name;
  State state = State::kToRun;
  int error = 0;  // errno
};

struct FileList {
  std::vector<ListedFile> files;
  size_t others = 0;  // how many files below directories were skipped: they have no package names
};

// Fills `list` with the names from `options.names` and then the names in the file `options.list`,
// without sorting them. With `is_recursive`, a directory is replaced by the files below it that
// have package names (IsPackageName), sorted by their paths, byte by byte. A symbolic link to a
// directory is then followed if the link was named, but is skipped if it was found below a
// directory. Empty names in `options.list` are skipped.
//
// Returns none on success, else the reason of the failure: `options.list` cannot be read, has no
// names, or has NUL bytes although `has_nul` is false.
std::optional<std::string> ListFiles(const FileListOptions& options, FileList* list);

}  // namespace simulator
