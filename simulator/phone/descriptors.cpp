#include "simulator/phone/descriptors.h"

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>

namespace simulator {

int MoveHigh(int fd) {
  constexpr rlim_t kEnough = 1024;
  rlimit limit = {};
  if (getrlimit(RLIMIT_NOFILE, &limit) != 0) return fd;
  const int from = static_cast<int>(std::min(limit.rlim_cur, kEnough) / 4 * 3);
  const int high = fcntl(fd, F_DUPFD_CLOEXEC, from);
  if (high < 0) return fd;
  close(fd);
  return high;
}

std::string PathOf(int fd) {
  const int errno_before = errno;
  char path[PATH_MAX];
  const std::string link = "/proc/self/fd/" + std::to_string(fd);
  // Makes the system call directly, so that a test that replaces readlink
  // (tests/faults/fault_injector.cpp) does not change the result.
  const long length = syscall(SYS_readlinkat, AT_FDCWD, link.c_str(), path, sizeof(path));
  errno = errno_before;
  return length < 0 ? "" : std::string(path, static_cast<size_t>(length));
}

}  // namespace simulator
