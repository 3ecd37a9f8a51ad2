#include "support/simulation.h"

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>
#include <sstream>

#include "support/process.h"

namespace {

// The journal without the log records of the platform libraries. The events about the simulation
// itself, which come before and after all others, are also left out.
std::string TimelineOf(const std::string& journal) {
  std::istringstream lines(journal);
  std::string line;
  for (const char* event : {"journal", "start", "attached"}) {
    std::getline(lines, line);
    EXPECT_EQ(nlohmann::json::parse(line, nullptr, false).value("event", ""), event) << line;
  }
  std::string timeline;
  while (std::getline(lines, line)) {
    const nlohmann::json event = nlohmann::json::parse(line, nullptr, false);
    if (event.value("event", "") == "verdict") break;
    if (event.value("tag", "ApkToolkit") == "ApkToolkit") timeline += event.dump() + "\n";
  }
  EXPECT_FALSE(std::getline(lines, line)) << "after the verdict: " << line;
  return timeline;
}

}  // namespace

Simulation Simulate(const std::string& file, const std::vector<std::string>& options) {
  return Simulate(file, options, {});
}

Simulation Simulate(const std::string& file, const std::vector<std::string>& options,
                    const Start& start) {
  std::vector<std::string> command = start.before;
  command.insert(command.end(), {SimulatorPath(), "--installer=off", "--install=no", "--json"});
  command.insert(command.end(), options.begin(), options.end());
  command.push_back(file);
  const ProcessResult run = RunProcess(command, start.directory);
  EXPECT_EQ(run.errors, "");
  EXPECT_TRUE(run.status != 2 && run.status != 3) << "the simulation itself failed";
  return {run.status, TimelineOf(run.output)};
}

std::vector<std::string> FirstLines(size_t count, const std::vector<std::string>& words,
                                    const Start& start) {
  std::vector<std::string> command = start.before;
  command.insert(command.end(),
                 {"env", "LC_ALL=C.UTF-8", SimulatorPath(), "--installer=off", "--install=no"});
  command.insert(command.end(), words.begin(), words.end());
  const ProcessResult run = RunProcess(command, start.directory);
  std::vector<std::string> lines;
  std::istringstream text(run.output);
  for (std::string line; lines.size() < count && std::getline(text, line);) lines.push_back(line);
  lines.push_back("-> " + std::to_string(run.status));
  return lines;
}

bool AreProgramsEmulated() { return *APKTOOLKIT_RUNNER != '\0'; }

std::string ToolPath() { return APKTOOLKIT_PATH; }

std::string SimulatorPath() { return APKTOOLKIT_SIM_PATH; }

std::string VerifyPath() { return APKTOOLKIT_VERIFY_PATH; }
