// What memory there is. Nothing is kept, nothing is logged.
#pragma once

#include <cstddef>

// Whether a vector may grow to `size` bytes. The vector itself cannot be asked: it ends the process
// where it cannot grow. A sparse file and a zip bomb claim any size for nothing, and a kernel that
// promises more memory than there is would end the process later, so the memory of the machine is
// the limit, and the address space is tried.
bool FitsInMemory(size_t size);
