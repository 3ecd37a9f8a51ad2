// What the phone's kernel has signed so far. A file stays trusted while it has the bytes that were
// signed, and no longer, so what is remembered are their SHA-256 digests: as long as this object
// lives, and across runs when a directory is given. There, each digest is a file of that name,
// which holds the path of what was signed, for the reader.
#pragma once

#include <set>
#include <string>

class SignedBytes {
 public:
  // `directory` is made when it is not there; empty: nothing is kept.
  explicit SignedBytes(std::string directory) : directory_(std::move(directory)) {}

  // Reads what the directory holds. False when it cannot be used.
  bool Load();

  // Whether the file at `path` has bytes that were signed.
  bool Holds(const std::string& path) const;

  // Remembers the present bytes of the file at `path`. False when the directory cannot keep them.
  bool Add(const std::string& path);

 private:
  const std::string directory_;
  std::set<std::string> digests_;  // lower-case hexadecimal
};
