// The command line of apktoolkit-sim.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "simulator/installer/installer.h"
#include "simulator/run/file_list.h"
#include "simulator/run/simulator.h"
#include "simulator/show/presenter.h"
#include "simulator/verdict/gate.h"
#include "simulator/verdict/make_report.h"

namespace simulator {

struct Options {
  RunOptions run;
  InstallerOptions installer;
  JudgeOptions judge;
  GateOptions gate;
  ShowOptions show;
  bool verify = false;    // ask the kernel which files it trusts, and nothing else
  FileListOptions files;  // what the tool is run for: at least one name or a list
};

// Fills `options` from the command line. When the program should end instead, because of `--help`
// or of a mistake, which has then been reported, the result is its exit status.
std::optional<int> ParseOptions(int argc, char** argv, Options* options);

}  // namespace simulator
