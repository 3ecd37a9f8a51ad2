// Starts the tool with the stand-ins, which answer in place of the phone's kernel, log and libzu.
// Waits for the end of the tool.
#pragma once

#include <string>
#include <vector>

#include "simulator/run/process.h"

namespace simulator {

struct ToolCommand {
  std::vector<std::string> runner;  // words before the tool, such as an emulator's; mostly none
  std::string tool;
  std::string file;                      // the tool's one argument
  std::string kernel;                    // the library that is loaded before all others
  std::vector<std::string> environment;  // NAME=VALUE; adds to or replaces this process's variables
};

struct ToolEnd {
  enum class How { kExited, kKilled, kStopped, kNotStarted };

  How how;
  int value;  // kExited: the status. kKilled: the signal. kNotStarted: the errno. Otherwise 0.
};

// Runs the command to its end, or kills it after the deadline. Discards the command's standard
// output, because a stand-in records it in the journal. The command's standard input and standard
// error are those of this process.
ToolEnd RunTool(const ToolCommand& command, const Deadline& deadline);

// The program that is started: the runner, or else the tool.
const std::string& ProgramOf(const ToolCommand& command);

// The directory of this program, without a "/" at the end. The tool is in the same directory, and
// the stand-ins are in ../lib/apktoolkit, both in the build tree and in an installation.
std::string ProgramDirectory();

}  // namespace simulator
