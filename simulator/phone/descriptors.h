// File descriptors in a process whose own ones are to stay as they are without the simulation.
#pragma once

#include <string>

namespace simulator {

// Gives the open file `fd` a descriptor in the upper quarter of what the process may have,
// close-on-exec, so that the lowest free ones, which are handed out next, stay what they would be
// without it. Returns the new descriptor, or `fd` itself when none is free.
int MoveHigh(int fd);

// The path of the open file `fd`, as the kernel knows it; empty when `fd` is not open. errno stays
// as it was.
std::string PathOf(int fd);

}  // namespace simulator
