#include "util/file_fixture.h"

#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

Kernel kernel;

extern "C" {
int __real_fstat(int fd, struct stat* status);
off_t __real_lseek(int fd, off_t offset, int whence);
void* __real_mmap(void* address, size_t length, int protection, int flags, int fd, off_t offset);
ssize_t __real_readlink(const char* path, char* buffer, size_t size);

int __wrap_fstat(int fd, struct stat* status) {
  return kernel.fstat ? kernel.fstat(status) : __real_fstat(fd, status);
}
off_t __wrap_lseek(int fd, off_t offset, int whence) {
  return kernel.lseek ? kernel.lseek(whence) : __real_lseek(fd, offset, whence);
}
void* __wrap_mmap(void* address, size_t length, int protection, int flags, int fd, off_t offset) {
  return kernel.mmap ? kernel.mmap(length)
                     : __real_mmap(address, length, protection, flags, fd, offset);
}
ssize_t __wrap_read(int fd, void* buffer, size_t size) {
  return kernel.read ? kernel.read(fd, buffer, size) : __real_read(fd, buffer, size);
}
ssize_t __wrap_readlink(const char* path, char* buffer, size_t size) {
  return kernel.readlink ? kernel.readlink(buffer, size) : __real_readlink(path, buffer, size);
}

// In a build with _FORTIFY_SOURCE, calls of read and readlink can become calls of __read_chk and
// __readlink_chk. The linker redirects these calls to the two functions below. A build inside the
// source tree of the Android platform always defines _FORTIFY_SOURCE.
ssize_t __wrap___read_chk(int fd, void* buffer, size_t size, size_t /*room*/) {
  return __wrap_read(fd, buffer, size);
}
ssize_t __wrap___readlink_chk(const char* path, char* buffer, size_t size, size_t /*room*/) {
  return __wrap_readlink(path, buffer, size);
}
}
