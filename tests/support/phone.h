// The parts that only a phone has, inside the test program: the kernel's integrity feature and
// libzu.
//
// In a program that links phone.cpp, the linker must wrap open, read, fcntl, fopen, usleep,
// fgetxattr and readlink. It must also wrap the forms of open, read and readlink that
// _FORTIFY_SOURCE uses. The target `phone` sets these options. The program's tests create a Phone,
// and read the results from it. While no Phone exists, every wrapped call goes to the real system,
// and libzu refuses.
#pragma once

#include <cstdint>
#include <deque>
#include <functional>
#include <map>
#include <string>
#include <vector>

struct Phone {
  Phone();
  ~Phone();
  Phone(const Phone&) = delete;
  Phone& operator=(const Phone&) = delete;

  // By default, a phone has no faults. A test changes the members that it needs.

  // The texts of the integrity file, one for each opening. The last text repeats. kNoFile means
  // that this opening fails.
  std::deque<std::string> integrity = {"1f\n"};
  static constexpr char kNoFile[] = "no file";
  int sign_errno = 0;             // 0: the kernel signs
  int verify_errno = 0;           // 0: the kernel trusts every file
  int zu_result = 0;              // the answer of libzu
  int zu_attribute_size = -1;     // of "user.zu", on every file; -1: the real attribute
  std::vector<int> nameless_fds;  // descriptors whose path cannot be resolved
  // The result of the fcntl call that signs (if sign_errno is 0), and of the one that verifies (if
  // verify_errno is 0).
  int kernel_result = 0;

  // Called before the integrity file is opened. The tool opens the integrity file after it has
  // checked a file, and before it asks the kernel to sign this file.
  std::function<void()> before_integrity;
  // Called before each open(), and after each successful one.
  std::function<void(const char* path, int flags)> before_open;
  std::function<void(const char* path, int fd)> after_open;
  // The errno that an open() fails with; 0: the real system answers.
  std::function<int(const char* path, int flags)> open_error;
  // Called before and after each read().
  std::function<void(int fd)> before_read;
  std::function<void(int fd)> after_read;

  // Called after each event with a descriptor, while the descriptor is still open.
  std::function<void(int fd, const std::string& event)> witness;

  // The actions of the code under test, in order: "integrity PATH", "sleep MICROSECONDS", "sign FD
  // PAYLOAD-HEX", "verify FD", "register FD NAME DATA-HEX".
  std::vector<std::string> events;
  // The number of calls of fopen, not counting those for integrity files.
  int other_fopens = 0;
  // The attributes that were read: "FD NAME null SIZE", or "FD NAME buffer SIZE" if a buffer was
  // passed.
  std::vector<std::string> attributes;
};
