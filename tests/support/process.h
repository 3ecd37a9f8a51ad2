// Runs programs.
#pragma once

#include <string>
#include <vector>

struct ProcessResult {
  int status;  // the exit status; 128 and the signal's number for a program that was killed
  std::string output;
  std::string errors;
};

// Runs a program in `directory`, or in this process's directory if that is empty. A program's name
// without a "/" is looked up in PATH.
ProcessResult RunProcess(const std::vector<std::string>& command,
                         const std::string& directory = {});
