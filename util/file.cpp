#include "util/file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "util/log.h"
#include "util/memory.h"
#include "util/scoped_fd.h"

namespace {

// The path of the link in /proc to the file that is open as `fd`. This link leads to the file even
// after the file was renamed or removed.
std::string DescriptorLink(int fd) { return "/proc/self/fd/" + std::to_string(fd); }

ssize_t FindSize(int fd, struct stat* state);
void ReadBytes(int fd, std::vector<uint8_t>& out);

}  // namespace

bool IsSameFile(const struct stat& before, const struct stat& after) {
  return S_ISREG(before.st_mode) && S_ISREG(after.st_mode) && before.st_dev == after.st_dev &&
         before.st_ino == after.st_ino && before.st_size == after.st_size &&
         memcmp(&before.st_mtim, &after.st_mtim, sizeof(after.st_mtim)) == 0 &&
         memcmp(&before.st_ctim, &after.st_ctim, sizeof(after.st_ctim)) == 0;
}

int OpenForReading(const char* path, int flags) {
  const int fd = open(path, O_RDONLY | O_NONBLOCK | flags);
  if (fd >= 0 || errno != EWOULDBLOCK) return fd;
  // A process holds a lease on the file. An open without O_NONBLOCK waits until the lease ends. But
  // if a FIFO was put at the path meanwhile, this open would wait for a writer. OpenForReading
  // therefore first opens the path with O_PATH, which does not wait. If the O_PATH descriptor
  // refers to a regular file, OpenForReading opens this file for reading through the descriptor.
  const ScopedFd pinned(open(path, O_PATH | O_CLOEXEC));
  struct stat state = {};
  if (pinned.get() < 0 || fstat(pinned.get(), &state) != 0 || !S_ISREG(state.st_mode)) return -1;
  return open(DescriptorLink(pinned.get()).c_str(), O_RDONLY | flags);
}

bool ReadFile(const std::string& path, std::vector<uint8_t>& out, struct stat* state, int fd) {
  const ScopedFd opened(fd == -1 ? OpenForReading(path.c_str(), O_CLOEXEC) : -1);
  if (fd == -1) fd = opened.get();
  if (fd < 0) {
    LogError("Can't open file: %s\n", path.c_str());
    return false;
  }
  struct stat found;
  const ssize_t size = FindSize(fd, &found);
  if (size < 0) {
    LogError("Can't read file: %s (streamoff=%zd)\n", path.c_str(), size);
    return false;
  }
  if (out.empty() && out.capacity() < static_cast<size_t>(size)) std::vector<uint8_t>().swap(out);
  out.resize(static_cast<size_t>(size));
  // Deliberate: reading succeeds even if the file shrinks meanwhile. The end of `out` then keeps
  // its old bytes, or is 0. These can be the same bytes as those that the file lost, and the digest
  // of `out` is then right. SignLibrary (sign/signing.cpp) therefore also compares `state` with the
  // file's later state.
  ReadBytes(fd, out);
  if (state != nullptr) *state = found;
  return true;
}

std::string GetFilenameByFd(int fd) {
  char path[4096] = {};
  if (readlink(DescriptorLink(fd).c_str(), path, sizeof(path) - 1) == -1) return std::string();
  return path;
}

std::vector<uint8_t> StringToVector(const std::string& s) { return {s.begin(), s.end()}; }

namespace {

// Returns the size in bytes of the file that is open as `fd`. Stores the file's state in `state`,
// and sets the position of `fd` to the start. Returns -1 if the file is not regular, cannot seek,
// or does not fit in memory.
ssize_t FindSize(int fd, struct stat* state) {
  if (fstat(fd, state) != 0 || !S_ISREG(state->st_mode)) return -1;
  const off_t size = lseek(fd, 0, SEEK_END);
  if (size < 0 || !FitsInMemory(static_cast<size_t>(size))) return -1;
  return lseek(fd, 0, SEEK_SET) == 0 ? size : -1;
}

// Reads from `fd` into `out` until `out` is full, the file ends, or a read fails.
void ReadBytes(int fd, std::vector<uint8_t>& out) {
  size_t done = 0;
  while (done < out.size()) {
    const ssize_t count = TEMP_FAILURE_RETRY(read(fd, out.data() + done, out.size() - done));
    if (count <= 0) break;
    done += static_cast<size_t>(count);
  }
}

}  // namespace
