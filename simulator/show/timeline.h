// The readable form of what happened, line by line and in order; nothing is left out.
#pragma once

#include <ostream>
#include <string>
#include <vector>

#include "simulator/run/events.h"
#include "simulator/show/terminal.h"

namespace simulator {

// How one thing that happened reads; texts come as they are.
struct TimelineLine {
  std::string what;  // such as "sign"
  std::string text;
  std::string detail;  // for a line of its own below; mostly empty
  bool is_failure = false;
};

// The events of one run. Paths below the directory of the file at `path` are shown without that
// directory. Equal events that follow each other are one line.
std::vector<TimelineLine> MakeTimeline(const Events& events, const std::string& path);

void PrintTimeline(const std::vector<TimelineLine>& lines, const Look& look, std::ostream& out);

}  // namespace simulator
