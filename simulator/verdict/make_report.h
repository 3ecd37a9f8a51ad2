// From what happened and what can be seen to the report of it.
#pragma once

#include "simulator/package/facts.h"
#include "simulator/run/run_record.h"
#include "simulator/verdict/report.h"

namespace simulator {

// How the user wants it judged.
struct JudgeOptions {
  bool is_strict = false;  // a library that is not there counts as refused
};

Report MakeReport(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options);

}  // namespace simulator
