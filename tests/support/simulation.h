// Running the built programs as processes.
#pragma once

#include <string>
#include <vector>

struct Simulation {
  int status;            // of the simulator
  std::string timeline;  // see expected_timeline.h
};

// Runs the tool on `file` in the simulated phone that `options` describe. A simulation that itself
// fails, or that writes anything on standard error, is a test failure.
Simulation Simulate(const std::string& file, const std::vector<std::string>& options = {});

// The same with more control: the whole command up to the simulator's options, and the directory.
struct Start {
  std::vector<std::string> before;  // such as {"unshare", "-m"}
  std::string directory;
};
Simulation Simulate(const std::string& file, const std::vector<std::string>& options,
                    const Start& start);

// The first lines that a person sees who reads UTF-8 and runs the simulator with these words in the
// directory `directory`; and its exit status, as a last line "-> STATUS".
std::vector<std::string> FirstLines(size_t count, const std::vector<std::string>& words,
                                    const Start& start);

// Whether the built programs are for another processor and run under an emulator, which answers
// some questions in the kernel's place.
bool AreProgramsEmulated();

// The built programs.
std::string ToolPath();
std::string SimulatorPath();
std::string VerifyPath();
