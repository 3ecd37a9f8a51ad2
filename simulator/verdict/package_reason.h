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

// Whether the tool reads the exponent of this key as 1, or as -1, whose magnitude is the same; and
// how the exponent is shown.
bool IsForgeable(const PublicKey& key);
std::string ExponentText(const PublicKey& key);

}  // namespace simulator
