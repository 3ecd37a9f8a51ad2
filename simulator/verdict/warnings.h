// What is worth knowing of a file although it changes nothing for the kernel.
#pragma once

#include <vector>

#include "simulator/package/facts.h"
#include "simulator/run/run_record.h"
#include "simulator/verdict/report.h"

namespace simulator {

// Of the report the items, the signers and the key are filled. What the file's own item says
// already is not said twice.
std::vector<Reason> FindWarnings(const RunRecord& run, const PackageFacts& facts,
                                 const Report& report);

}  // namespace simulator
