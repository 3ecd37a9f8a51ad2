// A report for a person: the verdict, a line for each thing that was to be signed, what to do, who
// signed, and the timeline.
#pragma once

#include <ostream>

#include "simulator/show/terminal.h"
#include "simulator/verdict/report.h"

namespace simulator {

enum class Detail { kVerdict, kUsual, kAll };

void PrintReport(const Report& report, Detail detail, const Look& look, std::ostream& out);

}  // namespace simulator
