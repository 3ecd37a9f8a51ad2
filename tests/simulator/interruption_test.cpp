// How apktoolkit-sim ends after a signal, or after the reader of its output has ended.
#include <gtest/gtest.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <sstream>

#include "simulator/simulated.h"
#include "support/package.h"

namespace {

// Runs a command in its own process group. As soon as a file that matches `pattern` is not empty,
// sends `signal` to the command, or to the whole group as Ctrl+C does. `ended_by` is the
// signal that ended the command (0 or less if none did). `seconds` is the time from the signal to
// the end of the command.
struct Interrupted {
  enum class Target { kCommand, kGroup };

  Interrupted(const std::string& pattern, const Lines& words, int signal = SIGTERM,
              Target target = Target::kCommand) {
    const TempDir directory;
    const std::string out = directory / "out";
    Lines command = {"python3",
                     "-c",
                     R"(
import glob, os, signal, subprocess, sys, time
out, pattern, number, target, command = *sys.argv[1:3], int(sys.argv[3]), sys.argv[4], sys.argv[5:]
signal.signal(number, signal.SIG_DFL)
child = subprocess.Popen(command, stdout=open(out, "w"), start_new_session=True)
while child.poll() is None and not any(os.path.getsize(name) for name in glob.glob(pattern)):
    time.sleep(0.02)
begin = time.monotonic()
(os.killpg if target == "group" else os.kill)(child.pid, number)
status = child.wait()
print(-status, time.monotonic() - begin))",
                     out,
                     pattern,
                     std::to_string(signal),
                     target == Target::kGroup ? "group" : "command"};
    command.insert(command.end(), words.begin(), words.end());
    std::istringstream(RunProcess(command).output) >> ended_by >> seconds;
    output = ContentOf(out);
  }

  int ended_by = -1;
  double seconds = 1e9;
  std::string output;
};

}  // namespace

TEST(Interruption, EndsTheToolAndTheSimulatorByTheSignal) {
  for (const int signal : {SIGTERM, SIGINT, SIGHUP, SIGQUIT}) {
    const Probe slow({"sign 3 0000", "pid", "sleep 60"});
    const std::string pid = slow.path() + ".pid";
    const Interrupted run(
        pid, {"env", "LC_ALL=C.UTF-8", SimulatorPath(), "--tool", PROBE_PATH, slow.path()}, signal);
    EXPECT_EQ(run.ended_by, signal);
    EXPECT_LT(run.seconds, 20) << "the tool sleeps for 60 seconds";
    EXPECT_EQ(kill(std::stoi(ContentOf(pid)), 0), -1) << "the tool must have ended";
    const std::string start =
        "NOT SIMULATED  " + slow.path() +
        "   it was interrupted\n  ✗ tool  it was interrupted\n      Run again.\n";
    EXPECT_EQ(run.output.substr(0, start.size()), start);
  }
}

// Ctrl+C sends SIGINT to the simulator's whole process group. The tool runs in another process
// group, so the simulator ends the tool. The report must not say that the file was refused.
TEST(Interruption, SignalToTheProcessGroupIsNotARefusal) {
  const Probe slow({"sign 3 0000", "pid", "sleep 60"});
  const std::string sarif = slow.directory() / "log.sarif";
  const Interrupted run(
      slow.path() + ".pid",
      {SimulatorPath(), "--quiet", "--sarif", sarif, "--tool", PROBE_PATH, slow.path()}, SIGINT,
      Interrupted::Target::kGroup);
  EXPECT_EQ(run.ended_by, SIGINT);
  EXPECT_EQ(run.output, "NOT SIMULATED  " + slow.path() + "   it was interrupted\n");
  const Json log = Json::parse(ContentOf(sarif), nullptr, false);
  EXPECT_EQ(log["runs"][0]["invocations"][0]["executionSuccessful"], false);
}

// The script "java" replaces the installer's verifier, and never answers. The tool normally ends
// during the script's first sleep, before the signal comes. Without an answer of the verifier, the
// file has no result.
TEST(Interruption, EndsTheInstallersVerifierWithoutAResult) {
  const TempDir directory;
  const std::string file = directory / "base.apk", pid = directory / "pid";
  MakePackage().WriteTo(file);
  directory.WriteProgram("java", "#!/bin/sh\nsleep 0.3\necho $$ >" + pid + "\nexec sleep 60\n");
  const Interrupted run(pid, {"bash", "-c", "PATH=\"$0:$PATH\" exec \"$@\"", directory.path(),
                              SimulatorPath(), "--quiet", "--installer=required", file});
  EXPECT_EQ(run.ended_by, SIGTERM);
  EXPECT_EQ(run.output, "NOT SIMULATED  " + file + "   it was interrupted\n");
  EXPECT_EQ(kill(std::stoi(ContentOf(pid)), 0), -1) << "the verifier must have ended";
}

// The reader takes one byte and ends. By then the simulator is writing the libraries of the large
// packages to temporary directories.
TEST(Interruption, EndOfTheReaderLeavesNoTemporaryFiles) {
  const TempDir directory, temporary;
  PackageOptions large;
  large.entries.push_back({"lib/arm64-v8a/liba.so", Bytes(8 << 20, 'a')});
  MakePackage().WriteTo(directory / "small.apk");
  MakePackage(large).WriteTo(directory / "large.apk");
  Lines words = {"bash",
                 "-c",
                 "\"$@\" | head -c 1; echo \" ${PIPESTATUS[0]}\"",
                 "bash",
                 "env",
                 "TMPDIR=" + temporary.path(),
                 SimulatorPath(),
                 "--quiet",
                 "--installer=off",
                 "--install",
                 "--jobs",
                 "8",
                 directory / "small.apk"};
  words.insert(words.end(), 7, directory / "large.apk");
  const ProcessResult result = RunProcess(words);
  EXPECT_EQ(result.output, "S " + std::to_string(128 + SIGPIPE) + "\n");
  EXPECT_EQ(result.errors.find("cannot write"), std::string::npos) << result.errors;
  EXPECT_TRUE(std::filesystem::is_empty(temporary.path()));
}

// The simulator continues after a signal that its caller ignores. For example, nohup ignores SIGHUP
// before it starts a program.
TEST(Interruption, SignalThatTheCallerIgnoresDoesNotEndTheRun) {
  const Probe slow({"sign 3 0000", "pid", "sleep 1"});
  const ProcessResult result = RunProcess(
      {"bash", "-c",
       "trap '' HUP; \"$@\" & while [ ! -s \"$0\" ]; do sleep 0.02; done; kill -HUP $!; wait $!",
       slow.path() + ".pid", SimulatorPath(), "--quiet", "--tool", PROBE_PATH, slow.path()});
  EXPECT_EQ(result.output, "TRUSTED JAR  " + slow.path() + "\n");
  EXPECT_EQ(result.status, 0);
}

TEST(Page, ShowsWhatAnInterruptedRunHasDone) {
  const Probe good({"sign 3 0000"});
  const Probe slow({"sign 3 0000", "pid", "sleep 60"});
  const std::string page = good.directory() / "page.html";
  const Interrupted run(slow.path() + ".pid", {SimulatorPath(), "--tool", PROBE_PATH, "--html",
                                               page, good.path(), slow.path(), good.path()});
  EXPECT_EQ(run.ended_by, SIGTERM);
  const std::string text = ContentOf(page);
  EXPECT_NE(text.find("<bdi>" + good.path() + "</bdi>"), std::string::npos);
  EXPECT_NE(
      text.find("<p>2 files: 1 trusted JAR, 1 not simulated; interrupted before 1 more file</p>"),
      std::string::npos)
      << text;
  EXPECT_NE(text.find("it was interrupted"), std::string::npos);
  EXPECT_NE(text.find("</html>\n"), std::string::npos);
}

// Each file has a test case in the JUnit report. The JUnit report and the SARIF log have an error
// for the interrupted file, and for each of the last two files, which were never begun.
TEST(Reports, AreCompleteAndHaveErrorsAfterAnInterruption) {
  const Probe good({"sign 3 0000"});
  const Probe slow({"sign 3 0000", "pid", "sleep 60"});
  const std::string junit = good.directory() / "junit.xml", sarif = good.directory() / "log.sarif";
  const Interrupted run(slow.path() + ".pid",
                        {SimulatorPath(), "--tool", PROBE_PATH, "--junit", junit, "--sarif", sarif,
                         good.path(), slow.path(), "/never/1", "/never/2"});
  EXPECT_EQ(run.ended_by, SIGTERM);
  const std::string xml = ContentOf(junit);
  EXPECT_NE(xml.find("tests=\"4\" failures=\"0\" errors=\"3\""), std::string::npos) << xml;
  EXPECT_NE(xml.find("name=\"/never/2\">\n            <error type=\"interrupted\" "
                     "message=\"NOT SIMULATED: it was interrupted\">"),
            std::string::npos)
      << xml;
  EXPECT_NE(xml.find("</testsuites>\n"), std::string::npos);
  const Json log = Json::parse(ContentOf(sarif), nullptr, false);
  ASSERT_TRUE(log.is_object());
  EXPECT_EQ(log["runs"][0]["artifacts"].size(), 4U);
  EXPECT_EQ(log["runs"][0]["invocations"][0]["executionSuccessful"], false);
  EXPECT_EQ(log["runs"][0]["invocations"][0]["toolExecutionNotifications"].size(), 3U);
  ASSERT_EQ(log["runs"][0]["results"].size(), 3U);
  for (const Json& result : log["runs"][0]["results"]) {
    EXPECT_EQ(result["level"], "error");
    EXPECT_EQ(result["ruleId"], "interrupted");
  }
}
