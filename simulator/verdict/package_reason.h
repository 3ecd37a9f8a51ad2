// Why the tool refused a whole file before it asked the kernel: what it logged says where it
// stopped, what can be seen in the file says why.
#pragma once

#include "simulator/package/facts.h"
#include "simulator/run/run_record.h"
#include "simulator/verdict/report.h"

namespace simulator {

// For a file that is neither signed nor a plain JAR.
Reason WhyRefused(const RunRecord& run, const PackageFacts& facts);

// For a file that the tool did not look at; a null cause when it had no reason not to.
Reason WhyNotLookedAt(const PackageFacts& facts, bool has_standard_input);

}  // namespace simulator
