// From what happened and what can be seen to the report of it.
#pragma once

#include "simulator/package/facts.h"
#include "simulator/verdict/report.h"

// How the user wants it judged, and what only the simulator itself knows.
struct Circumstances {
  bool is_strict = false;          // a library that is not there counts as refused
  bool has_standard_input = true;  // the tool was started with one
  // Why the run tells nothing; a null cause when it does.
  Reason failure;
  // The files that --install did not lay out.
  std::vector<std::string> not_laid_out;
};

// `events` are those of one run, from its "start" to its "exit".
Report MakeReport(const Events& events, const PackageFacts& facts, const Circumstances& around);
