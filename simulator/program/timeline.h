// The readable form of what happened, line by line and in order; nothing is left out.
#pragma once

#include <ostream>
#include <string>

#include "simulator/program/events.h"
#include "simulator/program/terminal.h"

// Prints the events of one run. Paths below the folder of the file at `path` are shown without it.
void PrintTimeline(const Events& events, const std::string& path, const Look& look,
                   std::ostream& out);
