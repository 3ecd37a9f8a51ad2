// An output file that the command line names: the journal, the page, or a report for another
// program. An existing regular file is replaced only if it is empty, or if it begins with the first
// bytes of the new file's kind (OutputKind::start).
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "util/scoped_fd.h"

namespace simulator {

struct OutputKind {
  const char* option;      // the option with the file's name
  const char* name;        // such as "journal"
  std::string_view start;  // the first bytes of each file of this kind
};

class OutputFile {
 public:
  // If `path` is empty, no file is wanted: Open and Append succeed and do nothing.
  OutputFile(const OutputKind& kind, std::string path) : kind_(kind), path_(std::move(path)) {}

  bool IsWanted() const { return !path_.empty(); }
  const char* option() const { return kind_.option; }

  // Returns a reason not to replace an existing regular file: it is one of `inputs`, it is the file
  // that standard output or standard error goes to, or it is neither empty nor of this kind.
  // Returns nothing otherwise.
  std::optional<std::string> Objection(const std::vector<std::string>& inputs) const;
  // True if this file and `other` are the same file, even under two names. False for devices and
  // pipes.
  bool IsSameAs(const OutputFile& other) const;

  // Opens and empties the file, or creates it. Returns false, with errno set, if the file
  // cannot be written.
  bool Open();
  bool IsOpen() const { return file_ && file_->get() >= 0; }
  void Close() { file_.reset(); }
  // Appends `text`. Returns false, with errno set, if it cannot be written.
  bool Append(std::string_view text) const;
  // The message for the user after a failure of Open or Append. Call ErrorText directly after the
  // failure, because it uses errno.
  std::string ErrorText() const;

 private:
  const OutputKind kind_;
  const std::string path_;
  std::optional<ScopedFd> file_;
};

}  // namespace simulator
