// Runs the built programs as processes.
#pragma once

#include <string>
#include <vector>

struct Simulation {
  int status;            // of the simulator
  std::string timeline;  // see expected_timeline.h
};

// Runs the tool on `file` in the simulated phone that `options` describe. Simulate and FirstLines
// pass --installer=off and --install=no to the simulator. The options of the test come later and
// can override these two options. Most tests check the tool's own answers about files in the places
// where the test put them. The test fails if the simulation itself fails or writes anything to
// standard error.
Simulation Simulate(const std::string& file, const std::vector<std::string>& options = {});

// The same, with words before the simulator's command and with a working directory.
struct Start {
  std::vector<std::string> before;  // such as {"unshare", "-m"}
  std::string directory;
};
Simulation Simulate(const std::string& file, const std::vector<std::string>& options,
                    const Start& start);

// Runs the simulator with these words in the directory of `start`, in a UTF-8 locale. Returns the
// first `count` lines of its output, and its exit status as a last line "-> STATUS".
std::vector<std::string> FirstLines(size_t count, const std::vector<std::string>& words,
                                    const Start& start);

// True if the built programs are for another processor and run under an emulator, which handles
// some system calls in place of the kernel.
bool AreProgramsEmulated();

// The paths of the built programs.
std::string ToolPath();
std::string SimulatorPath();
std::string VerifyPath();
