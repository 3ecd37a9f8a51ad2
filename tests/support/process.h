// Running programs.
#pragma once

#include <string>
#include <vector>

struct ProcessResult {
  int status;  // the exit status; 128 and the signal's number for a program that was killed
  std::string output;
  std::string errors;
};

// Runs a program, found through PATH when its name has no "/", in the directory `directory` (empty:
// in this one).
ProcessResult RunProcess(const std::vector<std::string>& command,
                         const std::string& directory = {});
