// Mutations of whole packages that get past the first check. One entry is changed, some of the
// digests and signatures over it are repaired, and the archive is built anew.
#pragma once

#include <cstddef>
#include <cstdint>

// An LLVMFuzzerCustomMutator. The first byte of the data selects the phone; the rest is the
// archive.
size_t MutatePackage(uint8_t* data, size_t size, size_t max_size, unsigned seed);
