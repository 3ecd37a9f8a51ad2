// A package's native libraries: which of them were to be signed, and what came of each.
#pragma once

#include <vector>

#include "simulator/verdict/make_report.h"

namespace simulator {

// Adds an item for each library. The first item is the file's own.
void AddLibraryItems(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options,
                     std::vector<Item>* items);

// Why the kernel did not sign the file; a null cause when it did.
Reason WhyKernelDidNotSign(const Attempt& attempt);

}  // namespace simulator
