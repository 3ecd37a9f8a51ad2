// One phone for all the files of a command line: what its kernel has signed so far, and the runs of
// the tool inside it.
#pragma once

#include <string>

#include "simulator/options.h"
#include "simulator/run/signed_bytes.h"
#include "simulator/run/tool_process.h"
#include "simulator/verdict/make_report.h"

// What came of one file.
struct Outcome {
  Report report;
  std::string journal;  // the lines of this run, from "start" to "verdict"
};

class Simulator {
 public:
  Simulator(const Options& options, bool has_standard_input);
  ~Simulator();
  Simulator(const Simulator&) = delete;
  Simulator& operator=(const Simulator&) = delete;

  // Opens the state and looks for the stand-ins and the tool. False, with `error` set to what to
  // tell the user, when the simulation cannot begin.
  bool Prepare(std::string* error);

  // Runs the tool for `file`. May be called from several threads when the options have several
  // jobs.
  Outcome Run(const std::string& file);

 private:
  // One run on its way: what it needs, and what is to be told of it.
  struct Task;

  void RunTool(const std::string& file, Task* task);
  PhoneSettings PhoneFor(const Task& task);
  std::string PreloadName() const;
  void RememberSigned(const Events& events, Task* task);
  std::string SecondsText() const;

  const Options& options_;
  const bool has_standard_input_;
  const std::string kernel_;  // the path of the kernel stand-in
  SignedBytes signed_;
  int kernel_descriptor_ = -1;
};
