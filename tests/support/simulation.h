// Runs the simulator as a process, and gives the paths of the built programs.
#pragma once

#include <string>
#include <vector>

struct Simulation {
  int status;            // the exit status of the simulator
  std::string timeline;  // the events of the tool's run, as in expected_timeline.h
};

// Runs the tool on `file` in the simulated phone that `options` describe. Simulate and FirstLines
// pass --installer=off and --install=no to the simulator: no installer judges the file, and the
// file is not copied. The options of the test come later and can override these two options. The
// test fails if the simulation itself fails or writes anything to standard error.
Simulation Simulate(const std::string& file, const std::vector<std::string>& options = {});

// How Simulate and FirstLines start the simulator.
struct Start {
  std::vector<std::string> before;  // before the simulator's command, such as {"unshare", "-m"}
  std::string directory;            // the working directory; empty: that of the test
};
Simulation Simulate(const std::string& file, const std::vector<std::string>& options,
                    const Start& start);

// Runs the simulator with the arguments `words` in a UTF-8 locale, started as `start` says. Returns
// the first `count` lines of the output, and the simulator's exit status as a last line
// "-> STATUS".
std::vector<std::string> FirstLines(size_t count, const std::vector<std::string>& words,
                                    const Start& start);

// True if the built programs are for another processor and run under an emulator, which handles
// some system calls in place of the kernel.
bool AreProgramsEmulated();

// The paths of the built programs. Under an emulator, each path is that of a script that starts the
// program.
std::string ToolPath();
std::string SimulatorPath();
std::string VerifyPath();
