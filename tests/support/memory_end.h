// Memory that ends where a block ends, for readers that no sanitizer checks. A read after the end
// crashes any code.
//
// A program that links this file (target `memory_end`) has its operator new replaced.
#pragma once

#include <cstddef>

// Puts the next block of exactly `size` bytes (at most 1 MiB) from operator new at the end of
// memory. Up to 3 bytes may follow it, to a multiple of 4. One block at a time.
void PutNextBlockAtMemoryEnd(size_t size);
// True if the block was put there. If not, forgets the request.
bool WasPutAtMemoryEnd();
