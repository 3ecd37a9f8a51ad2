// One phone for all files of a command line. It remembers which files its kernel has signed, and
// runs the tool for each file.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "simulator/package/facts.h"
#include "simulator/phone/settings.h"
#include "simulator/run/file_list.h"
#include "simulator/run/installation.h"
#include "simulator/run/run_record.h"
#include "simulator/run/signed_bytes.h"
#include "util/scoped_fd.h"

namespace simulator {

// The phone, and how the tool is run in it.
struct RunOptions {
  PhoneSettings phone;             // without the journal and the trusted files
  std::vector<std::string> trust;  // existing files that the kernel trusts
  std::string state;               // the directory for --state; an empty text: none
  InstallWhen install = InstallWhen::kAlone;
  InstalledAbi abi = InstalledAbi::kPreferred;  // the ABIs whose libraries are extracted
  unsigned jobs = 1;                            // the greatest number of simultaneous runs
  std::string tool;                             // the program that is run
  bool is_own_tool = false;                     // `tool` is from the simulator's own directory
  std::vector<std::string> runner;              // put before the tool: an emulator with its options
  double timeout = 30;                          // seconds, for each file
};

// The results of one run. MakeReport judges them.
struct FileRun {
  RunRecord record;
  PackageFacts facts;  // of the file that the tool was given, which may be in an Installation
  // The lines of this run, from "start" on. If the tool started, the last line is "exit".
  std::string journal;
};

class Simulator {
 public:
  Simulator(const RunOptions& options, bool has_standard_input);

  // Opens the state directory. Looks for the tool and for the kernel stand-in, which is the library
  // that answers in place of the kernel. Returns none on success, else the reason of the failure.
  std::optional<std::string> Prepare();

  // Runs the tool for `file` if file.state is kToRun. If the run fails, record.failure has the
  // reason. If file.state is not kToRun, the result has only the file's name and path, and the
  // reason why the tool was not run. If RunOptions::jobs is more than 1, several threads may call
  // Run() at the same time.
  FileRun Run(const ListedFile& file);

 private:
  // A run in progress: the time limit, the journal, the file's path, and the reason of a failure.
  struct Task;

  void RunToolFor(const std::string& file, Task* task);
  PhoneSettings PhoneFor(const Task& task);
  std::string PreloadName() const;
  void RememberSigned(const Events& events, Task* task);
  void Fail(Failure::Kind kind, const std::string& detail, Task* task) const;

  const RunOptions& options_;
  const bool has_standard_input_;
  const std::string kernel_;  // the path of the kernel stand-in
  SignedBytes signed_;
  std::optional<ScopedFd> kernel_descriptor_;
  std::string tool_sha256_;
};

}  // namespace simulator
