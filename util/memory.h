// How much memory can be had. The function keeps no state and logs nothing.
#pragma once

#include <cstddef>

// True if a vector can grow to `size` bytes. A vector that cannot grow ends the process, so the
// caller asks here first. Sparse files and zip bombs can claim any size. A kernel that overcommits
// would end the process later, so `size` must be below the machine's memory; a trial mapping checks
// the address space.
bool FitsInMemory(size_t size);
