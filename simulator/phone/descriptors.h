// Descriptors for the stand-ins, the libraries that answer in place of the phone. The tool's own
// files must get the same descriptors as without the stand-ins.
#pragma once

#include <string>

namespace simulator {

// Moves the open file `fd` to a high descriptor, which is close-on-exec. High means: in the upper
// quarter of the process's range, or from 768 on if the range has more than 1024 descriptors. The
// system hands out the lowest free descriptor, so the tool still gets the same descriptors. Returns
// the new descriptor, or `fd` itself if it could not be moved.
int MoveHigh(int fd);

// The path of the open file `fd`, as the kernel knows it; empty if `fd` is not open. Does not
// change errno.
std::string PathOf(int fd);

}  // namespace simulator
