// Directories and files for one test, on disk and in memory. Each TempDir, DiskFile and MemoryFile
// removes its directory or file when it is destroyed. If a directory or file cannot be made, the
// program aborts.
#pragma once

#include <string>

#include "support/bytes.h"

// A new empty directory.
class TempDir {
 public:
  // Makes the directory below `parent`, or below the directory for temporary files if `parent` is
  // empty.
  explicit TempDir(const std::string& parent = {});
  ~TempDir();
  TempDir(const TempDir&) = delete;
  TempDir& operator=(const TempDir&) = delete;

  // The resolved path, without a "/" at the end.
  const std::string& path() const { return path_; }
  // The path of `name` in the directory.
  std::string operator/(const std::string& name) const { return path_ + "/" + name; }
  // Like operator/, and also makes the directories above `name`.
  std::string File(const std::string& name) const;
  // Writes a file, and makes the directories above it. Returns its path.
  std::string Write(const std::string& name, const Bytes& content) const;
  // Writes a file that everyone may execute, for example a script. Returns its path.
  std::string WriteProgram(const std::string& name, const std::string& content) const;

 private:
  std::string path_;
};

void WriteFile(const std::string& path, const Bytes& content);

// The file's content; empty if it cannot be read.
std::string ContentOf(const std::string& path);

// A file on disk, in a directory of its own.
class DiskFile {
 public:
  explicit DiskFile(const Bytes& content) : path_(directory_.Write("file", content)) {}
  const std::string& path() const { return path_; }

 private:
  TempDir directory_;
  std::string path_;
};

// A file in memory, which has no name on disk.
class MemoryFile {
 public:
  explicit MemoryFile(const Bytes& content, const std::string& name = "test");
  ~MemoryFile();
  MemoryFile(const MemoryFile&) = delete;
  MemoryFile& operator=(const MemoryFile&) = delete;

  int fd() const { return fd_; }
  // The path that the kernel reports for the descriptor: "/memfd:NAME (deleted)".
  std::string path() const { return path_; }

 private:
  int fd_;
  std::string path_;
};

// Closes `fd`, so that tested code can get this number for its own file. The destructor makes `fd`
// refer to its former file again.
class FreeDescriptor {
 public:
  explicit FreeDescriptor(int fd);
  ~FreeDescriptor();
  FreeDescriptor(const FreeDescriptor&) = delete;
  FreeDescriptor& operator=(const FreeDescriptor&) = delete;

 private:
  const int fd_;
  const int kept_;
};
