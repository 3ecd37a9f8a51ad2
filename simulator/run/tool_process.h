// Starts the tool with the stand-ins, which answer in place of the phone's kernel, log and libzu.
// Waits for the end of the tool.
#pragma once

#include <string>
#include <vector>

#include "simulator/run/process.h"

namespace simulator {

struct ToolCommand {
  std::vector<std::string> runner;  // an emulator and its options; empty: the tool starts directly
  std::string tool;
  std::string file;                      // the tool's one argument
  std::string kernel;                    // the library of the kernel's stand-in, loaded first
  std::vector<std::string> environment;  // NAME=VALUE; adds to or replaces this process's variables
};

struct ToolEnd {
  enum class How { kExited, kKilled, kStopped, kNotStarted };

  How how;
  int value;  // kExited: the status. kKilled: the signal. kNotStarted: the errno. Otherwise 0.
};

// Runs the command to its end. If the command still runs when deadline.HasPassed() becomes true,
// RunTool kills the command; the result is then kStopped. RunTool discards the command's standard
// output, because the library `kernel` records the tool's output in the journal. The command's
// standard input and standard error are those of this process.
ToolEnd RunTool(const ToolCommand& command, const Deadline& deadline);

// The program that RunTool starts: the first word of the runner, or the tool if there is no runner.
const std::string& ProgramOf(const ToolCommand& command);

// The directory of the running program, without a "/" at the end. The tool is in the same
// directory. The stand-ins are in ../lib/apktoolkit, relative to this directory. The layout is the
// same in the build tree and in an installation.
std::string ProgramDirectory();

}  // namespace simulator
