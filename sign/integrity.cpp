#include "sign/integrity.h"

#include <fcntl.h>
#include <unistd.h>

#include <cstdio>

namespace {

// The kernel's private fcntl commands.
constexpr int kSignCommand = 1124;
constexpr int kVerifyCommand = 1125;

constexpr uint32_t kNotSettled = 0xFFFFFFFF;
constexpr useconds_t kPollMicroseconds = 10000;
constexpr size_t kPathSize = 256;

bool MaySign(uint32_t integrity) {
  // Deliberate: VeltSignFd waits until the value is settled, so `integrity` is never kNotSettled
  // here. This check refuses kNotSettled nevertheless, so that a later change to
  // VeltTaskReadIntegrity cannot let a task sign too early.
  return integrity != 0 && integrity != kNotSettled;
}

bool FormatIntegrityPath(int pid, char (&path)[kPathSize]) {
  if (pid < 0) return false;
  const int length = pid == 0 ? snprintf(path, kPathSize, "%s", "/proc/self/integrity/value")
                              : snprintf(path, kPathSize, "/proc/%d/integrity/value", pid);
  return length >= 0 && static_cast<size_t>(length) < kPathSize;
}

bool ReadHexadecimal(const char* path, uint32_t* value) {
  FILE* const file = fopen(path, "r");
  if (file == nullptr) return false;
  unsigned int read = 0;
  const bool is_number = fscanf(file, "%x", &read) == 1;
  fclose(file);
  if (is_number) *value = read;
  return is_number;
}

}  // namespace

uint32_t VeltSignFd(int fd, const void* payload) {
  if (payload == nullptr) return kVeltFailure;
  uint32_t integrity = 0;
  if (VeltTaskReadIntegrity(0, 1, &integrity) != 0) return kVeltFailure;
  if (!MaySign(integrity)) return kVeltFailure;
  return fcntl(fd, kSignCommand, payload) == 0 ? 0 : kVeltFailure;
}

uint32_t VeltVerifyFd(int fd) { return fcntl(fd, kVerifyCommand) == 0 ? 0 : kVeltFailure; }

uint32_t VeltTaskReadIntegrity(int pid, uint32_t wait, uint32_t* value) {
  char path[kPathSize] = {};
  if (value == nullptr || !FormatIntegrityPath(pid, path)) return kVeltFailure;
  const bool waits = (wait & 1) != 0;
  // Deliberate: the number of repetitions has no limit. The kernel settles the value of every task
  // at some time. If a limit ended the wait before that time, VeltSignFd would fail, and the file
  // would stay unsigned.
  while (ReadHexadecimal(path, value)) {
    if (!waits || *value != kNotSettled) return 0;
    usleep(kPollMicroseconds);
  }
  return kVeltFailure;
}
