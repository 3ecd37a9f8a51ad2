// Puts a block at the end of accessible memory, for code that no sanitizer checks. A read after the
// end of the memory crashes the program.
//
// A program that links this file (target `memory_end`) has its operator new replaced.
#pragma once

#include <cstddef>

// The next call of operator new for exactly `size` bytes (at most 1 MiB) returns a block at the end
// of memory. Up to 3 bytes follow the block, because it starts at a multiple of 4. Only one such
// block may be in use at a time.
void PutNextBlockAtMemoryEnd(size_t size);
// True if the block was put at the end of memory. If not, forgets the request.
bool WasPutAtMemoryEnd();
