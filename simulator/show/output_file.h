// A file that the command line names to be written: the journal, the page, or a report for another
// program. Nothing but an earlier one of the same kind is ever replaced by it.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "util/scoped_fd.h"

namespace simulator {

struct OutputKind {
  const char* option;      // that names the file
  const char* name;        // such as "journal"
  std::string_view start;  // what each file of the kind begins with
};

class OutputFile {
 public:
  // `path` may be empty: then nothing is wanted, and all that is below succeeds and does nothing.
  OutputFile(const OutputKind& kind, std::string path) : kind_(kind), path_(std::move(path)) {}

  bool IsWanted() const { return !path_.empty(); }
  const char* option() const { return kind_.option; }

  // Why the file must not be written to: it holds something else, or is one of `inputs`. None when
  // it may.
  std::optional<std::string> Objection(const std::vector<std::string>& inputs) const;
  // Whether this file and `other` are one, be it under two names. Devices and pipes never are.
  bool IsSameAs(const OutputFile& other) const;

  // Begins the file anew. False, with errno set, when it cannot be written.
  bool Open();
  // The same for what comes next in it.
  bool Append(std::string_view text) const;
  // The message for the user after a failure.
  std::string ErrorText() const;

 private:
  const OutputKind kind_;
  const std::string path_;
  std::optional<ScopedFd> file_;
};

}  // namespace simulator
