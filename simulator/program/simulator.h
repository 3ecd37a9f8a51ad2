// One phone for all the files of a command line: its journal, what its kernel has signed so far,
// and the runs of the tool inside it.
#pragma once

#include <string>

#include "simulator/program/options.h"
#include "simulator/program/state.h"
#include "simulator/program/verdict.h"

class Simulator {
 public:
  explicit Simulator(const Options& options);
  ~Simulator();
  Simulator(const Simulator&) = delete;
  Simulator& operator=(const Simulator&) = delete;

  // Opens the journal and the state and looks for the stand-ins. False, with `error` set to what
  // to tell the user, when the simulation cannot begin.
  bool Prepare(std::string* error);

  // Runs the tool for `file` and sets `events` to what happened. False, with `error` set, when
  // the tool did not run inside the stand-ins to its end.
  bool Run(const std::string& file, Events* events, std::string* error);

  // All that was recorded so far, as it stands in the journal.
  std::string Journal() const;

 private:
  bool OpenJournalFile();
  bool RunTool(const std::string& file, const std::string& path, std::string* error);
  PhoneSettings PhoneFor(const std::string& path) const;
  std::string PreloadName();
  Events EventsFrom(size_t offset) const;
  bool RememberSigned(const Events& events);

  const Options& options_;
  const std::string kernel_;  // the path of the kernel stand-in
  SignedBytes signed_;
  int journal_ = -1;
  int kernel_descriptor_ = -1;  // opened when it is needed
};
