// Tests apktoolkit-sim: its text for several files, its journal, its page, its reports, and its
// runs of the tool.
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>

#include "simulator/simulated.h"
#include "support/package.h"

namespace {

// The text after the name of an untrusted JAR, in the line of the verdict.
constexpr char kNotTrusted[] =
    "   it is a plain JAR, which is signed only if the kernel already trusts it; the kernel "
    "answered ENOKEY: Required key not available";

}  // namespace

TEST(SimulatorOutput, SeparatesFilesByAnEmptyLineAndSumsThemUp) {
  const Probe good({"sign 3 0000"});
  const Probe bad({"verify 3"});
  const ProcessResult result = Simulated({good.path(), bad.path(), good.path()});
  EXPECT_NE(result.output.find("\n\nNOT TRUSTED JAR  " + bad.path() + kNotTrusted + "\n"),
            std::string::npos)
      << result.output;
  EXPECT_EQ(LinesOf(result.output).back(), "3 files: 2 trusted JARs, 1 JAR not trusted");
}

TEST(SimulatorOutput, HasOnlyTheVerdictLinesWithQuiet) {
  const Probe good({"sign 3 0000"});
  const Probe bad({"verify 3"});
  EXPECT_EQ(
      Simulated({"--quiet", good.path(), bad.path()}).output,
      "TRUSTED JAR  " + good.path() + "\nNOT TRUSTED JAR  " + bad.path() + kNotTrusted + "\n");
}

// The first file takes longest, but the output keeps the order of the command line.
TEST(SimulatorOutput, KeepsTheOrderOfFilesThatRunAtTheSameTime) {
  const Probe slow({"sign 3 0000", "sleep 1"});
  const Probe quick({"verify 3"});
  const Lines files = {slow.path(), quick.path(), quick.path(), quick.path()};
  const TempDir directory;
  const std::string journal = directory / "journal";
  Lines words = {"--jobs", "4", "--quiet", "--journal", journal};
  words.insert(words.end(), files.begin(), files.end());
  const ProcessResult result = Simulated(words);
  const std::string refused = "NOT TRUSTED JAR  " + quick.path() + kNotTrusted;
  EXPECT_EQ(LinesOf(result.output),
            Lines({"TRUSTED JAR  " + slow.path(), refused, refused, refused}));
  Lines started;
  std::string last_event;
  for (const Json& event : ParseJournal(ContentOf(journal))) {
    if (event["event"] == "start") {
      EXPECT_TRUE(started.empty() || last_event == "verdict") << "runs are not mixed";
      started.push_back(event["file"]);
    }
    last_event = event["event"];
  }
  EXPECT_EQ(started, files);
}

// The simulator overwrites each progress line later. Text in a pipe cannot be overwritten, so a
// pipe gets no progress lines.
TEST(SimulatorOutput, ShowsNoProgressWithoutATerminal) {
  const Probe slow({"sign 3 0000", "sleep 2"});
  EXPECT_EQ(Simulated({slow.path()}).errors, "");
}

// The program "script" of util-linux gives the simulator a terminal.
TEST(SimulatorOutput, ShowsProgressOnATerminalIfAFileTakesLonger) {
  if (RunProcess({"script", "-qec", "true", "/dev/null"}).status != 0) {
    GTEST_SKIP() << "there are no pseudo-terminals here: /dev/pts is not mounted";
  }
  const Probe slow({"sign 3 0000", "sleep 2"});
  const ProcessResult result = RunProcess(
      {"script", "-qec", SimulatorPath() + " --quiet --tool " + PROBE_PATH + " " + slow.path(),
       "/dev/null"});
  const size_t progress = result.output.find("0 of 1 done; " + slow.path() + ": 1 s");
  EXPECT_NE(progress, std::string::npos) << result.output;
  // The progress line is erased before the verdict is printed.
  const size_t verdict = result.output.find("\r\x1b[K\x1b[32mTRUSTED JAR", progress);
  EXPECT_NE(verdict, std::string::npos) << result.output;
}

// NO_COLOR takes effect if it is set and not empty (https://no-color.org).
TEST(SimulatorOutput, HasNoColoursIfNoColorIsSet) {
  if (RunProcess({"script", "-qec", "true", "/dev/null"}).status != 0) {
    GTEST_SKIP() << "there are no pseudo-terminals here: /dev/pts is not mounted";
  }
  const Probe good({"sign 3 0000"});
  const auto shown = [&good](const std::string& assignment) {
    const std::string command = "env " + assignment + " LC_ALL=C.UTF-8 " + SimulatorPath() +
                                " --quiet --tool " + PROBE_PATH + " " + good.path();
    return RunProcess({"script", "-qec", command, "/dev/null"}).output;
  };
  EXPECT_EQ(shown("NO_COLOR=1"), "TRUSTED JAR  " + good.path() + "\r\n");
  const std::string green = "\x1b[32mTRUSTED JAR\x1b[0m  " + good.path() + "\r\n";
  EXPECT_EQ(shown("-u NO_COLOR"), green);
  EXPECT_EQ(shown("NO_COLOR="), green);
}

// The name of a file may contain control sequences for the terminal.
TEST(SimulatorOutput, ControlSequencesInNamesAreEscaped) {
  const TempDir directory;
  const std::string odd = directory.Write("-\x1b]0;x\x07", ToBytes("sign 3 0000\n"));
  for (const Lines& words :
       {Lines({odd}), Lines({"-\x1b]0;x\x07"}), Lines({"--journal", odd, odd})}) {
    const ProcessResult result = Simulated(words);
    EXPECT_EQ((result.output + result.errors).find('\x1b'), std::string::npos) << result.output;
    EXPECT_NE((result.output + result.errors).find("\\x1b"), std::string::npos) << result.output;
  }
}

TEST(Journal, StartsWithTheVersionTheFileAndTheProcess) {
  const TempDir directory;
  const std::string file = directory.Write("script", ToBytes("sign 3 0000\n"));
  const ProcessResult result =
      RunProcess({SimulatorPath(), "--json", "--tool", PROBE_PATH, "./script"}, directory.path());
  std::vector<Json> events = ParseJournal(result.output);
  ASSERT_EQ(events.size(), 6U);
  EXPECT_EQ(LinesOf(result.output)[0], "{\"event\":\"journal\",\"version\":1}");
  EXPECT_EQ(events[1], Json({{"event", "start"}, {"file", "./script"}, {"path", file}}));
  EXPECT_GT(events[2]["pid"], 1);
  EXPECT_EQ(events[3]["event"], "sign");
  EXPECT_EQ(LinesOf(result.output)[4], "{\"event\":\"exit\",\"status\":0}");
  EXPECT_EQ(events[5]["event"], "verdict");
}

TEST(Journal, ReplacesTheFileOfAnEarlierRun) {
  const Probe probe({"sign 3 0000"});
  const std::string before = "{\"event\":\"journal\",\"version\":1}\n{\"event\":\"old\"}\n";
  const std::string file = probe.directory().Write("journal", ToBytes(before));
  const ProcessResult kept = Simulated({"--journal", file, probe.path()});
  EXPECT_EQ(LinesOf(kept.output)[0], "TRUSTED JAR  " + probe.path());
  const ProcessResult both = Simulated({"--json", "--journal", file, probe.path()});
  EXPECT_EQ(ContentOf(file), both.output);
  EXPECT_EQ(ParseJournal(both.output).size(), 6U);
}

TEST(Journal, InvalidUtf8InFileNamesIsKept) {
  const TempDir directory;
  const std::string odd = directory.Write("od\xe9\n\"d", ToBytes("sign 3 0000\n"));
  const ProcessResult result = Simulated({"--json", odd});
  EXPECT_EQ(result.status, 0);
  const std::vector<Json> events = ParseJournal(result.output);
  ASSERT_EQ(events.size(), 6U);
  EXPECT_EQ(events[3]["path"], directory / "od\uf7e9\n\"d");
}

TEST(Page, IsWrittenAnewForAllFilesInTheirOrder) {
  const Probe good({"sign 3 0000", "sleep 1"});
  const Probe bad({"verify 3"});
  const std::string page = good.directory() / "page.html";
  ASSERT_EQ(Simulated({"--html", page, bad.path()}).status, 1);
  const ProcessResult result =
      Simulated({"--html", page, "--quiet", "--jobs", "3", good.path(), bad.path(), good.path()});
  EXPECT_EQ(result.status, 1);
  const std::string text = ContentOf(page);
  EXPECT_NE(text.find("<p>3 files: 2 trusted JARs, 1 JAR not trusted</p>"), std::string::npos);
  const size_t first = text.find("<h2 id=\"name-1\"><bdi>" + good.path() + "<");
  const size_t second = text.find("<h2 id=\"name-2\"><bdi>" + bad.path() + "<");
  const size_t third = text.find("<h2 id=\"name-3\"><bdi>" + good.path() + "<");
  EXPECT_TRUE(first < second && second < third && third != std::string::npos) << text;
}

// The text of a journal must not mislead a person who looks at it.
TEST(Journal, HasNoHiddenCharacters) {
  const TempDir directory;
  const std::string odd = directory.Write("\u0085\u202e\u200b", ToBytes("sign 3 0000\n"));
  const ProcessResult result = Simulated({"--json", odd});
  for (const char* hidden : {"\u0085", "\u202e", "\u200b"}) {
    EXPECT_EQ(result.output.find(hidden), std::string::npos) << result.output;
  }
  EXPECT_EQ(ParseJournal(result.output)[1]["file"], odd);
}

// The reports of an earlier good run must not remain after a run that could not begin.
TEST(Reports, ShowAnErrorIfTheRunCannotBegin) {
  const Probe good({"sign 3 0000"});
  const std::string junit = good.directory() / "junit.xml", sarif = good.directory() / "log.sarif";
  const Lines reports = {"--junit", junit, "--sarif", sarif, good.path()};
  ASSERT_EQ(Simulated(reports).status, 0);
  EXPECT_NE(ContentOf(junit).find("failures=\"0\" errors=\"0\""), std::string::npos);
  EXPECT_EQ(Json::parse(ContentOf(sarif))["runs"][0]["results"], Json::array());
  Lines words = {"--tool", "/nowhere/tool"};
  words.insert(words.end(), reports.begin(), reports.end());
  const ProcessResult result = Told(words);
  EXPECT_EQ(result.status, 3);
  EXPECT_EQ(result.errors, "apktoolkit-sim: cannot run /nowhere/tool: No such file or directory\n");
  EXPECT_NE(
      ContentOf(junit).find("<error type=\"not-begun\" message=\"NOT SIMULATED: no file could "
                            "be simulated: cannot run /nowhere/tool: No such file or "
                            "directory\">"),
      std::string::npos)
      << ContentOf(junit);
  EXPECT_EQ(Json::parse(ContentOf(sarif))["runs"][0]["results"][0]["ruleId"], "not-begun");
}

TEST(Simulation, FollowsLinksToTheFile) {
  const Probe probe({"sign 3 0000"});
  const std::string link = probe.directory() / "link";
  ASSERT_EQ(symlink("script", link.c_str()), 0);
  EXPECT_EQ(Simulated({link}).status, 0);
}

TEST(Simulation, WorksFromADirectoryWithASpaceAndAColon) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "the copies cannot be started by themselves";
  namespace fs = std::filesystem;
  const TempDir directory;
  const std::string place = directory / "with space: and colon";
  const fs::path built = fs::path(SimulatorPath()).parent_path().parent_path();
  fs::create_directories(place + "/bin");
  fs::create_directories(place + "/lib");
  fs::copy(built / "lib/apktoolkit", place + "/lib/apktoolkit");
  for (const char* name : {"apktoolkit-sim", "simulator_probe"}) {
    fs::copy(built / "bin" / name, place + "/bin/" + name);
  }
  const Probe probe({"sign 3 0000", "register 3 name ab"});
  const ProcessResult result = RunProcess({"env", "LC_ALL=C", place + "/bin/apktoolkit-sim",
                                           "--tool", place + "/bin/simulator_probe", probe.path()});
  EXPECT_EQ(result.status, 0) << result.errors;
  EXPECT_EQ(FirstLines(result, 3),
            Lines({"TRUSTED JAR  " + probe.path(), "  + JAR  signed, with an empty payload",
                   "  + key  registered for name"}));
}

// Writes a runner, a program that starts the tool. The runner first executes the shell command
// `does`. Returns the runner's path.
std::string RunnerThat(const std::string& does, const TempDir& directory) {
  return directory.WriteProgram("runner", "#!/bin/sh\n" + does + "\nshift\nexec env \"$@\"\n");
}

TEST(Simulation, HasNoResultForAFileThatWasChangedMeanwhile) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "there is a runner already";
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage().WriteTo(file);
  const ProcessResult changed =
      Told({"--quiet", "--runner", RunnerThat("touch " + file, directory), file});
  EXPECT_EQ(changed.output, "NOT SIMULATED  " + file + "   it was changed during the run\n");
  EXPECT_EQ(changed.status, 3);
  EXPECT_EQ(Told({"--quiet", file}).status, 0);
  // A directory never counts as changed.
  EXPECT_EQ(Told({"--quiet", directory.path()}).status, 1);
}

// Each run installs the package in a directory of its own. If possible, the run makes a hard link
// in this directory to the package, and later removes the link. Both actions change the package's
// ctime.
TEST(Simulation, ParallelRunsOverOneFileDoNotDisturbEachOther) {
  const TempDir directory;
  PackageOptions options;
  options.entries.push_back({"lib/arm64-v8a/liba.so", ToBytes("a")});
  const std::string file = directory / "base.apk";
  MakePackage(options).WriteTo(file);
  constexpr int kRuns = 40;
  Lines words = {SimulatorPath(), "--quiet", "--installer=off", "--install=phone", "--jobs", "8"};
  words.insert(words.end(), kRuns, file);
  const ProcessResult result = RunProcess(words);
  Lines verdicts;
  for (const std::string& line : LinesOf(result.output)) {
    verdicts.push_back(line.substr(0, line.find("  ")));
  }
  EXPECT_EQ(verdicts, Lines(kRuns, "SIGNED"));
  EXPECT_EQ(result.status, 0);
}

// The tool and the simulator map the file's central directory. Meanwhile, the script repeatedly
// cuts the file off before its central directory, and restores the file.
TEST(Simulation, SurvivesAFileThatShrinksAndGoesOnToTheNext) {
  PackageOptions options;
  for (int i = 0; i < 20000; ++i) options.entries.push_back({"assets/" + std::to_string(i), {}});
  const TempDir directory;
  MakePackage(options).WriteTo(directory / "whole.apk");
  MakePackage().WriteTo(directory / "good.apk");
  const std::string script =
      // AddressSanitizer would report the signal SIGBUS as an error of the tool.
      "export ASAN_OPTIONS=\"$ASAN_OPTIONS:handle_sigbus=0\"\n"
      "cd \"$1\"; sim=$2; cp whole.apk base.apk\n"
      "(while [ ! -e end ]; do truncate -s 3000 base.apk; cp whole.apk base.apk; done) & loop=$!\n"
      "for i in $(seq 30); do\n"
      "  \"$sim\" --installer=off --install=no --quiet base.apk good.apk >out; status=$?\n"
      "  [ $status = 3 ] || [ $status = 1 ] || [ $status = 0 ] || echo \"status $status\"\n"
      "  grep -q '^SIGNED  good.apk' out || cat out\ndone; touch end; wait $loop";
  const ProcessResult result =
      RunProcess({"bash", "-c", script, "bash", directory.path(), SimulatorPath()});
  EXPECT_EQ(result.output, "");
}

TEST(Simulation, RunnerGetsThePreloadForTheTool) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "there is a runner already";
  const Probe probe({"sign 3 0000"});
  // The runner handles -E as an emulator does, and prints its own arguments and LD_PRELOAD.
  const std::string runner =
      probe.directory().WriteProgram("runner",
                                     "#!/bin/sh\n"
                                     "echo \"$1 $2 ${3%%=*} preload=$LD_PRELOAD\" >&2\n"
                                     "shift 2\n"
                                     "exec env \"$@\"\n");
  const ProcessResult result = Simulated({"--runner", runner + " --flag", probe.path()});
  EXPECT_EQ(result.errors, "--flag -E LD_PRELOAD preload=\n");
  EXPECT_EQ(result.status, 0);
}

TEST(Simulation, DoesNotPassTheCallersOpenFilesToTheTool) {
  const Probe probe({"sign 3 0000", "sign 7 0000"});
  const ProcessResult result =
      RunProcess({"bash", "-c", "exec 3</dev/null 7</dev/null; exec \"$@\"", "bash",
                  SimulatorPath(), "--json", "--tool", PROBE_PATH, probe.path()});
  // The probe opens its file first. The file gets descriptor 3 only if the caller's descriptor 3 is
  // closed.
  const std::vector<Json> events = OfKind(ParseJournal(result.output), "sign");
  ASSERT_EQ(events.size(), 2U);
  EXPECT_EQ(events[0]["path"], probe.path());
  EXPECT_EQ(events[1]["errno"], EBADF);
  EXPECT_EQ(result.errors, "");
}

TEST(TrustState, TrustsASignedFileUntilItsBytesChange) {
  const TempDir state;
  const Probe jar({"verify 3", "sign 3 0000"});
  EXPECT_EQ(jar.Run({"--state", state.path()}).status, 1);
  EXPECT_EQ(jar.Run({"--state", state.path()}).status, 0);
  // One byte of the file changed.
  jar.directory().Write("script", ToBytes("verify 3\nsign 3 0001\n"));
  EXPECT_EQ(jar.Run({"--state", state.path()}).results[0], "-1 126");
}

TEST(TrustState, DoesNotTrustAFileThatWasNotSigned) {
  const TempDir state;
  const Probe jar({"verify 3", "sign 3 0000"});
  EXPECT_EQ(jar.Run({"--state", state.path(), "--sign-errno", "EPERM"}).status, 1);
  EXPECT_EQ(jar.Run({"--state", state.path()}).results[0], "-1 126");
}

TEST(TrustState, IsSharedByTheFilesOfARunWithoutADirectory) {
  const Probe jar({"verify 3", "sign 3 0000"});
  const ProcessResult result = Simulated({"--json", jar.path(), jar.path()});
  const std::vector<Json> verified = OfKind(ParseJournal(result.output), "verify");
  ASSERT_EQ(verified.size(), 2U);
  EXPECT_EQ(verified[0]["result"], -1);
  EXPECT_EQ(verified[1]["result"], 0);
}

// The last runs begin after the first ones have ended, but do not know which files the first runs
// signed.
TEST(TrustState, IsNotSharedWhenSeveralFilesRunAtATime) {
  const Probe jar({"verify 3", "sign 3 0000"});
  const ProcessResult result = Simulated(
      {"--jobs", "2", "--json", jar.path(), jar.path(), jar.path(), jar.path(), jar.path()});
  const std::vector<Json> verified = OfKind(ParseJournal(result.output), "verify");
  ASSERT_EQ(verified.size(), 5U);
  for (const Json& event : verified) EXPECT_EQ(event["result"], -1);
}

TEST(RealTool, RunsAsItIsOnAFileThatIsNoZip) {
  const TempDir directory;
  const std::string file = directory.Write("note.txt", ToBytes("hello\n"));
  const ProcessResult result = Told({file});
  EXPECT_EQ(result.status, 1);
  EXPECT_EQ(result.errors, "");
  EXPECT_EQ(result.output, "REFUSED  " + file +
                               "   it is a text and not an archive\n"
                               "  ✗ file  not signed: it is a text and not an archive\n"
                               "      It may be the error message of a failed download: read it.\n"
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
