// What a package's signature protects: by bytes, and as the chain from the key to the entries.
#pragma once

#include <vector>

#include "simulator/package/facts.h"
#include "simulator/verdict/report.h"

namespace simulator {

// `items` are the report's, the package's own first.
Protection FindProtection(const PackageFacts& facts, const std::vector<Item>& items);

// Key, certificate, signature file, manifest, entries. It breaks where the cause says for which the
// package itself was refused, else where a library is not the one that was signed. Of the report
// all but the chain is filled.
std::vector<Link> MakeChain(const PackageFacts& facts, const Report& report);

}  // namespace simulator
