// What a package's signature protects: by bytes, and as the chain from the key to the entries.
#pragma once

#include <vector>

#include "simulator/package/facts.h"
#include "simulator/verdict/report.h"

namespace simulator {

// `items` are the report's: an entry is verified when what was checked against its digest was good.
Protection FindProtection(const PackageFacts& facts, const std::vector<Item>& items);

// Key, certificate, signature file, manifest, entries. It breaks where the package itself was
// refused, else where a library is not the one that was signed; `verified` are the entries whose
// digests were good. The first item is the package's own.
std::vector<Link> MakeChain(const PackageFacts& facts, const std::vector<Item>& items,
                            const Share& verified);

}  // namespace simulator
