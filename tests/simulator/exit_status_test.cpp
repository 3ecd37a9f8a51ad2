// Tests each exit status of apktoolkit-sim, and the messages that belong to this status. In most
// tests, the probe (tests/simulator/phone/probe.cpp) takes the place of the tool, and executes the
// commands that the test lists.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>

#include "simulator/simulated.h"
#include "support/package.h"

TEST(ExitStatus, IsZeroWhenAllWasSigned) {
  const Probe probe({"sign 3 0100ab"});
  const ProcessResult result = Simulated({probe.path()});
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.errors, "");
  EXPECT_EQ(LinesOf(result.output)[0], "SIGNED  " + probe.path());
}

TEST(ExitStatus, IsOneWhenTheFileWasRefused) {
  const Probe probe({"log 6 ApkToolkit 61", "log 6 ApkToolkit 62"});
  const ProcessResult result = Simulated({probe.path()});
  EXPECT_EQ(result.status, 1);
  EXPECT_EQ(result.errors, "");
  EXPECT_EQ(FirstLines(result, 2), Lines({"REFUSED  " + probe.path() + "   it logged an error: a|5",
                                          "  ✗ package  not signed: it logged an error: a|5"}));
}

TEST(ExitStatus, IsOneWhenTheToolWasKilled) {
  const Probe probe({"sign 3 0100ab", "kill 9"});
  const ProbeRun run = probe.Run();
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.events.back(), Json({{"event", "exit"}, {"signal", 9}}));
}

TEST(ExitStatus, IsOneWhenTheToolFailed) {
  const ProbeRun run = Probe({"sign 3 0100ab", "exit 3"}).Run();
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.events.back(), Json({{"event", "exit"}, {"status", 3}}));
}

TEST(ExitStatus, IsFourForAMissingFile) {
  const ProcessResult result = Told({"/nowhere/base.apk"});
  EXPECT_EQ(result.status, 4);
  EXPECT_EQ(result.output,
            "NOT LOOKED AT  /nowhere/base.apk   there is no such file\n"
            "  ✗ file  not looked at: there is no such file\n"
            "      Check the name. A relative name starts at the directory in which the tool\n"
            "      is run.\n"
            "   1  exit       status 0\n");
}

TEST(ExitStatus, IsFourWhenStandardInputIsClosed) {
  const TempDir directory;
  const std::string file = directory.Write("note.txt", ToBytes("hello\n"));
  const ProcessResult result =
      RunProcess({"bash", "-c", "exec \"$@\" <&-", "bash", SimulatorPath(), file});
  EXPECT_EQ(result.status, 4);
  EXPECT_NE(result.output.find("standard input is closed"), std::string::npos) << result.output;
}

// The probe ignores SIGTERM (15), so the simulator must kill it.
TEST(ExitStatus, IsThreeWhenTheToolDoesNotEnd) {
  const Probe probe({"sign 3 0100ab", "ignore 15", "sleep 60"});
  const auto start = std::chrono::steady_clock::now();
  const ProbeRun run = probe.Run({"--timeout", "3"});
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(30));
  EXPECT_EQ(run.status, 3);
  EXPECT_EQ(run.errors, "apktoolkit-sim: " + probe.path() +
                            ": it was still busy after 3 seconds and was stopped\n");
  EXPECT_EQ(run.events.back(), Json({{"event", "exit"}, {"signal", 9}}));
  EXPECT_EQ(
      probe.Run({"--timeout", "1"}).errors,
      "apktoolkit-sim: " + probe.path() + ": it was still busy after 1 second and was stopped\n");
}

TEST(ExitStatus, IsThreeWhenTheVerifierDoesNotEnd) {
  const Probe probe({"sleep 60"});
  const ProcessResult result = Simulated({"--verify", "--timeout", "1", probe.path()});
  EXPECT_EQ(result.output, "");
  EXPECT_EQ(result.errors, "apktoolkit-sim: " + probe.path() +
                               ": it was still busy after 1 second and was stopped\n");
  EXPECT_EQ(result.status, 3);
}

// Reading a pipe waits for a writer, and /dev/zero has no end. The simulator must not read these
// files, even to digest them for --state.
TEST(ExitStatus, IsOneForADeviceOrAPipe) {
  const TempDir directory;
  const std::string pipe = directory / "pipe";
  ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
  const TempDir state;
  state.Write("name", ToBytes("x"));
  for (const std::string& file : {pipe, std::string("/dev/zero")}) {
    const ProcessResult result = Told({"--timeout", "20", "--state", state.path(), file});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(FirstLines(result, 2),
              Lines({"REFUSED  " + file + "   it is a device, a pipe or a socket",
                     "  ✗ file  not signed: it is a device, a pipe or a socket"}));
  }
}

TEST(ExitStatus, IsThreeWhenTheToolDoesNothing) {
  const Probe probe({});
  const ProcessResult result = Simulated({probe.path()});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors, "apktoolkit-sim: " + probe.path() +
                               ": the tool logged nothing and did nothing, though the file can be "
                               "opened\n");
  const Probe failing({"exit 1"});
  const ProcessResult failed = Simulated({failing.path()});
  EXPECT_EQ(failed.status, 3);
  EXPECT_EQ(FirstLines(failed, 3),
            Lines({"NOT SIMULATED  " + failing.path() + "   it ended with status 1",
                   "  ✗ tool  it ended with status 1",
                   "      Check --tool: apktoolkit ends with 0 for every file."}));
}

TEST(ExitStatus, IsThreeWhenStandardOutputIsFullOrClosed) {
  const Probe probe({"sign 3 0100ab"});
  for (const char* script : {"exec \"$@\" >/dev/full", "exec \"$@\" >&-"}) {
    for (const std::string& word :
         {probe.path(), std::string("--help"), std::string("--version")}) {
      const ProcessResult result = InShell(script, {word});
      EXPECT_EQ(result.status, 3) << script << word;
      EXPECT_EQ(result.errors, "apktoolkit-sim: cannot write to standard output\n");
    }
  }
}

TEST(ExitStatus, IsThreeWhenTheToolIsMissing) {
  const ProcessResult result = RunProcess({SimulatorPath(), "--tool", "/nowhere/tool", "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors, "apktoolkit-sim: cannot run /nowhere/tool: No such file or directory\n");
}

TEST(ExitStatus, IsThreeWhenTheToolIsNotAProgram) {
  if (AreProgramsEmulated())
    GTEST_SKIP() << "the emulator starts even if the tool is not a program";
  const TempDir directory;
  const std::string tool = directory.WriteProgram("tool", "\177ELF");
  const ProcessResult result = RunProcess({SimulatorPath(), "--tool", tool, "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors, "apktoolkit-sim: /: cannot start " + tool + ": Exec format error\n");
}

TEST(ExitStatus, IsThreeWhenRunnerIsMissingOrStandInsAreNotLoaded) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "the emulator hides that a program does not start";
  const TempDir directory;
  // No run starts this tool: the first runner does not exist, and the second runner (`true`)
  // ignores its arguments. The simulator's libraries (the stand-ins) are therefore not loaded.
  const std::string tool = directory.WriteProgram("tool", "#!/bin/true\n");
  const ProcessResult result =
      RunProcess({SimulatorPath(), "--runner", "/nowhere/emulator", "--tool", tool, "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors,
            "apktoolkit-sim: /: cannot start /nowhere/emulator: No such file or directory\n");
  const ProcessResult runner =
      RunProcess({SimulatorPath(), "--runner", "true", "--tool", tool, "/"});
  EXPECT_EQ(runner.status, 3);
  EXPECT_EQ(runner.errors,
            "apktoolkit-sim: /: the simulator's libraries were not loaded into " + tool + "\n");
}

TEST(ExitStatus, IsThreeWhenTheJournalCannotBeWritten) {
  const ProcessResult result = Simulated({"--journal", "/nowhere/journal", "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors,
            "apktoolkit-sim: cannot write the journal /nowhere/journal: No such file "
            "or directory\n");
}

TEST(ExitStatus, IsThreeWhenTheJournalIsFull) {
  const Probe probe({"sign 3 0100ab"});
  const ProcessResult result = Simulated({"--journal", "/dev/full", probe.path()});
  EXPECT_EQ(result.status, 3);
  const std::string message =
      "apktoolkit-sim: cannot write the journal /dev/full: No space left on device\n";
  EXPECT_EQ(result.errors.rfind(message, 0), 0U) << result.errors;
}

TEST(ExitStatus, IsThreeWhenThePageCannotBeWritten) {
  const Probe probe({"sign 3 0100ab"});
  const ProcessResult nowhere = Simulated({"--html", "/nowhere/page", probe.path()});
  EXPECT_EQ(nowhere.status, 3);
  EXPECT_EQ(nowhere.output, "");
  EXPECT_EQ(nowhere.errors,
            "apktoolkit-sim: cannot write the page /nowhere/page: No such file or directory\n");
  const ProcessResult full = Simulated({"--quiet", "--html", "/dev/full", probe.path()});
  EXPECT_EQ(full.status, 3);
  EXPECT_EQ(full.output, "SIGNED  " + probe.path() + "\n");
  EXPECT_EQ(full.errors,
            "apktoolkit-sim: cannot write the page /dev/full: No space left on device\n");
}

// The run fails if nobody reads the pipe. It does not fail if a reader opens the pipe a little
// late.
TEST(ExitStatus, IsThreeWhenThePageIsAPipeThatNobodyReads) {
  const Probe probe({"sign 3 0100ab"});
  const std::string pipe = probe.directory() / "page";
  ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
  const ProcessResult unread = Simulated({"--html", pipe, probe.path()});
  EXPECT_EQ(unread.status, 3);
  EXPECT_EQ(unread.errors, "apktoolkit-sim: cannot write the page " + pipe + ": nobody reads it\n");
  const ProcessResult read = InShell("\"$@\" >/dev/null & sleep 0.3; cat \"${@: -2:1}\"; wait $!",
                                     {"--html", pipe, probe.path()});
  EXPECT_EQ(read.status, 0);
  EXPECT_EQ(read.output.substr(0, 15), "<!DOCTYPE html>");
  EXPECT_EQ(read.output.substr(read.output.size() - 8), "</html>\n");
}

// The file size limit (ulimit -f) makes the write of the library fail. The package is not at fault,
// so its verdict is NOT SIMULATED and not REFUSED.
TEST(ExitStatus, IsThreeWhenLibrariesCannotBeWritten) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage(WithLibraries({{"lib/arm64-v8a/liba.so", Bytes(3000, 'a')}})).WriteTo(file);
  const ProcessResult result =
      RunProcess({"bash", "-c", "trap '' XFSZ; ulimit -f 1; exec \"$@\"", "bash", "env",
                  "LC_ALL=C.UTF-8", SimulatorPath(), "--quiet", "--install", file});
  EXPECT_EQ(result.status, 3) << result.output;
  EXPECT_EQ(result.output.rfind(
                "NOT SIMULATED  " + file + "   its libraries cannot be extracted beside it: ", 0),
            0U);
  EXPECT_NE(result.errors.find("its libraries cannot be extracted beside it: "), std::string::npos);
  EXPECT_NE(result.errors.find(" <install>/lib/arm64/liba.so: File too large"), std::string::npos);
}

TEST(ExitStatus, IsOneWhenALibraryCannotBeExtracted) {
  Package package = MakePackage();
  package.Item("lib/arm64-v8a/libfoo.so").method = 12;
  const TempDir directory;
  const std::string file = directory / "lib";
  package.WriteTo(file);
  const ProcessResult quiet = Told({"--quiet", "--install", file});
  EXPECT_EQ(quiet.status, 1);
  EXPECT_EQ(quiet.output.substr(0, 13), "PARTLY SIGNED") << quiet.output;
  EXPECT_NE(Told({"--install", file})
                .output.find(
                    "  ✗ lib/arm64/libfoo.so  not signed: it cannot be extracted from the package"),
            std::string::npos);
}

TEST(ExitStatus, IsThreeWhenTheStateDirectoryCannotBeUsed) {
  const ProcessResult result = Simulated({"--state", "/dev/null", "/"});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors, "apktoolkit-sim: cannot use the directory /dev/null\n");
}

TEST(ExitStatus, IsTwoWhenTheJournalWouldReplaceAnInput) {
  const Probe probe({"sign 3 0000"});
  const std::string before = ContentOf(probe.path());
  const ProcessResult result = Simulated({"--journal", probe.path(), probe.path()});
  EXPECT_EQ(result.status, 2);
  EXPECT_EQ(result.output, "");
  EXPECT_EQ(result.errors, "apktoolkit-sim: --journal " + probe.path() +
                               " is an input of this run; it was not changed\n");
  EXPECT_EQ(ContentOf(probe.path()), before);
}

TEST(ExitStatus, IsTwoWhenThePageWouldReplaceAFile) {
  const Probe probe({"sign 3 0000"});
  const std::string notes = probe.directory().Write("notes.html", ToBytes("<!DOCTYPE html>\n<p>"));
  for (const std::string& victim : {probe.path(), notes}) {
    const std::string before = ContentOf(victim);
    const ProcessResult result = Simulated({"--html", victim, probe.path()});
    EXPECT_EQ(result.status, 2);
    EXPECT_EQ(result.output, "");
    EXPECT_EQ(result.errors, "apktoolkit-sim: --html " + victim +
                                 (victim == notes ? " exists and is not a page of apktoolkit-sim"
                                                  : " is an input of this run") +
                                 "; it was not changed\n");
    EXPECT_EQ(ContentOf(victim), before);
  }
}

TEST(ExitStatus, IsTwoWhenATrustedFileOrTheToolWouldBeReplaced) {
  const TempDir directory;
  const Probe probe({"sign 3 0000"});
  // Each file begins like an earlier output of apktoolkit-sim, which a new output may replace. The
  // run refuses to replace these files. The only reason is that they are inputs of this run.
  const std::string journal = directory.Write("journal", ToBytes("{\"event\":\"journal\"}\n"));
  const std::string page =
      directory.Write("page", ToBytes("<!DOCTYPE html>\n<!-- A page of apktoolkit-sim -->\n"));
  const auto errors = [&](const Lines& words) {
    const ProcessResult result = Told(words);
    EXPECT_EQ(result.status, 2);
    return result.errors;
  };
  const std::string end = " is an input of this run; it was not changed\n";
  EXPECT_EQ(errors({"--journal", journal, "--trust", journal, probe.path()}),
            "apktoolkit-sim: --journal " + journal + end);
  EXPECT_EQ(errors({"--html", page, "--trust", "/dev/null", "--trust", page, probe.path()}),
            "apktoolkit-sim: --html " + page + end);
  EXPECT_EQ(errors({"--journal", journal, "--tool", journal, probe.path()}),
            "apktoolkit-sim: --journal " + journal + end);
}

TEST(ExitStatus, IsTwoWhenPageAndJournalAreOneFile) {
  const Probe probe({"sign 3 0000"});
  const std::string file = probe.directory() / "file";
  const ProcessResult result = Simulated({"--html", file, "--journal", file, probe.path()});
  EXPECT_EQ(result.status, 2);
  EXPECT_EQ(result.errors, "apktoolkit-sim: --journal and --html name the same file\n");
  EXPECT_EQ(access(file.c_str(), F_OK), -1);
}

TEST(ExitStatus, IsTwoWhenAReportWouldReplaceAFile) {
  const Probe probe({"sign 3 0000"});
  const std::string other =
      probe.directory().Write("other", ToBytes("<?xml version=\"1.0\"?>\n{}"));
  const std::vector<Lines> kReports = {{"--junit", "JUnit report"}, {"--sarif", "SARIF log"}};
  for (const Lines& report : kReports) {
    for (const std::string& victim : {probe.path(), other}) {
      const std::string before = ContentOf(victim);
      const ProcessResult result = Simulated({report[0], victim, probe.path()});
      EXPECT_EQ(result.status, 2);
      EXPECT_EQ(result.output, "");
      EXPECT_EQ(result.errors,
                "apktoolkit-sim: " + report[0] + " " + victim +
                    (victim == other ? " exists and is not a " + report[1] + " of apktoolkit-sim"
                                     : " is an input of this run") +
                    "; it was not changed\n");
      EXPECT_EQ(ContentOf(victim), before);
    }
  }
}

TEST(ExitStatus, IsTwoWhenTwoOutputsAreOneFile) {
  const Probe probe({"sign 3 0000"});
  const std::string file = probe.directory() / "file";
  const Lines options = {"--journal", "--html", "--junit", "--sarif"};
  for (size_t i = 0; i < options.size(); ++i) {
    for (size_t j = i + 1; j < options.size(); ++j) {
      const ProcessResult result = Simulated({options[j], file, options[i], file, probe.path()});
      EXPECT_EQ(result.status, 2);
      EXPECT_EQ(result.errors,
                "apktoolkit-sim: " + options[i] + " and " + options[j] + " name the same file\n");
      EXPECT_EQ(access(file.c_str(), F_OK), -1);
    }
  }
}

// If an output and a standard stream were the same file, their texts would overwrite each other. A
// pipe keeps both texts, so the run accepts a pipe.
TEST(ExitStatus, IsTwoWhenAnOutputIsAlsoAStandardStream) {
  const Probe probe({"sign 3 0000"});
  const auto told = [&probe](const std::string& rest) {
    return RunProcess({"bash", "-c",
                       "cd \"$1\"; \"$2\" --quiet --tool " PROBE_PATH " \"$3\" " + rest, "bash",
                       probe.directory().path(), SimulatorPath(), probe.path()});
  };
  const ProcessResult same = told("--junit /dev/stdout >same");
  EXPECT_EQ(same.status, 2);
  EXPECT_EQ(same.errors,
            "apktoolkit-sim: --junit /dev/stdout is also standard output or standard "
            "error; two outputs cannot be one file\n");
  EXPECT_EQ(told("--journal errors 2>errors").status, 2);
  EXPECT_EQ(told("--journal /dev/stdout | cat").status, 0);
}

// If one output cannot be opened, the other outputs must not look like the outputs of a good run.
TEST(ExitStatus, IsThreeAndReportsShowItWhenAnOutputCannotBeOpened) {
  const Probe probe({"sign 3 0000"});
  const std::string directory = probe.directory().path();
  const std::string junit = directory + "/j.xml", sarif = directory + "/s.sarif",
                    page = directory + "/p.html", journal = directory + "/j";
  const Lines outputs = {"--sarif", sarif, "--html", page, "--journal", journal, probe.path()};
  ASSERT_EQ(Simulated(outputs).status, 0);
  Lines words = {"--junit", "/nowhere/j"};
  words.insert(words.end(), outputs.begin(), outputs.end());
  const std::string problem = "cannot write the JUnit report /nowhere/j: No such file or directory";
  const ProcessResult result = Simulated(words);
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.output, "");
  EXPECT_EQ(result.errors, "apktoolkit-sim: " + problem + "\n");
  EXPECT_EQ(Json::parse(ContentOf(sarif))["runs"][0]["results"][0]["ruleId"], "not-begun");
  EXPECT_NE(ContentOf(page).find("no file could be simulated: " + problem), std::string::npos);
  EXPECT_EQ(ContentOf(journal), "{\"event\":\"journal\",\"version\":1}\n");
}

// Three files are given, but the simulator prints only one message about the journal. The SARIF log
// has one notification, and reports that the run failed.
TEST(ExitStatus, IsThreeWithOneMessageWhenTheDiskIsFull) {
  const Probe probe({"sign 3 0000"});
  const std::string sarif = probe.directory() / "s.sarif";
  const ProcessResult result = Simulated({"--quiet", "--journal", "/dev/full", "--sarif", sarif,
                                          probe.path(), probe.path(), probe.path()});
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors,
            "apktoolkit-sim: cannot write the journal /dev/full: No space left on device\n");
  const Json invocation = Json::parse(ContentOf(sarif))["runs"][0]["invocations"][0];
  EXPECT_EQ(invocation["executionSuccessful"], false);
  EXPECT_EQ(invocation["toolExecutionNotifications"].size(), 1U);
}

TEST(ExitStatus, IsThreeWhenAReportCannotBeWritten) {
  const Probe probe({"sign 3 0100ab"});
  const ProcessResult junit = Simulated({"--quiet", "--junit", "/dev/full", probe.path()});
  EXPECT_EQ(junit.status, 3);
  EXPECT_EQ(junit.errors,
            "apktoolkit-sim: cannot write the JUnit report /dev/full: No space left on device\n");
  const ProcessResult sarif = Simulated({"--quiet", "--sarif", "/nowhere/s", probe.path()});
  EXPECT_EQ(sarif.status, 3);
  EXPECT_EQ(sarif.errors,
            "apktoolkit-sim: cannot write the SARIF log /nowhere/s: No such file or directory\n");
}

TEST(ExitStatus, IsTheHighestOfAllFiles) {
  const Probe good({"sign 3 0000"});
  const Probe bad({"verify 3"});
  EXPECT_EQ(Simulated({good.path(), good.path()}).status, 0);
  const ProcessResult result = Simulated({good.path(), bad.path(), good.path()});
  EXPECT_EQ(result.status, 1);
  EXPECT_EQ(Told({"/nowhere/a", "/dev/null"}).status, 4);
}
