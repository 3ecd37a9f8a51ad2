// The files in which the kernel publishes each task's integrity value: /proc/self/integrity/value
// and /proc/PID/integrity/value, for whoever opens them through the C library. They can only be
// read. Each opening, of whichever task's file, answers the next of the phone's integrity values.
#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>

#include "simulator/kernel.h"

namespace {

using OpenFunction = int(const char*, int, ...);
using OpenAtFunction = int(int, const char*, int, ...);
using CheckedOpenFunction = int(const char*, int);
using CheckedOpenAtFunction = int(int, const char*, int);
using FopenFunction = FILE*(const char*, const char*);

bool TakesMode(int flags);
std::optional<int> TaskOf(const char* path);
int OpenIntegrity(int pid, int flags);
FILE* Fopen(FopenFunction* meant, const char* path, const char* mode);
bool TaskExists(int pid);
int FileHolding(const std::string& text, int flags);

}  // namespace

#define STAND_IN_OPEN(name)                                               \
  STAND_IN int name(const char* path, int flags, ...) {                   \
    static OpenFunction* const meant = Meant<OpenFunction>(#name);        \
    if (const auto pid = TaskOf(path)) return OpenIntegrity(*pid, flags); \
    if (!TakesMode(flags)) return meant(path, flags);                     \
    va_list arguments;                                                    \
    va_start(arguments, flags);                                           \
    const mode_t mode = va_arg(arguments, mode_t);                        \
    va_end(arguments);                                                    \
    return meant(path, flags, mode);                                      \
  }

#define STAND_IN_OPENAT(name)                                             \
  STAND_IN int name(int directory, const char* path, int flags, ...) {    \
    static OpenAtFunction* const meant = Meant<OpenAtFunction>(#name);    \
    if (const auto pid = TaskOf(path)) return OpenIntegrity(*pid, flags); \
    if (!TakesMode(flags)) return meant(directory, path, flags);          \
    va_list arguments;                                                    \
    va_start(arguments, flags);                                           \
    const mode_t mode = va_arg(arguments, mode_t);                        \
    va_end(arguments);                                                    \
    return meant(directory, path, flags, mode);                           \
  }

STAND_IN_OPEN(open)
STAND_IN_OPEN(open64)
STAND_IN_OPENAT(openat)
STAND_IN_OPENAT(openat64)

// What open becomes in programs that are built with the C library's own argument checks.
STAND_IN int __open_2(const char* path, int flags) {
  static auto* const meant = Meant<CheckedOpenFunction>("__open_2");
  if (const auto pid = TaskOf(path)) return OpenIntegrity(*pid, flags);
  return meant(path, flags);
}

STAND_IN int __open64_2(const char* path, int flags) {
  static auto* const meant = Meant<CheckedOpenFunction>("__open64_2");
  if (const auto pid = TaskOf(path)) return OpenIntegrity(*pid, flags);
  return meant(path, flags);
}

STAND_IN int __openat_2(int directory, const char* path, int flags) {
  static auto* const meant = Meant<CheckedOpenAtFunction>("__openat_2");
  if (const auto pid = TaskOf(path)) return OpenIntegrity(*pid, flags);
  return meant(directory, path, flags);
}

STAND_IN int __openat64_2(int directory, const char* path, int flags) {
  static auto* const meant = Meant<CheckedOpenAtFunction>("__openat64_2");
  if (const auto pid = TaskOf(path)) return OpenIntegrity(*pid, flags);
  return meant(directory, path, flags);
}

STAND_IN FILE* fopen(const char* path, const char* mode) {
  static auto* const meant = Meant<FopenFunction>("fopen");
  return Fopen(meant, path, mode);
}

STAND_IN FILE* fopen64(const char* path, const char* mode) {
  static auto* const meant = Meant<FopenFunction>("fopen64");
  return Fopen(meant, path, mode);
}

namespace {

// Only then is there a fourth argument to pass on.
bool TakesMode(int flags) { return (flags & O_CREAT) != 0 || (flags & O_TMPFILE) == O_TMPFILE; }

// The task whose integrity file `path` names, 0 for "self"; none when it names another file.
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

FILE* Fopen(FopenFunction* meant, const char* path, const char* mode) {
  const auto pid = TaskOf(path);
  if (!pid) return meant(path, mode);
  const bool reads_only = mode[0] == 'r' && strchr(mode, '+') == nullptr;
  const int flags = (reads_only ? O_RDONLY : O_RDWR) | (strchr(mode, 'e') ? O_CLOEXEC : 0);
  const int fd = OpenIntegrity(*pid, flags);
  return fd < 0 ? nullptr : fdopen(fd, mode);
}

// Opens the integrity file of the task `pid` as open does.
int OpenIntegrity(int pid, int flags) {
  static std::atomic<size_t> opened{0};
  const auto fail = [](int error) {
    errno = error;
    return -1;
  };
  if ((flags & O_ACCMODE) != O_RDONLY) return fail(EACCES);
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
  return FileHolding(text + "\n", flags);
}

bool TaskExists(int pid) {
  const ErrnoKeeper keeper;
  return pid == 0 || access(("/proc/" + std::to_string(pid)).c_str(), F_OK) == 0;
}

// A file of its own that holds `text`, which can be read and no longer written.
int FileHolding(const std::string& text, int flags) {
  const bool closes_on_exec = (flags & O_CLOEXEC) != 0;
  const int fd = memfd_create("integrity", MFD_ALLOW_SEALING | (closes_on_exec ? MFD_CLOEXEC : 0U));
  if (fd < 0) return fd;
  const ErrnoKeeper keeper;
  pwrite(fd, text.data(), text.size(), 0);
  fcntl(fd, F_ADD_SEALS, F_SEAL_WRITE | F_SEAL_GROW | F_SEAL_SHRINK | F_SEAL_SEAL);
  return fd;
}

}  // namespace
