// The command line of apktoolkit-sim.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "simulator/run/simulator.h"
#include "simulator/show/report_text.h"
#include "simulator/verdict/make_report.h"

namespace simulator {

// The exit statuses, for scripts. Of several files, the highest counts.
inline constexpr int kAllSigned = 0;
inline constexpr int kRefused = 1;
inline constexpr int kUsageError = 2;
inline constexpr int kCannotSimulate = 3;
inline constexpr int kNotLookedAt = 4;

struct Options {
  RunOptions run;
  JudgeOptions judge;
  Detail detail = Detail::kUsual;  // of the text
  std::string journal;             // where the journal is kept; empty: it is not
  std::string html;                // where the page is written; empty: it is not
  bool json = false;               // the journal on standard output in place of the text
  bool verify = false;             // ask the kernel which files it trusts, and nothing else
  std::vector<std::string> files;  // what the tool is run for; at least one
};

// Fills `options` from the command line. When the program should end instead, because of `--help`
// or of a mistake, which has then been reported, the result is its exit status.
std::optional<int> ParseOptions(int argc, char** argv, Options* options);

}  // namespace simulator
