// apktoolkit-sim: the phone that apktoolkit runs in, on a workstation.
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <iostream>

#include "simulator/program/options.h"
#include "simulator/program/simulator.h"
#include "simulator/program/timeline.h"

namespace {

bool WantsColours() { return isatty(STDOUT_FILENO) != 0 && getenv("NO_COLOR") == nullptr; }

}  // namespace

int main(int argc, char** argv) {
  Options options;
  if (const auto status = ParseOptions(argc, argv, &options)) return *status;

  Simulator simulator(options);
  int status = kAllSigned;
  std::string error;
  if (!simulator.Prepare(&error)) {
    std::cerr << "apktoolkit-sim: " << error << '\n';
    return kCannotSimulate;
  }
  for (const std::string& file : options.files) {
    Events events;
    const bool ran = simulator.Run(file, &events, &error);
    const Verdict verdict = Judge(events);
    if (!ran) {
      std::cout.flush();
      std::cerr << "apktoolkit-sim: " << error << '\n';
    } else if (!options.json) {
      PrintTimeline(file, events, verdict, WantsColours(), std::cout);
    }
    status = std::max(status, !ran                      ? kCannotSimulate
                              : verdict.reasons.empty() ? kAllSigned
                                                        : kRefused);
  }
  if (options.json) std::cout << simulator.Journal();
  return status;
}
