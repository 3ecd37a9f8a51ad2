// Mutates whole packages so that many of them pass the tool's first checks. Some archives are
// mutated as plain bytes. In all others, up to three changes are made to the entries. For most of
// these archives, the signature is then repaired, and often digests too. At the end, the archive is
// built again.
#pragma once

#include <cstddef>
#include <cstdint>

// An LLVMFuzzerCustomMutator. The first byte of the data selects the state of the simulated phone;
// the rest is the archive.
size_t MutatePackage(uint8_t* data, size_t size, size_t max_size, unsigned seed);
