// Simulates the files in which the kernel publishes each task's integrity value:
// /proc/self/integrity/value and /proc/PID/integrity/value. The simulated files are read-only, and
// exist only for callers of fopen and fopen64. The phone's settings list integrity values. Each
// opening for reading, of any existing task's file, delivers the next value of this list. The last
// value repeats.
#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>
#include <vector>

#include "simulator/phone/next_function.h"
#include "simulator/phone/stand_in.h"

namespace simulator {

namespace {

using FopenFunction = FILE*(const char*, const char*);

std::optional<int> TaskOf(const char* path);
FILE* OpenIntegrity(int pid, const char* mode);
bool TaskExists(int pid);
int FileHolding(const std::string& text, bool closes_on_exec);

}  // namespace

STAND_IN FILE* fopen(const char* path, const char* mode) {
  static auto* const next = NextFunction<FopenFunction>("fopen");
  const auto pid = TaskOf(path);
  return pid ? OpenIntegrity(*pid, mode) : next(path, mode);
}

// Programs that are built for large files call fopen by the name fopen64. On a 64-bit system, both
// names are the same function.
STAND_IN FILE* fopen64(const char* path, const char* mode) __attribute__((alias("fopen")));

namespace {

// The task to which the integrity file at `path` belongs, 0 for "self". None if `path` is not the
// path of an integrity file.
std::optional<int> TaskOf(const char* path) {
  constexpr char kBefore[] = "/proc/";
  constexpr char kAfter[] = "/integrity/value";
  if (path == nullptr || strncmp(path, kBefore, strlen(kBefore)) != 0) return {};
  const char* const task = path + strlen(kBefore);
  const char* const after = strchr(task, '/');
  if (after == nullptr || strcmp(after, kAfter) != 0) return {};
  const std::string name(task, after);
  if (name == "self") return 0;
  const long pid = strtol(name.c_str(), nullptr, 10);
  const bool is_pid = pid > 0 && pid <= INT32_MAX && std::to_string(pid) == name;
  return is_pid ? std::optional<int>(static_cast<int>(pid)) : std::nullopt;
}

// Opens the integrity file of the task `pid` as fopen does.
FILE* OpenIntegrity(int pid, const char* mode) {
  static std::atomic<size_t> opened{0};
  const auto fail = [](int error) {
    errno = error;
    return nullptr;
  };
  const bool reads_only = mode[0] == 'r' && strchr(mode, '+') == nullptr;
  if (!reads_only) return fail(EACCES);
  if (!TaskExists(pid)) return fail(ENOENT);
  const std::vector<std::string>& values = ThisPhone().integrity;
  const std::string& text = values[std::min(opened++, values.size() - 1)];
  Event event("integrity");
  event.Number("pid", pid);
  if (text == kMissing) {
    Record(event.Null("text"));
    return fail(ENOENT);
  }
  Record(event.Text("text", text));
  const int fd = FileHolding(text + "\n", strchr(mode, 'e') != nullptr);
  return fd < 0 ? nullptr : fdopen(fd, mode);
}

bool TaskExists(int pid) {
  const ErrnoKeeper keeper;
  return pid == 0 || access(("/proc/" + std::to_string(pid)).c_str(), F_OK) == 0;
}

// Makes a new file that contains `text` and is sealed against writing. Returns its descriptor, or
// -1.
int FileHolding(const std::string& text, bool closes_on_exec) {
  const int fd = memfd_create("integrity", MFD_ALLOW_SEALING | (closes_on_exec ? MFD_CLOEXEC : 0U));
  if (fd < 0) return fd;
  if (pwrite(fd, text.data(), text.size(), 0) < 0) {
    close(fd);
    return -1;
  }
  const ErrnoKeeper keeper;
  fcntl(fd, F_ADD_SEALS, F_SEAL_WRITE | F_SEAL_GROW | F_SEAL_SHRINK | F_SEAL_SEAL);
  return fd;
}

}  // namespace

}  // namespace simulator
