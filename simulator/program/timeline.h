// The readable form of a run: the verdict first, then what happened, line by line.
#pragma once

#include <ostream>
#include <string>

#include "simulator/program/verdict.h"

// Prints the run of `file` that `events` tell and `verdict` sums up, with colours or without.
void PrintTimeline(const std::string& file, const Events& events, const Verdict& verdict,
                   bool colours, std::ostream& out);
