// Runs programs.
#pragma once

#include <string>
#include <vector>

struct ProcessResult {
  int status;  // the exit status, or 128 plus the number of the signal that ended the program
  std::string output;
  std::string errors;
};

// Runs a program in `directory`, or in this process's directory if `directory` is empty. A
// program's name without a "/" is looked up in PATH.
ProcessResult RunProcess(const std::vector<std::string>& command,
                         const std::string& directory = {});
