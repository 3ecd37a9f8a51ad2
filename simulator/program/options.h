// The command line of apktoolkit-sim.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "simulator/phone/settings.h"

// The exit statuses, for scripts. Of several files, the highest counts.
inline constexpr int kAllSigned = 0;
inline constexpr int kRefused = 1;
inline constexpr int kUsageError = 2;
inline constexpr int kCannotSimulate = 3;

struct Options {
  PhoneSettings phone;              // all but its journal and its trusted files
  std::vector<std::string> trust;   // existing files that the kernel trusts
  std::string state;                // the directory that remembers what was signed; may be empty
  std::string journal;              // where the journal is kept; empty: it is not
  bool json = false;                // the journal on standard output in place of the timeline
  std::string tool;                 // the program that is run
  std::vector<std::string> runner;  // words before the tool, such as an emulator's
  double timeout = 0;               // seconds
  std::vector<std::string> files;   // what the tool is run for, one by one; at least one
};

// Fills `options` from the command line. When the program should end instead, because of `--help`
// or of a mistake, which has then been reported, the result is its exit status.
std::optional<int> ParseOptions(int argc, char** argv, Options* options);
