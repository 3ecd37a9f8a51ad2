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
  bool verify = false;    // only ask the kernel which files it trusts
  FileListOptions files;  // the files for the tool: at least one name or a list
};

// Fills `options` from the command line. Returns the exit status if the program must end: after
// `--help`, after `--version`, or after an error. The text for the user is then already printed.
// Otherwise returns no value.
std::optional<int> ParseOptions(int argc, char** argv, Options* options);

}  // namespace simulator
