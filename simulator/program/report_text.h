// A report for a person: the verdict, a line for each thing that was to be signed, what to do, who
// signed, and the timeline.
#pragma once

#include <ostream>
#include <string>
#include <vector>

#include "simulator/program/report.h"
#include "simulator/program/terminal.h"

enum class Detail { kVerdict, kUsual, kAll };

void PrintReport(const Report& report, Detail detail, const Look& look, std::ostream& out);

// Such as "3 files: 1 signed, 2 refused".
std::string Summary(const std::vector<Verdict>& verdicts);
