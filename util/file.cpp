#include "util/file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

#include "util/log.h"
#include "util/memory.h"

namespace {

constexpr ssize_t kUnknownSize = -1;

class ScopedFd {
 public:
  explicit ScopedFd(int fd) : fd_(fd) {}
  ~ScopedFd() {
    if (fd_ != -1) close(fd_);
  }
  ScopedFd(const ScopedFd&) = delete;
  ScopedFd& operator=(const ScopedFd&) = delete;
  int get() const { return fd_; }

 private:
  const int fd_;
};

ssize_t FindSize(int fd);
void ReadBytes(int fd, std::vector<uint8_t>& out);

}  // namespace

bool ReadFile(const std::string& path, std::vector<uint8_t>& out) {
  // O_NONBLOCK: the open of a FIFO would wait for a writer; a regular file does not know the flag.
  const ScopedFd fd(open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
  if (fd.get() == -1) {
    LogError("Can't open file: %s\n", path.c_str());
    return false;
  }
  const ssize_t size = FindSize(fd.get());
  if (size < 0) {
    LogError("Can't read file: %s (streamoff=%zd)\n", path.c_str(), size);
    return false;
  }
  out.reserve(static_cast<size_t>(size));
  out.resize(static_cast<size_t>(size));
  // Deliberate: how much could be read is not asked. A file that shrinks meanwhile leaves the end
  // of `out` as it is; its digest, which every caller takes, then is not the expected one.
  ReadBytes(fd.get(), out);
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

// The size in bytes of the regular file `fd`, whose position is then its start again.
ssize_t FindSize(int fd) {
  struct stat status;
  if (fstat(fd, &status) != 0 || !S_ISREG(status.st_mode)) return kUnknownSize;
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
