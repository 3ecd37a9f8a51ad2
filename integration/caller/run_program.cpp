#include "integration/caller/run_program.h"

#include <dirent.h>
#include <fcntl.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>

namespace {

// The exit status of a child that could not close its descriptors, set its memory limit or exec the
// program. The tool, apktoolkit-verify and apktoolkit-bound end with lower statuses.
constexpr int kCannotBecome = 127;

// Everything that the child needs. It is made before the fork, because the child must not allocate
// memory. Another thread can hold the allocator's lock at the fork, and nobody would release this
// lock in the child.
struct Child {
  std::vector<char*> arguments;  // ends with a null pointer
  int null;                      // /dev/null, with a descriptor above those of the standard streams
  rlim_t memory_bytes;
};

std::vector<char*> Arguments(const std::vector<std::string>& command);
int OpenNull();
[[noreturn]] void Become(const Child& child);
bool CloseOtherDescriptors();
RunResult Wait(pid_t child, int milliseconds);
RunResult Kill(pid_t child);
RunResult Describe(int status);
long long Now();
void Sleep(long long milliseconds);

}  // namespace

RunResult RunProgram(const std::vector<std::string>& command, const RunLimits& limits) {
  const Child child = {Arguments(command), OpenNull(), limits.memory_bytes};
  if (child.null < 0) return {RunEnd::kNotStarted, errno};
  const pid_t pid = fork();
  const int error = errno;
  if (pid == 0) Become(child);
  close(child.null);
  if (pid < 0) return {RunEnd::kNotStarted, error};
  return Wait(pid, limits.milliseconds);
}

namespace {

std::vector<char*> Arguments(const std::vector<std::string>& command) {
  std::vector<char*> arguments;
  arguments.reserve(command.size() + 1);
  for (const std::string& word : command) arguments.push_back(const_cast<char*>(word.c_str()));
  arguments.push_back(nullptr);
  return arguments;
}

// Opens /dev/null with a descriptor above those of the standard streams, even if this process has
// no standard streams. If `null` were the descriptor of a stream, dup2 would leave this descriptor
// close-on-exec. exec would then close the stream.
int OpenNull() {
  const int first = open("/dev/null", O_RDWR | O_CLOEXEC);
  if (first < 0) return first;
  const int null = fcntl(first, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
  const int error = errno;
  close(first);
  errno = error;
  return null;
}

// The standard streams must be open: the tool refuses a file that gets descriptor 0.
void Become(const Child& child) {
  for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) dup2(child.null, stream);
  if (!CloseOtherDescriptors()) _exit(kCannotBecome);
  const rlimit memory = {child.memory_bytes, child.memory_bytes};
  if (child.memory_bytes != 0 && setrlimit(RLIMIT_DATA, &memory) != 0) _exit(kCannotBecome);
  sigset_t none;
  sigemptyset(&none);
  sigprocmask(SIG_SETMASK, &none, nullptr);
  execv(child.arguments[0], child.arguments.data());
  _exit(kCannotBecome);
}

// Closes every descriptor except the standard streams, and returns true for success. A loop up to
// the limit of descriptors would miss descriptors that were opened before the limit was lowered,
// and takes long if the limit is very high. The system call getdents64 is used, because opendir
// allocates memory.
bool CloseOtherDescriptors() {
  const int directory = open("/proc/self/fd", O_RDONLY | O_DIRECTORY);
  if (directory < 0) return false;
  alignas(dirent64) char entries[4096];
  long size = 0;
  while ((size = syscall(SYS_getdents64, directory, entries, sizeof entries)) > 0) {
    for (long i = 0; i < size;) {
      const auto* const entry = reinterpret_cast<const dirent64*>(entries + i);
      const int fd = atoi(entry->d_name);  // 0 for "." and ".."
      if (fd > STDERR_FILENO && fd != directory) close(fd);
      i += entry->d_reclen;
    }
  }
  close(directory);
  return size == 0;
}

RunResult Wait(pid_t child, int milliseconds) {
  constexpr long long kLongestNap = 50;
  const long long deadline = Now() + milliseconds + 1;  // Now() is rounded down
  for (long long nap = 1;; nap = std::min(2 * nap, kLongestNap)) {
    int status = 0;
    const pid_t ended = waitpid(child, &status, WNOHANG);
    if (ended == child) return Describe(status);
    if (ended < 0 && errno != EINTR) return {RunEnd::kLost, errno};
    const long long left = deadline - Now();
    if (left <= 0) return Kill(child);
    Sleep(std::min(nap, left));
  }
}

RunResult Kill(pid_t child) {
  kill(child, SIGKILL);
  while (waitpid(child, nullptr, 0) < 0 && errno == EINTR) {
  }
  return {RunEnd::kTimedOut, 0};
}

RunResult Describe(int status) {
  if (WIFSIGNALED(status)) return {RunEnd::kKilled, WTERMSIG(status)};
  if (WEXITSTATUS(status) == kCannotBecome) return {RunEnd::kNotStarted, 0};
  return {RunEnd::kExited, WEXITSTATUS(status)};
}

// Returns the milliseconds of a clock that cannot be set.
long long Now() {
  timespec now = {};
  clock_gettime(CLOCK_MONOTONIC, &now);
  return now.tv_sec * 1000LL + now.tv_nsec / 1000000;
}

void Sleep(long long milliseconds) {
  const timespec time = {static_cast<time_t>(milliseconds / 1000),
                         static_cast<long>(milliseconds % 1000 * 1000000)};
  nanosleep(&time, nullptr);
}

}  // namespace
