// Detects that a file is changed while it is examined. The tool, the simulator and the installer's
// verifier read the file separately. If the file changes meanwhile, their answers can be about
// different bytes.
#pragma once

#include <sys/stat.h>

#include <string>

#include "simulator/run/simulator.h"

namespace simulator {

class FileWatch {
 public:
  // Remembers the state of the file at `path`. Construct the object before anything reads the file.
  explicit FileWatch(const std::string& path);

  // Call this function when nothing reads the file any more. If the file was changed since the
  // construction, the run gets a failure in place of its result. A change of only the ctime, such
  // as by chmod or a new hard link, does not count if the bytes still have the digest in
  // `run->facts`. Does nothing if `path` was not a regular file, or if the run already has a
  // failure.
  void Check(FileRun* run) const;

 private:
  bool WasChanged(const std::string& sha256) const;

  const std::string path_;
  struct stat before_ = {};
};

}  // namespace simulator
