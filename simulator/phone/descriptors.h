// Descriptors for the stand-ins, the libraries that answer in place of the phone. The tool's own
// files must get the same descriptors as without the stand-ins.
#pragma once

#include <string>

namespace simulator {

// Moves the open file `fd` to a high descriptor, which is close-on-exec. High means: at least three
// quarters of the process's limit (RLIMIT_NOFILE), or at least 768 if the limit is above 1024. The
// system uses the lowest free descriptor for each new file. High descriptors therefore do not
// change the descriptors of the tool's files. Returns the high descriptor, or `fd` itself if the
// file could not be moved.
int MoveHigh(int fd);

// The path of the open file `fd`, as the kernel knows it; empty if `fd` is not open. Does not
// change errno.
std::string PathOf(int fd);

}  // namespace simulator
