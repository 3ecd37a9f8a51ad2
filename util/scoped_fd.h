// Owns a file descriptor, and closes it when the object is destroyed.
#pragma once

#include <unistd.h>

class ScopedFd {
 public:
  // Takes ownership of `fd`. A negative `fd` is not closed.
  explicit ScopedFd(int fd) : fd_(fd) {}
  ~ScopedFd() {
    if (fd_ >= 0) close(fd_);
  }
  ScopedFd(const ScopedFd&) = delete;
  ScopedFd& operator=(const ScopedFd&) = delete;

  int get() const { return fd_; }

 private:
  const int fd_;
};
