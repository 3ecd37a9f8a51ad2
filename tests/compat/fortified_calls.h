// In a build with _FORTIFY_SOURCE, Bionic's headers give some calls another name. For example, read
// becomes __read_chk. Every source tree of the platform builds in this way. The tests replace some
// calls by functions of their own (the linker option --wrap). The tests must also replace these
// calls under their other names. The preset `fortify` checks this replacement on a workstation.
// There, the C library has functions such as __read_chk, but the C library's headers rarely call
// them. The functions below therefore call them.
//
// The preset includes this header at the start of every source (-include). The attribute
// pass_object_size makes each function below an overload of the C library's function, even if both
// have the same parameter types. The compiler prefers the functions below because of enable_if.
#pragma once

#include <fcntl.h>
#include <unistd.h>

#define FORTIFIED_CALL static inline __attribute__((always_inline, unused))
#define WITH_SIZE __attribute__((pass_object_size(0)))

extern "C" {
int __open_2(const char* path, int flags);
ssize_t __read_chk(int fd, void* buffer, size_t size, size_t buffer_size);
ssize_t __readlink_chk(const char* path, char* buffer, size_t size, size_t buffer_size);
}

FORTIFIED_CALL int open(const char* const path WITH_SIZE, int flags)
    __attribute__((enable_if(true, ""))) {
  return __open_2(path, flags);
}

FORTIFIED_CALL ssize_t read(int fd, void* const buffer WITH_SIZE, size_t size)
    __attribute__((enable_if(true, ""))) {
  return __read_chk(fd, buffer, size, __builtin_object_size(buffer, 0));
}

FORTIFIED_CALL ssize_t readlink(const char* path, char* const buffer WITH_SIZE, size_t size)
    __attribute__((enable_if(true, ""))) {
  return __readlink_chk(path, buffer, size, __builtin_object_size(buffer, 0));
}

#undef FORTIFIED_CALL
#undef WITH_SIZE
