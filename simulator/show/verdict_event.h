// The last event of a file in the journal: the file's report as one line (docs/journal.md).
#pragma once

#include <string>

#include "simulator/verdict/report.h"

namespace simulator {

// Returns the whole line, with its line feed.
std::string VerdictEvent(const Report& report);

}  // namespace simulator
