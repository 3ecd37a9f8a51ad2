// The command line of apktoolkit-sim.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "simulator/phone/settings.h"
#include "simulator/run/installation.h"
#include "simulator/show/report_text.h"

// The exit statuses, for scripts. Of several files, the highest counts.
inline constexpr int kAllSigned = 0;
inline constexpr int kRefused = 1;
inline constexpr int kUsageError = 2;
inline constexpr int kCannotSimulate = 3;
inline constexpr int kNotLookedAt = 4;

struct Options {
  PhoneSettings phone;              // all but its journal and its trusted files
  std::vector<std::string> trust;   // existing files that the kernel trusts
  std::string state;                // the directory that remembers what was signed; may be empty
  std::optional<InstalledAbi> abi;  // whose libraries are laid out; none: the file stays as it lies
  bool is_strict = false;           // a library that is not there counts as refused
  Detail detail = Detail::kUsual;   // of the text
  std::string journal;              // where the journal is kept; empty: it is not
  std::string html;                 // where the page is written; empty: it is not
  bool json = false;                // the journal on standard output in place of the text
  unsigned jobs = 1;                // how many files at a time
  std::string tool;                 // the program that is run
  std::vector<std::string> runner;  // words before the tool, such as an emulator's
  double timeout = 30;              // seconds, for each file
  std::vector<std::string> files;   // what the tool is run for; at least one
};

// Fills `options` from the command line. When the program should end instead, because of `--help`
// or of a mistake, which has then been reported, the result is its exit status.
std::optional<int> ParseOptions(int argc, char** argv, Options* options);
