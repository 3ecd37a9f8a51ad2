// A write lease on a file (fcntl, F_SETLEASE). A thread of the Lease gives the lease up at least
// 100 ms after any process tries to open the file, this process included. Until then, the call of
// open() waits, or fails with EWOULDBLOCK if its flags include O_NONBLOCK.
#pragma once

#include <fcntl.h>
#include <unistd.h>

#include <atomic>
#include <csignal>
#include <string>
#include <thread>

class Lease {
 public:
  explicit Lease(const std::string& path) : fd_(open(path.c_str(), O_RDWR | O_CLOEXEC)) {
    signal(SIGIO, SIG_IGN);  // the kernel's signal to the holder
    is_held_ = fcntl(fd_, F_SETLEASE, F_WRLCK) == 0;
    if (is_held_) holder_ = std::thread([this] { GiveUpWhenAsked(); });
  }
  ~Lease() {
    is_over_ = true;
    if (holder_.joinable()) holder_.join();
    close(fd_);
  }
  Lease(const Lease&) = delete;
  Lease& operator=(const Lease&) = delete;

  // False if the kernel refused the lease, for example because the file system has no leases.
  bool IsHeld() const { return is_held_; }
  bool WasGivenUp() const { return was_given_up_; }

 private:
  void GiveUpWhenAsked() {
    while (!is_over_ && fcntl(fd_, F_GETLEASE) == F_WRLCK) usleep(1000);
    usleep(100000);  // as if the holder had to finish its work first
    was_given_up_ = !is_over_;
    fcntl(fd_, F_SETLEASE, F_UNLCK);
  }

  const int fd_;
  bool is_held_;
  std::atomic<bool> is_over_{false};
  std::atomic<bool> was_given_up_{false};
  std::thread holder_;
};
