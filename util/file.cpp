#include "util/file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

#include "util/log.h"
#include "util/memory.h"
#include "util/scoped_fd.h"

namespace {

constexpr ssize_t kUnknownSize = -1;

ssize_t FindSize(int fd, FileIdentity* identity);
void ReadBytes(int fd, std::vector<uint8_t>& out);

}  // namespace

bool IdentifyFile(int fd, FileIdentity* identity) {
  struct stat status;
  if (fstat(fd, &status) != 0 || !S_ISREG(status.st_mode)) return false;
  *identity = {status.st_dev, status.st_ino, status.st_size, status.st_mtim, status.st_ctim};
  return true;
}

bool operator==(const FileIdentity& a, const FileIdentity& b) {
  const auto same = [](const timespec& s, const timespec& t) {
    return s.tv_sec == t.tv_sec && s.tv_nsec == t.tv_nsec;
  };
  return a.device == b.device && a.inode == b.inode && a.size == b.size &&
         same(a.modified, b.modified) && same(a.changed, b.changed);
}

bool ReadFile(const std::string& path, std::vector<uint8_t>& out, FileIdentity* identity) {
  const ScopedFd fd(open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
  if (fd.get() < 0) {
    LogError("Can't open file: %s\n", path.c_str());
    return false;
  }
  FileIdentity found;
  const ssize_t size = FindSize(fd.get(), &found);
  if (size < 0) {
    LogError("Can't read file: %s (streamoff=%zd)\n", path.c_str(), size);
    return false;
  }
  out.reserve(static_cast<size_t>(size));
  out.resize(static_cast<size_t>(size));
  // Deliberate: a file that shrinks meanwhile is no failure. It leaves the end of `out` as it is,
  // whose digest, which every caller takes, then is not the expected one.
  ReadBytes(fd.get(), out);
  if (identity != nullptr) *identity = found;
  return true;
}

std::string GetFilenameByFd(int fd) {
  const std::string link = "/proc/self/fd/" + std::to_string(fd);
  char path[4096] = {};
  if (readlink(link.c_str(), path, sizeof(path) - 1) == -1) return std::string();
  return path;
}

std::vector<uint8_t> StringToVector(const std::string& s) { return {s.begin(), s.end()}; }

namespace {

// The size in bytes of the regular file `fd`, whose position is then its start again; its identity
// as it was before.
ssize_t FindSize(int fd, FileIdentity* identity) {
  if (!IdentifyFile(fd, identity)) return kUnknownSize;
  const off_t size = lseek(fd, 0, SEEK_END);
  if (size < 0 || !FitsInMemory(static_cast<size_t>(size))) return kUnknownSize;
  return lseek(fd, 0, SEEK_SET) == 0 ? size : kUnknownSize;
}

// Fills `out` from `fd`, as far as there is something to read.
void ReadBytes(int fd, std::vector<uint8_t>& out) {
  size_t done = 0;
  while (done < out.size()) {
    const ssize_t count = read(fd, out.data() + done, out.size() - done);
    if (count == -1 && errno == EINTR) continue;
    if (count <= 0) break;
    done += static_cast<size_t>(count);
  }
}

}  // namespace
