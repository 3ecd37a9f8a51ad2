// The file of `--journal`. Nothing but an earlier journal is ever replaced by it.
#pragma once

#include <optional>
#include <string>
#include <vector>

class JournalFile {
 public:
  JournalFile() = default;
  ~JournalFile();
  JournalFile(const JournalFile&) = delete;
  JournalFile& operator=(const JournalFile&) = delete;

  // Why the file at `path` must not be written to: it holds something else than a journal, or is
  // one of `inputs`. None when it may.
  static std::optional<std::string> Objection(const std::string& path,
                                              const std::vector<std::string>& inputs);

  // Begins the file anew. False, with errno set, when it cannot be written.
  bool Open(const std::string& path);
  bool Append(const std::string& lines) const;

 private:
  int fd_ = -1;
};
