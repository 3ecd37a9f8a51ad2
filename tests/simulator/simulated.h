// Runs apktoolkit-sim, with apktoolkit or with the probe (tests/simulator/phone/probe.cpp) as the
// tool. The probe executes a test's commands.
#pragma once

#include <algorithm>

#include "simulator/phone/probe_run.h"
#include "support/process.h"
#include "support/simulation.h"

// Runs apktoolkit-sim in a UTF-8 locale. By default, the phone's installer is not asked, and the
// libraries of packages are not extracted. Options in `words` can change these defaults.
inline ProcessResult Told(const Lines& words) {
  Lines command = {"env", "LC_ALL=C.UTF-8", SimulatorPath(), "--installer=off", "--install=no"};
  command.insert(command.end(), words.begin(), words.end());
  return RunProcess(command);
}

// Like Told, but with the probe as the tool.
inline ProcessResult Simulated(Lines words) {
  words.insert(words.begin(), {"--tool", PROBE_PATH});
  return Told(words);
}

// The first `count` lines of the output.
inline Lines FirstLines(const ProcessResult& result, size_t count) {
  Lines lines = LinesOf(result.output);
  lines.resize(std::min(lines.size(), count));
  return lines;
}

// Runs `script` in the shell. In the script, "$@" is the command that runs the simulator with the
// probe as the tool, followed by `words`.
inline ProcessResult InShell(const std::string& script, const Lines& words) {
  Lines command = {"bash", "-c", script, "bash", SimulatorPath(), "--tool", PROBE_PATH};
  command.insert(command.end(), words.begin(), words.end());
  return RunProcess(command);
}
