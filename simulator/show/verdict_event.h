// The journal's last word on a file: its report as one event (docs/journal.md).
#pragma once

#include <string>

#include "simulator/verdict/report.h"

namespace simulator {

// The whole line, with its end.
std::string VerdictEvent(const Report& report);

}  // namespace simulator
