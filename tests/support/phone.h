// In a test program, replaces the parts that only a phone has: the kernel's integrity feature and
// libzu.
//
// In a program that links phone.cpp, the linker must wrap open, read, fstat, fcntl, fopen, usleep,
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

  // By default, a phone has no faults. A test sets the members whose defaults it must change.

  // The texts of the integrity file, one for each opening. The last text repeats. kNoFile means
  // that this opening fails.
  std::deque<std::string> integrity = {"1f\n"};
  static constexpr char kNoFile[] = "no file";
  int sign_errno = 0;             // 0: the kernel signs
  int verify_errno = 0;           // 0: the kernel trusts every file
  int zu_result = 0;              // the answer of libzu
  int zu_attribute_size = -1;     // of "user.zu", on every file; -1: the real attribute
  std::vector<int> nameless_fds;  // descriptors whose path cannot be resolved
  // The result of each fcntl call that signs or verifies a file, unless sign_errno or verify_errno
  // makes the call fail.
  int kernel_result = 0;

  // Called before the integrity file is opened. The tool opens the integrity file after it has
  // checked a file, and before it asks the kernel to sign this file.
  std::function<void()> before_integrity;
  // before_open is called before each open(), and after_open after each successful open().
  std::function<void(const char* path, int flags)> before_open;
  std::function<void(const char* path, int fd)> after_open;
  // The errno that an open() fails with; 0: the real system answers.
  std::function<int(const char* path, int flags)> open_error;
  // The errno that an fstat() fails with; 0: the real system answers.
  std::function<int(int fd)> fstat_error;
  // Called before and after each read().
  std::function<void(int fd)> before_read;
  std::function<void(int fd)> after_read;

  // Called for each sign, verify and register event, before the call that caused the event returns.
  // The call's descriptor is therefore still open.
  std::function<void(int fd, const std::string& event)> witness;

  // The actions of the code under test, in order: "integrity PATH", "sleep MICROSECONDS", "sign FD
  // PAYLOAD-HEX", "verify FD", "register FD NAME DATA-HEX".
  std::vector<std::string> events;
  // The number of calls of fopen, not counting those for integrity files.
  int other_fopens = 0;
  // The calls of fgetxattr: "FD NAME null SIZE", or "FD NAME buffer SIZE" if a buffer was passed.
  std::vector<std::string> attributes;
};
