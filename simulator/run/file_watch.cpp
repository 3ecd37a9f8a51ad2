#include "simulator/run/file_watch.h"

#include <fcntl.h>

#include "simulator/run/process.h"
#include "util/file.h"

namespace simulator {

FileWatch::FileWatch(const std::string& path) : path_(path) {
  if (stat(path.c_str(), &before_) != 0) before_ = {};
}

void FileWatch::Check(FileRun* run) const {
  Failure& failure = run->record.failure;
  if (failure.kind != Failure::Kind::kNone || !S_ISREG(before_.st_mode)) return;
  if (WasChanged(run->facts.sha256)) failure = {Failure::Kind::kChanged, ""};
}

bool FileWatch::WasChanged(const std::string& sha256) const {
  struct stat after = {};
  if (stat(path_.c_str(), &after) != 0) return true;
  if (IsSameFile(before_, after)) return false;
  after.st_ctim = before_.st_ctim;
  if (!IsSameFile(before_, after) || sha256.empty()) return true;
  const ScopedFd file(open(path_.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  return FileSha256(file.get(), IsInterrupted) != sha256;
}

}  // namespace simulator
