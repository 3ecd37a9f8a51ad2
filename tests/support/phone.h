// What only the phone has, inside the test program: the kernel's integrity feature and libzu.
//
// A program that links this file and asks the linker to wrap open, read, fcntl, fopen, usleep,
// fgetxattr and readlink, and the checked forms of open, read and readlink (target `phone` does),
// has a Phone to set up and to read afterwards. Without a living Phone every wrapped call goes to
// the real system, and libzu refuses.
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

  // A healthy phone, to be changed by the test.
  // What the integrity file holds, one text an opening, the last of which repeats; kNoFile: there
  // is none at that opening.
  std::deque<std::string> integrity = {"1f\n"};
  static constexpr char kNoFile[] = "no file";
  int sign_errno = 0;             // 0: the kernel signs
  int verify_errno = 0;           // 0: the kernel trusts every file
  int zu_result = 0;              // what libzu answers
  int zu_attribute_size = -1;     // of "user.zu", on every file; -1: there is none
  std::vector<int> nameless_fds;  // descriptors whose path cannot be resolved
  // What fcntl answers to a request to sign or to verify that is in order.
  int kernel_result = 0;

  // Called before the integrity file is opened: after all checks, and before the kernel signs.
  std::function<void()> before_integrity;
  // Called before each open(), and after each that succeeded.
  std::function<void(const char* path, int flags)> before_open;
  std::function<void(const char* path, int fd)> after_open;
  // The errno that an open() fails with; 0: the real system answers.
  std::function<int(const char* path, int flags)> open_error;
  // Called before and after each read().
  std::function<void(int fd)> before_read;
  std::function<void(int fd)> after_read;

  // Called after each event that has a descriptor, while that is still open.
  std::function<void(int fd, const std::string& event)> witness;

  // What the code under test did, in the order in which it did it: "integrity PATH", "sleep
  // MICROSECONDS", "sign FD PAYLOAD-HEX", "verify FD", "register FD NAME DATA-HEX".
  std::vector<std::string> events;
  // How many files other than an integrity file fopen was asked for.
  int other_fopens = 0;
  // The attributes that were asked for: "FD NAME VALUE-IS-NULL SIZE".
  std::vector<std::string> attributes;
};
