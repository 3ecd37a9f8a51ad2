// The events of a run in a readable form, line by line and in order.
#pragma once

#include <ostream>
#include <string>
#include <vector>

#include "simulator/run/events.h"
#include "simulator/show/terminal.h"

namespace simulator {

// An event in readable form. Its texts are not escaped.
struct TimelineLine {
  std::string what;  // such as "sign"
  std::string text;
  std::string detail;  // shown on a separate line below; mostly empty
  bool is_failure = false;
};

// The events of one run. Leaves out the events for which IsOfTheRun is false. In the lines of the
// events "sign" and "verify", a path below the directory of the file at `path` is shown without
// that directory. Equal events that follow each other are one line.
std::vector<TimelineLine> MakeTimeline(const Events& events, const std::string& path);

void PrintTimeline(const std::vector<TimelineLine>& lines, const Look& look, std::ostream& out);

}  // namespace simulator
