// Prints a report for a person: the verdict, the items with their cures, the warnings, the signer
// and the timeline. Detail::kVerdict prints only the verdict's line. Detail::kAll adds to the
// report the names of differing, missing and unlisted entries, the signers of newer schemes, and
// the chain from the key to the entries.
#pragma once

#include <ostream>

#include "simulator/show/terminal.h"
#include "simulator/verdict/report.h"

namespace simulator {

enum class Detail { kVerdict, kUsual, kAll };

void PrintReport(const Report& report, Detail detail, const Look& look, std::ostream& out);

}  // namespace simulator
