// Checks whether memory is available. FitsInMemory keeps no state and logs nothing.
#pragma once

#include <cstddef>

// Estimates whether a vector can grow to `size` bytes. A vector that cannot grow ends the process,
// so the caller checks here first. A sparse file can have any size, and a zip bomb can declare any
// size. A kernel that overcommits grants any size and ends the process later. The function
// therefore returns false if `size` is not below the machine's memory. A trial mapping also checks
// the address space.
bool FitsInMemory(size_t size);
