// Makes a report from the record of a run, the facts of the file and the judgement of the phones'
// installer. MakeReport is a pure function: it reads and writes no files.
#pragma once

#include <cstdint>

#include "simulator/installer/judgement.h"
#include "simulator/package/facts.h"
#include "simulator/run/run_record.h"
#include "simulator/verdict/report.h"

namespace simulator {

// The user's choices for the judgement.
struct JudgeOptions {
  bool is_strict = false;  // absent libraries, and damaged or encrypted entries, count as refused
  // The present time, in seconds since 1970 in UTC. A certificate with an earlier notAfter has
  // expired.
  int64_t now = 0;
};

Report MakeReport(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options,
                  const Judgement& installer = {});

// Makes an item whose state is not kDone. The severity of `reason.cause`, together with
// `options.is_strict`, decides the state. `reason.cause` must not be null.
Item NotDone(ItemKind kind, const std::string& name, const Reason& reason,
             const JudgeOptions& options);

}  // namespace simulator
