// The report of a run for programs that read test results: one JUnit document with a test case for
// each file. A file with the exit status kSomeRefused (exit_status.h) is a failure. A file that the
// tool did not look at, or whose run could not be simulated, is an error. No case is ever skipped.
// All texts from a file are escaped.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "simulator/verdict/report.h"

namespace simulator {

// The beginning of each document.
inline constexpr std::string_view kJunitStart =
    "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<!-- A JUnit report of apktoolkit-sim -->\n";

class Junit {
 public:
  // Adds the next file, in the order of the command line.
  void Add(const Report& report);

  // The whole document, in UTF-8.
  std::string Xml() const;

 private:
  enum class Outcome { kPassed, kFailure, kError };

  struct Case {
    std::string name;
    Outcome outcome;
    std::string type;     // the reason's code; without a reason, the verdict's; empty if passed
    std::string message;  // the verdict and the reason in words; empty if passed
    std::string text;     // what was refused, each warning, and what to do
  };

  size_t Count(Outcome outcome) const;

  std::vector<Case> cases_;
};

}  // namespace simulator
