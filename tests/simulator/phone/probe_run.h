// Runs the probe inside the simulated phone. The probe (probe.cpp) is a program that executes the
// commands of a file.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "support/files.h"

using Lines = std::vector<std::string>;
using Json = nlohmann::json;

struct ProbeRun {
  int status = 0;            // of apktoolkit-sim
  std::string errors;        // the standard error of apktoolkit-sim and of the probe
  Lines results;             // "RESULT ERRNO" for each command; errno is 77 before each command
  std::vector<Json> events;  // the journal after "attached", without "verdict"
};

// A file of commands for the probe. The file is in its own new directory.
class Probe {
 public:
  explicit Probe(const Lines& commands);

  ProbeRun Run(const Lines& options = {}) const;
  // The resolved path of the file of commands.
  std::string path() const { return directory_ / "script"; }
  const TempDir& directory() const { return directory_; }

 private:
  TempDir directory_;
};

// The events whose member "event" is `kind`.
std::vector<Json> OfKind(const std::vector<Json>& events, const std::string& kind);

// One JSON object for each line of `journal`. A line that is not a JSON object fails the test.
std::vector<Json> ParseJournal(const std::string& journal);

Lines LinesOf(const std::string& text);
