// Mutates whole packages so that many of them get past the first check. Up to three changes are
// made to the entries. In most mutations, some digests and signatures are then repaired. At the
// end, the archive is built again. Some archives are mutated as plain bytes instead.
#pragma once

#include <cstddef>
#include <cstdint>

// An LLVMFuzzerCustomMutator. The first byte of the data selects the state of the simulated phone;
// the rest is the archive.
size_t MutatePackage(uint8_t* data, size_t size, size_t max_size, unsigned seed);
