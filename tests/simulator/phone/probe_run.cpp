#include "simulator/phone/probe_run.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <iterator>
#include <sstream>

#include "support/process.h"
#include "support/simulation.h"

namespace {

std::string Join(const Lines& lines) {
  std::string text;
  for (const std::string& line : lines) text += line + "\n";
  return text;
}

}  // namespace

Probe::Probe(const Lines& commands) { directory_.Write("script", ToBytes(Join(commands))); }

ProbeRun Probe::Run(const Lines& options) const {
  Lines command = {SimulatorPath(), "--json", "--tool", PROBE_PATH};
  command.insert(command.end(), options.begin(), options.end());
  command.push_back(path());
  const ProcessResult result = RunProcess(command);
  ProbeRun run;
  run.status = result.status;
  run.errors = result.errors;
  run.results = LinesOf(ContentOf(path() + ".out"));
  // The first line is not the result of a command. It has the descriptor that the probe got for the
  // file of commands.
  EXPECT_EQ(run.results.empty() ? "" : run.results[0], "fd 3");
  if (!run.results.empty()) run.results.erase(run.results.begin());
  run.events = ParseJournal(result.output);
  const std::vector<std::string> preamble = {"journal", "start", "attached"};
  for (const std::string& kind : preamble) {
    if (run.events.empty()) break;
    EXPECT_EQ(run.events.front()["event"], kind);
    run.events.erase(run.events.begin());
  }
  if (!run.events.empty() && run.events.back()["event"] == "verdict") run.events.pop_back();
  return run;
}

std::vector<Json> OfKind(const std::vector<Json>& events, const std::string& kind) {
  std::vector<Json> chosen;
  std::copy_if(events.begin(), events.end(), std::back_inserter(chosen),
               [&kind](const Json& event) { return event["event"] == kind; });
  return chosen;
}

std::vector<Json> ParseJournal(const std::string& journal) {
  std::vector<Json> events;
  for (const std::string& line : LinesOf(journal)) {
    Json event = Json::parse(line, nullptr, false);
    EXPECT_TRUE(event.is_object()) << line;
    events.push_back(std::move(event));
  }
  return events;
}

Lines LinesOf(const std::string& text) {
  Lines lines;
  std::istringstream stream(text);
  for (std::string line; std::getline(stream, line);) lines.push_back(line);
  return lines;
}
