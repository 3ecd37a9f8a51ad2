// Memory that ends where a block ends, for readers that no sanitizer sees: reading on is a fault
// for any code.
//
// A program that links this file (target `memory_end`) has its operator new replaced.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

// A copy of the `size` bytes at `data` (at most 1 MiB) with no memory behind it, but for what is
// missing to a multiple of 4. One at a time; the vector must not grow.
std::vector<uint8_t> AtMemoryEnd(const uint8_t* data, size_t size);
