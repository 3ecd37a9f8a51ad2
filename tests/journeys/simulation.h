// Running the built programs as processes, on files in a folder that is the test's own.
#pragma once

#include <string>
#include <vector>

#include "support/der.h"

// A new empty folder, deleted with all that is in it at the end.
class Folder {
 public:
  // Below the system's folder for temporary files, or below `parent`.
  explicit Folder(const std::string& parent = {});
  ~Folder();
  Folder(const Folder&) = delete;
  Folder& operator=(const Folder&) = delete;

  const std::string& path() const { return path_; }
  // The path of `name` in the folder.
  std::string operator/(const std::string& name) const { return path_ + "/" + name; }
  // Writes a file, and makes the folders that it lies in. Returns its path.
  std::string Write(const std::string& name, const Bytes& content) const;

 private:
  std::string path_;
};

struct ProcessResult {
  int status;  // the exit status; 128 and the signal's number for a program that was killed
  std::string output;
  std::string errors;
};

// Runs a program, found through PATH when its name has no "/", in the folder `directory` (empty: in
// this one).
ProcessResult RunProcess(const std::vector<std::string>& command,
                         const std::string& directory = {});

struct Simulation {
  int status;            // of the simulator
  std::string timeline;  // see timeline.h
};

// Runs the tool on `file` in the simulated phone that `options` describe. A simulation that itself
// fails, or that writes anything on standard error, is a test failure.
Simulation Simulate(const std::string& file, const std::vector<std::string>& options = {});

// The same with more control: the whole command up to the simulator's options, and the folder.
struct Start {
  std::vector<std::string> before;  // such as {"unshare", "-m"}
  std::string directory;
};
Simulation Simulate(const std::string& file, const std::vector<std::string>& options,
                    const Start& start);

// Whether the built programs are for another processor and run under an emulator, which answers
// some questions in the kernel's place.
bool AreProgramsEmulated();

// The built programs.
std::string ToolPath();
std::string SimulatorPath();
