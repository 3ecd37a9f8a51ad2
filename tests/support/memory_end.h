// Puts a block at the end of a memory area, for code that no sanitizer checks. A page that cannot
// be read follows the area. A read from this page crashes the program.
//
// In a program that links the target `memory_end`, operator new and operator delete are replaced.
#pragma once

#include <cstddef>

// The next call of operator new for exactly `size` bytes (1 byte to 1 MiB) returns a block at the
// end of the area. The block starts at a multiple of 4, so up to 3 unused bytes can follow it in
// the area. Only one block of the area may be in use at a time.
void PutNextBlockAtMemoryEnd(size_t size);
// True if the requested block was put at the end of the area. If not, forgets the request.
bool WasPutAtMemoryEnd();
