#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>

#include "simulator/phone/probe_run.h"
#include "support/der.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

// Runs apktoolkit-sim with the probe as the tool.
ProcessResult Simulated(const Lines& words) {
  Lines command = {SimulatorPath(), "--tool", PROBE_PATH};
  command.insert(command.end(), words.begin(), words.end());
  return RunProcess(command);
}

}  // namespace

TEST(ExitStatus, ZeroWhenAllWasSigned) {
  const Probe probe({"sign 3 0100ab"});
  const ProcessResult result = Simulated({probe.path()});
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.errors, "");
  EXPECT_EQ(LinesOf(result.output)[0], "SIGNED " + probe.path() + ": the package");
}

TEST(ExitStatus, OneWhenSomethingWasRefused) {
  const Probe probe({"log 6 ApkToolkit 61", "log 6 ApkToolkit 62"});
  const ProcessResult result = Simulated({probe.path()});
  EXPECT_EQ(result.status, 1);
  EXPECT_EQ(result.errors, "");
  EXPECT_EQ(LinesOf(result.output)[0], "REFUSED " + probe.path() + ": a|5");
}

TEST(ExitStatus, OneWhenTheToolWasKilled) {
  const Probe probe({"sign 3 0100ab", "kill 9"});
  const ProbeRun run = probe.Run();
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.events.back(), Json({{"event", "exit"}, {"signal", 9}}));
}

TEST(ExitStatus, OneWhenTheToolFailed) {
  const ProbeRun run = Probe({"sign 3 0100ab", "exit 3"}).Run();
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.events.back(), Json({{"event", "exit"}, {"status", 3}}));
}

TEST(ExitStatus, OneForAFileThatIsNotThere) {
  const ProcessResult result = RunProcess({SimulatorPath(), "/nowhere/base.apk"});
  EXPECT_EQ(result.status, 1);
  EXPECT_EQ(LinesOf(result.output)[0],
            "REFUSED /nowhere/base.apk: the tool left it alone: it cannot be opened, or lies on a "
            "read-only file system");
}

TEST(ExitStatus, ThreeWhenTheToolDoesNotEnd) {
  const ProbeRun run = Probe({"sign 3 0100ab", "sleep 60"}).Run({"--timeout", "3"});
  EXPECT_EQ(run.status, 3);
  EXPECT_EQ(run.errors, std::string("apktoolkit-sim: ") + PROBE_PATH +
                            " was still running after 3 seconds and was killed (it waits for ever "
                            "while its integrity value is ffffffff)\n");
  EXPECT_EQ(run.events.back(), Json({{"event", "exit"}, {"signal", 9}}));
}

TEST(ExitStatus, ThreeWhenThereIsNoTool) {
  const ProcessResult result = RunProcess({SimulatorPath(), "--tool", "/nowhere/tool", "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors, "apktoolkit-sim: cannot run /nowhere/tool: No such file or directory\n");
}

TEST(ExitStatus, ThreeWhenTheToolIsNoProgram) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "the emulator starts, and not the tool";
  const TempDir folder;
  const std::string tool = folder.Write("tool", ToBytes("\177ELF"));
  ASSERT_EQ(chmod(tool.c_str(), 0755), 0);
  const ProcessResult result = RunProcess({SimulatorPath(), "--tool", tool, "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors, "apktoolkit-sim: cannot start " + tool + ": Exec format error\n");
}

TEST(ExitStatus, ThreeWhenTheStandInsAreNotInTheTool) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "the emulator hides that a program does not start";
  const TempDir folder;
  // What the loader would be told is lost on the way.
  const std::string tool = folder.Write("tool", ToBytes("#!/usr/bin/env -S -u LD_PRELOAD true\n"));
  ASSERT_EQ(chmod(tool.c_str(), 0755), 0);
  const ProcessResult result =
      RunProcess({SimulatorPath(), "--runner", "/nowhere/emulator", "--tool", tool, "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors,
            "apktoolkit-sim: cannot start " + tool + ": No such file or directory\n");
  const ProcessResult runner =
      RunProcess({SimulatorPath(), "--runner", "true", "--tool", tool, "/"});
  EXPECT_EQ(runner.status, 3);
  EXPECT_EQ(runner.errors, "apktoolkit-sim: the stand-ins were not loaded into " + tool + "\n");
}

TEST(ExitStatus, ThreeWhenTheJournalCannotBeWritten) {
  const ProcessResult result = Simulated({"--journal", "/nowhere/journal", "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors,
            "apktoolkit-sim: cannot write the journal /nowhere/journal: No such file "
            "or directory\n");
}

TEST(ExitStatus, ThreeWhenTheStateCannotBeKept) {
  const ProcessResult result = Simulated({"--state", "/dev/null", "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors, "apktoolkit-sim: cannot use the directory /dev/null\n");
}

TEST(ExitStatus, IsTheHighestOfAllFiles) {
  const Probe good({"sign 3 0000"});
  const Probe bad({"verify 3"});
  EXPECT_EQ(Simulated({good.path(), good.path()}).status, 0);
  const ProcessResult result = Simulated({good.path(), bad.path(), good.path()});
  EXPECT_EQ(result.status, 1);
  const std::string verdict = "REFUSED " + bad.path() + ": the kernel does not trust it (ENOKEY";
  EXPECT_NE(result.output.find("\n" + verdict), std::string::npos) << result.output;
}

TEST(Journal, StartsWithTheVersionTheFileAndTheProcess) {
  const TempDir folder;
  const std::string file = folder.Write("script", ToBytes("sign 3 0000\n"));
  const ProcessResult result =
      RunProcess({SimulatorPath(), "--json", "--tool", PROBE_PATH, "./script"}, folder.path());
  std::vector<Json> events = ParseJournal(result.output);
  ASSERT_EQ(events.size(), 5U);
  EXPECT_EQ(LinesOf(result.output)[0], "{\"event\":\"journal\",\"version\":1}");
  EXPECT_EQ(events[1], Json({{"event", "start"}, {"file", "./script"}, {"path", file}}));
  EXPECT_GT(events[2]["pid"], 1);
  EXPECT_EQ(events[3]["event"], "sign");
  EXPECT_EQ(LinesOf(result.output)[4], "{\"event\":\"exit\",\"status\":0}");
}

TEST(Journal, IsKeptInAFileAnew) {
  const Probe probe({"sign 3 0000"});
  const std::string file = probe.folder().Write("journal", ToBytes("from before\n"));
  const ProcessResult kept = Simulated({"--journal", file, probe.path()});
  EXPECT_EQ(LinesOf(kept.output)[0], "SIGNED " + probe.path() + ": the JAR");
  const ProcessResult both = Simulated({"--json", "--journal", file, probe.path()});
  EXPECT_EQ(ContentOf(file), both.output);
  EXPECT_EQ(ParseJournal(both.output).size(), 5U);
}

TEST(Journal, FileNamesAreBytes) {
  const TempDir folder;
  const std::string odd = folder.Write("od\xe9\n\"d", ToBytes("sign 3 0000\n"));
  const ProcessResult result = Simulated({"--json", odd});
  EXPECT_EQ(result.status, 0);
  const std::vector<Json> events = ParseJournal(result.output);
  ASSERT_EQ(events.size(), 5U);
  EXPECT_EQ(events[3]["path"], folder / "od\uf7e9\n\"d");
}

TEST(Simulation, FollowsLinksToTheFile) {
  const Probe probe({"sign 3 0000"});
  const std::string link = probe.folder() / "link";
  ASSERT_EQ(symlink("script", link.c_str()), 0);
  EXPECT_EQ(Simulated({link}).status, 0);
}

TEST(Simulation, WorksFromAFolderThatTheLoaderCannotName) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "the copies cannot be started by themselves";
  namespace fs = std::filesystem;
  const TempDir folder;
  const std::string place = folder / "with space: and colon";
  const fs::path built = fs::path(SimulatorPath()).parent_path().parent_path();
  fs::create_directories(place + "/bin");
  fs::create_directories(place + "/lib");
  fs::copy(built / "lib/apktoolkit", place + "/lib/apktoolkit");
  for (const char* name : {"apktoolkit-sim", "simulator_probe"}) {
    fs::copy(built / "bin" / name, place + "/bin/" + name);
  }
  const Probe probe({"sign 3 0000", "register 3 name ab"});
  const ProcessResult result = RunProcess(
      {place + "/bin/apktoolkit-sim", "--tool", place + "/bin/simulator_probe", probe.path()});
  EXPECT_EQ(result.status, 0) << result.errors;
  EXPECT_EQ(LinesOf(result.output)[0], "SIGNED " + probe.path() + ": the JAR, 1 key registered");
}

TEST(Simulation, RunnerGetsThePreloadForTheTool) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "there is a runner already";
  const Probe probe({"sign 3 0000"});
  // Does what an emulator does with -E, and tells what it was given itself.
  const std::string runner =
      probe.folder().Write("runner", ToBytes("#!/bin/sh\n"
                                             "echo \"$1 $2 ${3%%=*} preload=$LD_PRELOAD\" >&2\n"
                                             "shift 2\n"
                                             "exec env \"$@\"\n"));
  ASSERT_EQ(chmod(runner.c_str(), 0755), 0);
  const ProcessResult result = Simulated({"--runner", runner + " --flag", probe.path()});
  EXPECT_EQ(result.errors, "--flag -E LD_PRELOAD preload=\n");
  EXPECT_EQ(result.status, 0);
}

TEST(Simulation, HandsNoOpenFileOfTheCallersToTheTool) {
  const Probe probe({"sign 3 0000"});
  const ProcessResult result =
      RunProcess({"bash", "-c", "exec 3</dev/null 7</dev/null; exec \"$@\"", "bash",
                  SimulatorPath(), "--json", "--tool", PROBE_PATH, probe.path()});
  // The probe opens its file first, as the tool does.
  const std::vector<Json> events = OfKind(ParseJournal(result.output), "sign");
  ASSERT_EQ(events.size(), 1U);
  EXPECT_EQ(events[0]["path"], probe.path());
  EXPECT_EQ(result.status, 0) << result.errors;
}

TEST(State, WhatWasSignedStaysTrustedWhileItsBytesStayTheSame) {
  const TempDir state;
  const Probe jar({"verify 3", "sign 3 0000"});
  EXPECT_EQ(jar.Run({"--state", state.path()}).status, 1);
  EXPECT_EQ(jar.Run({"--state", state.path()}).status, 0);
  // One byte changed.
  jar.folder().Write("script", ToBytes("verify 3\nsign 3 0001\n"));
  EXPECT_EQ(jar.Run({"--state", state.path()}).results[0], "-1 126");
}

TEST(State, WhatWasNotSignedIsNotTrusted) {
  const TempDir state;
  const Probe jar({"verify 3", "sign 3 0000"});
  EXPECT_EQ(jar.Run({"--state", state.path(), "--sign-errno", "EPERM"}).status, 1);
  EXPECT_EQ(jar.Run({"--state", state.path()}).results[0], "-1 126");
}

TEST(State, LastsForTheFilesOfOneRunWithoutADirectory) {
  const Probe jar({"verify 3", "sign 3 0000"});
  const ProcessResult result = Simulated({"--json", jar.path(), jar.path()});
  const std::vector<Json> verified = OfKind(ParseJournal(result.output), "verify");
  ASSERT_EQ(verified.size(), 2U);
  EXPECT_EQ(verified[0]["result"], -1);
  EXPECT_EQ(verified[1]["result"], 0);
}

TEST(Tool, RunsAsItIsOnAFileThatIsNoZip) {
  const TempDir folder;
  const std::string file = folder.Write("note.txt", ToBytes("hello\n"));
  const ProcessResult result = RunProcess({SimulatorPath(), file});
  EXPECT_EQ(result.status, 1);
  EXPECT_EQ(result.errors, "");
  EXPECT_EQ(result.output, "REFUSED " + file + ": OpenArchiveFd(3) [file: " + file +
                               "] returned: -3: Invalid file\n"
                               "   1  error      OpenArchiveFd(3) [file: " +
                               file +
                               "] returned: -3: Invalid file\n"
                               "   2  log        VeltSignJni starts: 3.\n"
                               "   3  error      VeltSignJni: malformed apk: " +
                               file +
                               "\n"
                               "   4  log        VeltSign starts: zip_fd = 3, fd = 3.\n"
                               "   5  error      Zip archive is not valid for fd=3\n"
                               "   6  exit       status 0\n");
}
