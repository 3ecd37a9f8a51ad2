// The bytes that the phone's kernel has signed so far. A file is trusted, under any name, as long
// as it has bytes that were signed.
//
// With a directory, SHA-256 digests are remembered across runs. Each is the name of a file in the
// directory, which holds the path of the signed file, for the reader. Without one, files are
// remembered as long as this object lives, and digested only when another is as long as they are.
#pragma once

#include <sys/stat.h>

#include <set>
#include <string>
#include <vector>

#include "simulator/run/process.h"

namespace simulator {

class SignedBytes {
 public:
  // `directory` is made when it is not there; empty: nothing is kept beyond this object. Where
  // `shares` is false, what is added is kept for later runs alone, so that the order of the files
  // of this run does not matter; then it may be used from several threads.
  SignedBytes(std::string directory, bool shares)
      : directory_(std::move(directory)), shares_(shares) {}

  // Reads what the directory holds. False when it cannot be used.
  bool Load();

  // Whether the file at `path` has bytes that were signed. Other than regular files are never
  // trusted, and neither is one that took longer to read than there is time.
  bool Holds(const std::string& path, const Deadline& deadline);

  // Remembers the present bytes of the file at `path`. False when they cannot be kept.
  bool Add(const std::string& path, const Deadline& deadline);

 private:
  // A file as it was when it was signed; it is digested when that is needed, if it is still so.
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
