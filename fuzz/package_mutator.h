// Mutations of whole packages that get past the first check: one entry is changed, then more or
// less of what vouches for it is made good again, and the archive is built anew.
#pragma once

#include <cstddef>
#include <cstdint>

// As LLVMFuzzerCustomMutator. The first byte of the data is the phone's; the rest is the archive.
size_t MutatePackage(uint8_t* data, size_t size, size_t max_size, unsigned seed);
