// From what happened and what can be seen to the report of it: a pure function, which touches no
// file.
#pragma once

#include <cstdint>

#include "simulator/installer/judgement.h"
#include "simulator/package/facts.h"
#include "simulator/run/run_record.h"
#include "simulator/verdict/report.h"

namespace simulator {

// How the user wants it judged.
struct JudgeOptions {
  bool is_strict = false;  // what is absent or damaged counts as refused
  // Certificates that ended before it have expired; in seconds since 1970 in UTC.
  int64_t now = 0;
};

// `installer`: what the phones' installer says of the file.
Report MakeReport(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options,
                  const Judgement& installer = {});

// An item that is not done. The severity of its cause says in which state it is.
Item NotDone(ItemKind kind, const std::string& name, const Reason& reason,
             const JudgeOptions& options);

}  // namespace simulator
