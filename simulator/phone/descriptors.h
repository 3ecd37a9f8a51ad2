// Descriptors for the stand-ins. The tool's own descriptors must be the same as without them.
#pragma once

#include <string>

namespace simulator {

// Moves the open file `fd` to a high descriptor, close-on-exec: in the upper quarter of the
// process's range, or above 767 in a large one. The system hands out the lowest free descriptors,
// so the tool still gets the same ones. Returns the new descriptor, or `fd` itself if none is free.
int MoveHigh(int fd);

// The path of the open file `fd`, as the kernel knows it; empty if `fd` is not open. Does not
// change errno.
std::string PathOf(int fd);

}  // namespace simulator
