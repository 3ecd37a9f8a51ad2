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

ssize_t FindSize(int fd, struct stat* state);
void ReadBytes(int fd, std::vector<uint8_t>& out);

}  // namespace

bool IsSameFile(const struct stat& before, const struct stat& after) {
  const auto same = [](const timespec& a, const timespec& b) {
    return a.tv_sec == b.tv_sec && a.tv_nsec == b.tv_nsec;
  };
  return S_ISREG(before.st_mode) && S_ISREG(after.st_mode) && before.st_dev == after.st_dev &&
         before.st_ino == after.st_ino && before.st_size == after.st_size &&
         same(before.st_mtim, after.st_mtim) && same(before.st_ctim, after.st_ctim);
}

bool ReadFile(const std::string& path, std::vector<uint8_t>& out, struct stat* state) {
  const ScopedFd fd(open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
  if (fd.get() < 0) {
    LogError("Can't open file: %s\n", path.c_str());
    return false;
  }
  struct stat found;
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
  if (state != nullptr) *state = found;
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

// The size in bytes of the regular file `fd`, whose position is then its start again, and its state
// before.
ssize_t FindSize(int fd, struct stat* state) {
  if (fstat(fd, state) != 0 || !S_ISREG(state->st_mode)) return kUnknownSize;
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
