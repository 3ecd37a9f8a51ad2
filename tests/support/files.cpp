#include "support/files.h"

#include <ftw.h>
#include <linux/memfd.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>

namespace {

[[noreturn]] void GiveUp(const std::string& what) {
  perror(what.c_str());
  abort();
}

// The directory for temporary files: TMPDIR if it is set, else /tmp if /tmp is writable, else
// /data/local/tmp, which phones have.
std::string TemporaryDirectory() {
  if (const char* const named = getenv("TMPDIR"); named != nullptr) return named;
  return access("/tmp", W_OK) == 0 ? "/tmp" : "/data/local/tmp";
}

int RemoveOne(const char* path, const struct stat*, int, FTW*) { return remove(path); }

}  // namespace

TempDir::TempDir(const std::string& parent) {
  const std::string place = parent.empty() ? TemporaryDirectory() : parent;
  char* const resolved = realpath(place.c_str(), nullptr);
  if (resolved == nullptr) GiveUp(place);
  path_ = resolved + std::string("/apktoolkit-XXXXXX");
  free(resolved);
  if (mkdtemp(path_.data()) == nullptr) GiveUp(path_);
}

TempDir::~TempDir() {
  constexpr int kOpenDirectories = 8;
  nftw(path_.c_str(), RemoveOne, kOpenDirectories, FTW_DEPTH | FTW_PHYS);
}

std::string TempDir::File(const std::string& name) const {
  const std::string path = *this / name;
  for (size_t end = path_.size(); (end = path.find('/', end + 1)) != std::string::npos;) {
    const std::string directory = path.substr(0, end);
    if (mkdir(directory.c_str(), 0777) != 0 && errno != EEXIST) GiveUp(directory);
  }
  return path;
}

std::string TempDir::Write(const std::string& name, const Bytes& content) const {
  const std::string path = File(name);
  WriteFile(path, content);
  return path;
}

std::string TempDir::WriteProgram(const std::string& name, const std::string& content) const {
  std::string path = Write(name, ToBytes(content));
  if (chmod(path.c_str(), 0755) != 0) GiveUp(path);
  return path;
}

void WriteFile(const std::string& path, const Bytes& content) {
  std::ofstream file(path, std::ios::binary);
  file.write(reinterpret_cast<const char*>(content.data()),
             static_cast<std::streamsize>(content.size()));
  if (!file.flush()) GiveUp(path);
}

std::string ContentOf(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

// Makes the system call directly, because the C library has memfd_create only from API level 30 on.
MemoryFile::MemoryFile(const Bytes& content, const std::string& name)
    : fd_(static_cast<int>(syscall(SYS_memfd_create, name.c_str(), MFD_CLOEXEC))),
      path_("/memfd:" + name + " (deleted)") {
  if (fd_ < 0 ||
      write(fd_, content.data(), content.size()) != static_cast<ssize_t>(content.size()) ||
      lseek(fd_, 0, SEEK_SET) != 0) {
    GiveUp("memfd");
  }
}

MemoryFile::~MemoryFile() { close(fd_); }

// Keeps the file of descriptor `fd` open under the number 100 + fd. dup() would choose the lowest
// unused number. Another FreeDescriptor may have closed this number, and it must stay unused.
FreeDescriptor::FreeDescriptor(int fd) : fd_(fd), kept_(dup2(fd, 100 + fd)) { close(fd); }

FreeDescriptor::~FreeDescriptor() {
  dup2(kept_, fd_);
  close(kept_);
}
