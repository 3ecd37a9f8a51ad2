#include "support/phone.h"
#include "support/bytes.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/types.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "sign/libzu.h"

namespace {

Phone* phone = nullptr;

bool IsIntegrityFile(const std::string& path) {
  return path.rfind("/proc/", 0) == 0 && path.find("/integrity/value") != std::string::npos;
}

std::string NextIntegrity() {
  const std::string text = phone->integrity.front();
  if (phone->integrity.size() > 1) phone->integrity.pop_front();
  return text;
}

void Note(int fd, const std::string& event) {
  phone->events.push_back(event);
  if (phone->witness) phone->witness(fd, event);
}

int AnswerWith(int error) {
  if (error == 0) return phone->kernel_result;
  errno = error;
  return -1;
}

int Sign(int fd, const uint8_t* payload) {
  uint16_t length;
  memcpy(&length, payload, sizeof(length));
  Note(fd, "sign " + std::to_string(fd) + " " + Hex(payload, sizeof(length) + length));
  return AnswerWith(phone->sign_errno);
}

int Verify(int fd) {
  Note(fd, "verify " + std::to_string(fd));
  return AnswerWith(phone->verify_errno);
}

}  // namespace

Phone::Phone() { phone = this; }
Phone::~Phone() { phone = nullptr; }

extern "C" {

int __real_open(const char* path, int flags, ...);
ssize_t __real_read(int fd, void* buffer, size_t size);
int __real_fstat(int fd, struct stat* state);
FILE* __real_fopen(const char* path, const char* mode);
int __real_fcntl(int fd, int command, ...);
int __real_usleep(useconds_t microseconds);
ssize_t __real_fgetxattr(int fd, const char* name, void* value, size_t size);
ssize_t __real_readlink(const char* path, char* buffer, size_t size);

// Test programs with a Phone create no files with open(), so the mode is not needed.
int __wrap_open(const char* path, int flags, ...) {
  if (phone == nullptr) return __real_open(path, flags);
  if (phone->before_open) phone->before_open(path, flags);
  if (const int error = phone->open_error ? phone->open_error(path, flags) : 0; error != 0) {
    errno = error;
    return -1;
  }
  const int fd = __real_open(path, flags);
  if (fd >= 0 && phone->after_open) phone->after_open(path, fd);
  return fd;
}

ssize_t __wrap_read(int fd, void* buffer, size_t size) {
  if (phone != nullptr && phone->before_read) phone->before_read(fd);
  const ssize_t count = __real_read(fd, buffer, size);
  if (phone != nullptr && phone->after_read) phone->after_read(fd);
  return count;
}

ssize_t __wrap___read_chk(int fd, void* buffer, size_t size, size_t /*room*/) {
  return __wrap_read(fd, buffer, size);
}

int __wrap_fstat(int fd, struct stat* state) {
  const int error = phone != nullptr && phone->fstat_error ? phone->fstat_error(fd) : 0;
  if (error == 0) return __real_fstat(fd, state);
  errno = error;
  return -1;
}

// In a build with _FORTIFY_SOURCE, calls of open become calls of __open_2. Every build in an
// Android source tree defines _FORTIFY_SOURCE.
int __wrap___open_2(const char* path, int flags) { return __wrap_open(path, flags); }

FILE* __wrap_fopen(const char* path, const char* mode) {
  if (phone != nullptr && !IsIntegrityFile(path)) ++phone->other_fopens;
  if (phone == nullptr || !IsIntegrityFile(path)) return __real_fopen(path, mode);
  if (phone->before_integrity) phone->before_integrity();
  phone->events.push_back(std::string("integrity ") + path);
  const std::string text = NextIntegrity();
  if (text == Phone::kNoFile) {
    errno = ENOENT;
    return nullptr;
  }
  FILE* file = tmpfile();
  if (file == nullptr) abort();
  fwrite(text.data(), 1, text.size(), file);
  rewind(file);
  return file;
}

int __wrap_fcntl(int fd, int command, ...) {
  if (phone != nullptr && command == 1125) return Verify(fd);
  va_list arguments;
  va_start(arguments, command);
  void* argument = va_arg(arguments, void*);
  va_end(arguments);
  if (phone == nullptr || command != 1124) return __real_fcntl(fd, command, argument);
  return Sign(fd, static_cast<const uint8_t*>(argument));
}

int __wrap_usleep(useconds_t microseconds) {
  if (phone == nullptr) return __real_usleep(microseconds);
  phone->events.push_back("sleep " + std::to_string(microseconds));
  return 0;
}

ssize_t __wrap_fgetxattr(int fd, const char* name, void* value, size_t size) {
  if (phone != nullptr) {
    phone->attributes.push_back(std::to_string(fd) + " " + name + " " +
                                (value == nullptr ? "null " : "buffer ") + std::to_string(size));
  }
  if (phone == nullptr || strcmp(name, "user.zu") != 0 || phone->zu_attribute_size < 0) {
    return __real_fgetxattr(fd, name, value, size);
  }
  return phone->zu_attribute_size;
}

ssize_t __wrap_readlink(const char* path, char* buffer, size_t size) {
  const auto names = [path](int fd) { return path == "/proc/self/fd/" + std::to_string(fd); };
  if (phone != nullptr &&
      std::any_of(phone->nameless_fds.begin(), phone->nameless_fds.end(), names)) {
    errno = ENOENT;
    return -1;
  }
  return __real_readlink(path, buffer, size);
}

ssize_t __wrap___readlink_chk(const char* path, char* buffer, size_t size, size_t /*room*/) {
  return __wrap_readlink(path, buffer, size);
}

int ZuNewCertificate(int fd, const char* name, const unsigned char* data, size_t length) {
  if (phone == nullptr) return -1;
  Note(fd, "register " + std::to_string(fd) + " " + name + " " + Hex(data, length));
  return phone->zu_result;
}

}  // extern "C"
