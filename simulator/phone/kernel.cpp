// Simulates the two fcntl commands of the kernel's integrity feature, under both names that fcntl
// has in the C library.
//
// This file, integrity_file.cpp, log.cpp and standard_output.cpp are parts of one library, which is
// loaded before all others. The library replaces the functions by which the tool uses the kernel's
// integrity feature and the phone's log. It also records the tool's standard output. Calls that do
// not concern the phone are passed, unchanged, to the function of the same name in a library that
// is loaded later.
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdarg>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <string>
#include <vector>

#include "simulator/phone/descriptors.h"
#include "simulator/phone/next_function.h"
#include "simulator/phone/stand_in.h"

namespace simulator {

namespace {

constexpr int kSignCommand = 1124;
constexpr int kVerifyCommand = 1125;

using FcntlFunction = int(int, int, ...);

int Sign(int fd, const void* argument);
int Verify(int fd);
int DescriptorError(int fd);
int CopyPayload(const void* argument, std::string* payload);
bool CopyIn(const char* from, size_t size, char* to);
int Scratch();
void Trust(int fd);
bool IsTrusted(int fd);
int Answer(Event* event, int error, int errno_before);

// Runs when this library is loaded, and records the event "attached" in the journal. Removes
// LD_PRELOAD from the environment, so that programs that the tool starts do not load this library.
__attribute__((constructor)) void Attach() {
  const ErrnoKeeper keeper;
  Record(Event("attached").Number("pid", getpid()));
  Scratch();
  unsetenv("LD_PRELOAD");
}

}  // namespace

// Every command of fcntl has at most one argument, which is not larger than a pointer.
STAND_IN int fcntl(int fd, int command, ...) {
  static FcntlFunction* const next = NextFunction<FcntlFunction>("fcntl");
  va_list arguments;
  va_start(arguments, command);
  void* const argument = va_arg(arguments, void*);
  va_end(arguments);
  if (command == kSignCommand) return Sign(fd, argument);
  if (command == kVerifyCommand) return Verify(fd);
  return next(fd, command, argument);
}

// In the C library of a 64-bit system, fcntl and fcntl64 are the same function.
STAND_IN int fcntl64(int fd, int command, ...) __attribute__((alias("fcntl")));

namespace {

int Sign(int fd, const void* argument) {
  const int errno_before = errno;
  std::string payload;
  int error = DescriptorError(fd);
  if (error == 0) error = CopyPayload(argument, &payload);
  if (error == 0) error = ThisPhone().sign_errno;
  if (error == 0) Trust(fd);
  Event event("sign");
  event.Number("fd", fd).Text("path", PathOf(fd)).Hex("payload", payload);
  return Answer(&event, error, errno_before);
}

int Verify(int fd) {
  const int errno_before = errno;
  int error = DescriptorError(fd);
  if (error == 0 && !IsTrusted(fd)) error = ThisPhone().verify_errno;
  Event event("verify");
  event.Number("fd", fd).Text("path", PathOf(fd));
  return Answer(&event, error, errno_before);
}

// Returns EBADF, as the kernel does, if `fd` is not open or was opened with O_PATH. Otherwise
// returns 0.
int DescriptorError(int fd) {
  const int flags = fcntl(fd, F_GETFL);
  return flags < 0 || (flags & O_PATH) != 0 ? EBADF : 0;
}

// Copies the payload that starts at `argument`: a 16-bit length in host byte order, then that many
// bytes. Returns 0, or EFAULT if the memory cannot be read; in that case `payload` is unchanged.
int CopyPayload(const void* argument, std::string* payload) {
  const char* const from = static_cast<const char*>(argument);
  uint16_t length = 0;
  char header[sizeof(length)];
  if (!CopyIn(from, sizeof(header), header)) return EFAULT;
  memcpy(&length, header, sizeof(length));
  std::string bytes(sizeof(header) + length, '\0');
  if (!CopyIn(from, bytes.size(), bytes.data())) return EFAULT;
  *payload = bytes;
  return 0;
}

// Copies `size` bytes from `from` to `to`. Returns false if the memory at `from` cannot be read.
// As in the kernel, unreadable memory causes no signal. The bytes go through a file, because pwrite
// reports unreadable memory as an error. It also does so if the tool runs under an emulator.
bool CopyIn(const char* from, size_t size, char* to) {
  const ssize_t wanted = static_cast<ssize_t>(size);
  return pwrite(Scratch(), from, size, 0) == wanted && pread(Scratch(), to, size, 0) == wanted;
}

// Returns the descriptor of the file that CopyIn copies through.
int Scratch() {
  static const int scratch = MoveHigh(memfd_create("payload", MFD_CLOEXEC));
  return scratch;
}

// The files that the simulated kernel has signed since this process started.
struct SignedFiles {
  std::mutex mutex;
  std::vector<FileId> ids;
};

SignedFiles& Signed() {
  static SignedFiles& files = *new SignedFiles;
  return files;
}

FileId IdOf(int fd) {
  struct stat state = {};
  fstat(fd, &state);
  return {state.st_dev, state.st_ino};
}

void Trust(int fd) {
  const std::lock_guard<std::mutex> lock(Signed().mutex);
  Signed().ids.push_back(IdOf(fd));
}

bool IsTrusted(int fd) {
  const auto holds = [id = IdOf(fd)](const std::vector<FileId>& ids) {
    return std::find(ids.begin(), ids.end(), id) != ids.end();
  };
  const std::lock_guard<std::mutex> lock(Signed().mutex);
  return holds(ThisPhone().trusted) || holds(Signed().ids);
}

// Records the kernel's answer in the journal. Sets errno, and returns the result of fcntl.
int Answer(Event* event, int error, int errno_before) {
  const int result = error == 0 ? 0 : -1;
  Record(event->Number("result", result).Number("errno", error));
  errno = error == 0 ? errno_before : error;
  return result;
}

}  // namespace

}  // namespace simulator
