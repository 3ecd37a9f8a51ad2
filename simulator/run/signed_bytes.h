// The bytes of each file that the phone's kernel has signed so far. A file with the same bytes as a
// signed file is trusted, under any name.
//
// With a directory (--state), SHA-256 digests are remembered across runs. Each digest is the name
// of a file in the directory. That file contains the path of the signed file, for human readers.
// Without a directory, signed files are remembered as long as this object lives. They are digested
// only if a file of the same length is looked up.
#pragma once

#include <sys/stat.h>

#include <set>
#include <string>
#include <vector>

#include "simulator/run/process.h"

namespace simulator {

class SignedBytes {
 public:
  // Load() creates `directory` if it does not exist. If `directory` is empty, nothing is kept after
  // this object is destroyed. If `shares` is false, added files are not trusted in this run, so
  // that the order of the run's files does not matter. If `shares` is false, several threads may
  // use the object after Load().
  SignedBytes(std::string directory, bool shares)
      : directory_(std::move(directory)), shares_(shares) {}

  // Reads the digests in the directory. Returns false if the directory cannot be used.
  bool Load();

  // True if the file at `path` has bytes that were signed. False for a file that is not regular.
  // Also false if the file must be digested, but cannot be read before the deadline. Without a
  // directory, a signed file is digested later, and only if its state (IsSameFile in util/file.h)
  // has not changed since Add(). If the state has changed, the signed bytes are not known, and the
  // result is false for another file with these bytes.
  bool Holds(const std::string& path, const Deadline& deadline);

  // Remembers the present bytes of the file at `path`. With a directory, returns false if the
  // deadline passes before an existing file is digested, or if the digest cannot be written. In all
  // other cases, returns true, also if the file is gone or cannot be read.
  bool Add(const std::string& path, const Deadline& deadline);

 private:
  // A signed file, and its state when it was added. The file is digested only when a lookup needs
  // the digest, and only if the file's state is then still the same.
  struct Seen {
    std::string path;
    struct stat state;
    std::string digest;
  };
  bool IsSame(Seen* seen, const std::string& path, const struct stat& state,
              const Deadline& deadline);

  const std::string directory_;
  const bool shares_;
  std::set<std::string> digests_;  // lower-case hexadecimal
  std::vector<Seen> seen_;
};

}  // namespace simulator
