// Memory that ends where a block ends, for readers that no sanitizer sees: reading on is a fault
// for any code.
//
// A program that links this file (target `memory_end`) has its operator new replaced.
#pragma once

#include <cstddef>

// Has the next block of exactly `size` bytes (at most 1 MiB) that operator new is asked for end
// where memory ends, but for what is missing to a multiple of 4. One block at a time.
void PutNextBlockAtMemoryEnd(size_t size);
// False, and not asked again, unless the block was put there.
bool WasPutAtMemoryEnd();
