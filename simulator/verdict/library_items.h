// A package's native libraries: which of them were to be signed, and what came of each.
#pragma once

#include <vector>

#include "simulator/package/facts.h"
#include "simulator/run/run_record.h"
#include "simulator/verdict/report.h"

namespace simulator {

// Adds an item for each library. `own` is the file's own item.
void AddLibraryItems(const RunRecord& run, const PackageFacts& facts, const Item& own,
                     bool is_strict, std::vector<Item>* items);

// Why the kernel did not sign the file; a null cause when it did.
Reason WhyKernelDidNotSign(const Attempt& attempt);

// Where the installer puts the library of this entry, from the package's folder on, as the tool
// looks for it; empty for one that no phone of this kind installs.
std::string InstalledPlace(const std::string& entry);

}  // namespace simulator
