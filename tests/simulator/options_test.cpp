#include "simulator/options.h"

#include <gtest/gtest.h>

#include <cerrno>

#include "simulator/phone/probe_run.h"
#include "simulator/run/tool_process.h"
#include "support/process.h"
#include "support/simulation.h"

using namespace simulator;

namespace {

// Parses the arguments `words`, which must be valid. Returns the options.
Options Parsed(Lines words) {
  Options options;
  words.insert(words.begin(), "apktoolkit-sim");
  std::vector<char*> arguments;
  for (std::string& word : words) arguments.push_back(word.data());
  arguments.push_back(nullptr);
  EXPECT_EQ(ParseOptions(static_cast<int>(words.size()), arguments.data(), &options), std::nullopt);
  return options;
}

// The status and the output of the simulator for a command line.
ProcessResult Told(const Lines& words) {
  Lines command = {SimulatorPath()};
  command.insert(command.end(), words.begin(), words.end());
  return RunProcess(command);
}

}  // namespace

TEST(Options, DefaultIsAHealthyPhone) {
  const Options options = Parsed({"a.apk"});
  EXPECT_EQ(options.files.names, Lines({"a.apk"}));
  EXPECT_EQ(options.run.phone.integrity, Lines({"1f"}));
  EXPECT_EQ(options.run.phone.sign_errno, 0);
  EXPECT_EQ(options.run.phone.verify_errno, ENOKEY);
  EXPECT_EQ(options.run.phone.zu_result, 0);
  EXPECT_EQ(options.run.trust, Lines());
  EXPECT_EQ(options.run.state, "");
  EXPECT_EQ(options.show.journal, "");
  EXPECT_EQ(options.show.html, "");
  EXPECT_FALSE(options.show.json);
  EXPECT_EQ(options.run.tool, ProgramDirectory() + "/apktoolkit");
  EXPECT_EQ(options.run.runner, Lines());
  EXPECT_EQ(options.run.timeout, 30);
  EXPECT_EQ(options.run.install, InstallWhen::kAlone);
  EXPECT_EQ(options.run.abi, InstalledAbi::kPreferred);
  EXPECT_FALSE(options.judge.is_strict);
  EXPECT_EQ(options.show.detail, Detail::kUsual);
  EXPECT_EQ(options.run.jobs, 1U);
}

TEST(Options, EachChangesItsPartOfThePhone) {
  const Options options = Parsed({"--integrity", "ffffffff,missing,", "--sign-errno", "EPERM",
                                  "--verify-errno", "EBADMSG", "--zu-result", "-5", "a.apk"});
  EXPECT_EQ(options.run.phone.integrity, Lines({"ffffffff", "missing", ""}));
  EXPECT_EQ(options.run.phone.sign_errno, EPERM);
  EXPECT_EQ(options.run.phone.verify_errno, EBADMSG);
  EXPECT_EQ(options.run.phone.zu_result, -5);
}

TEST(Options, ZuResultMayBeHexadecimal) {
  EXPECT_EQ(Parsed({"--zu-result", "0x10004", "a.apk"}).run.phone.zu_result, 65540);
}

TEST(Options, TrustAcceptsOneFileEachTime) {
  const Options options =
      Parsed({"--trust", "/dev/zero", "--trust", "/dev/null", "a.apk", "b.apk"});
  EXPECT_EQ(options.run.trust, Lines({"/dev/zero", "/dev/null"}));
  EXPECT_EQ(options.files.names, Lines({"a.apk", "b.apk"}));
}

TEST(Options, OutputAndToolOptionsSetTheirValues) {
  const Options options =
      Parsed({"--state", "s", "--journal", "j", "--html", "h", "--json", "--tool", "t", "--timeout",
              "0.5", "--runner", "emulator  -L /root", "--", "-a.apk"});
  EXPECT_EQ(options.run.state, "s");
  EXPECT_EQ(options.show.journal, "j");
  EXPECT_EQ(options.show.html, "h");
  EXPECT_TRUE(options.show.json);
  EXPECT_EQ(options.run.tool, "t");
  EXPECT_EQ(options.run.timeout, 0.5);
  EXPECT_EQ(options.run.runner, Lines({"emulator", "-L", "/root"}));
  EXPECT_EQ(options.files.names, Lines({"-a.apk"}));
}

TEST(Options, QuietVerboseStrictAndJobsSetTheirValues) {
  EXPECT_EQ(Parsed({"--quiet", "a.apk"}).show.detail, Detail::kVerdict);
  EXPECT_EQ(Parsed({"--verbose", "a.apk"}).show.detail, Detail::kAll);
  EXPECT_TRUE(Parsed({"--strict", "a.apk"}).judge.is_strict);
  EXPECT_EQ(Parsed({"--jobs", "8", "a.apk"}).run.jobs, 8U);
}

TEST(Options, InstallReadsItsValueOnlyAfterAnEqualsSign) {
  EXPECT_EQ(Parsed({"--install=all", "a.apk"}).run.abi, InstalledAbi::kAll);
  EXPECT_EQ(Parsed({"--install=arm64", "a.apk"}).run.abi, InstalledAbi::kArm64);
  EXPECT_EQ(Parsed({"--install=arm", "a.apk"}).run.abi, InstalledAbi::kArm);
  const Options options = Parsed({"--install", "arm"});
  EXPECT_EQ(options.run.abi, InstalledAbi::kPreferred);
  EXPECT_EQ(options.files.names, Lines({"arm"}));
  EXPECT_EQ(options.run.install, InstallWhen::kAlways);
  EXPECT_EQ(Parsed({"a.apk"}).run.install, InstallWhen::kAlone);
  EXPECT_EQ(Parsed({"a.apk"}).run.abi, InstalledAbi::kPreferred);
  EXPECT_EQ(Parsed({"--install=no", "a.apk"}).run.install, InstallWhen::kNever);
  EXPECT_EQ(Parsed({"--install=no", "--install=arm", "a.apk"}).run.install, InstallWhen::kAlways);
  EXPECT_EQ(Parsed({"--verify", "a.apk"}).run.install, InstallWhen::kNever);
  EXPECT_EQ(Parsed({"--", "--install"}).files.names, Lines({"--install"}));
}

TEST(Options, FilesComeFromTheCommandLineOrAList) {
  const Options named = Parsed({"a.apk"});
  EXPECT_EQ(named.files.list, "");
  EXPECT_FALSE(named.files.has_nul);
  EXPECT_FALSE(named.files.is_recursive);
  const Options listed = Parsed({"--files-from", "-", "-0", "--recursive"});
  EXPECT_EQ(listed.files.names, Lines());
  EXPECT_EQ(listed.files.list, "-");
  EXPECT_TRUE(listed.files.has_nul);
  EXPECT_TRUE(listed.files.is_recursive);
}

TEST(Options, MissingFileArgumentIsReported) {
  EXPECT_EQ(LinesOf(Told({}).errors)[0], "name at least one FILE, or use --files-from LIST");
}

TEST(Options, InstallerIsAutoForApi27AndLaterByDefault) {
  const Options options = Parsed({"a.apk"});
  EXPECT_EQ(options.installer.use, InstallerUse::kAuto);
  EXPECT_EQ(options.installer.levels.first, 27);
  EXPECT_EQ(options.installer.levels.last, kNewestLevel);
  EXPECT_EQ(options.installer.timeout, 30);
  EXPECT_EQ(Parsed({"--installer=required", "a.apk"}).installer.use, InstallerUse::kRequired);
  EXPECT_EQ(Parsed({"--installer", "off", "a.apk"}).installer.use, InstallerUse::kOff);
  EXPECT_EQ(Parsed({"--installer=off", "--installer=auto", "a.apk"}).installer.use,
            InstallerUse::kAuto);
  EXPECT_EQ(Parsed({"--timeout", "2", "a.apk"}).installer.timeout, 2);
}

TEST(Options, ApiAcceptsALevelARangeAndAnOpenRange) {
  const auto levels = [](const std::string& text) {
    const LevelRange range = Parsed({"--api", text, "a.apk"}).installer.levels;
    return std::make_pair(range.first, range.last);
  };
  EXPECT_EQ(levels("28"), std::make_pair(28, 28));
  EXPECT_EQ(levels("27-33"), std::make_pair(27, 33));
  EXPECT_EQ(levels("30-"), std::make_pair(30, kNewestLevel));
}

TEST(Options, SignerDigestsAreStoredInOneForm) {
  const std::string digest(64, 'a');
  std::string pairs = "AA";
  for (int i = 1; i < 32; ++i) pairs += ":aA";
  const Options options = Parsed({"--signer", digest, "--signer=" + pairs, "a.apk", "b.apk"});
  EXPECT_EQ(options.gate.signers, Lines({digest, digest}));
  EXPECT_EQ(options.files.names, Lines({"a.apk", "b.apk"}));
  EXPECT_EQ(Parsed({"a.apk"}).gate.signers, Lines());
}

TEST(Options, GateAndReportOptionsSetTheirValues) {
  EXPECT_FALSE(Parsed({"a.apk"}).gate.refuses_warnings);
  EXPECT_TRUE(Parsed({"--werror", "a.apk"}).gate.refuses_warnings);
  const Options options = Parsed({"--junit", "j", "--sarif", "s", "a.apk"});
  EXPECT_EQ(options.show.junit, "j");
  EXPECT_EQ(options.show.sarif, "s");
}

TEST(Options, JournalOnStandardOutputIsJson) {
  const Options options = Parsed({"--journal", "-", "a.apk"});
  EXPECT_TRUE(options.show.json);
  EXPECT_EQ(options.show.journal, "");
  EXPECT_TRUE(Parsed({"--journal=-", "--json", "a.apk"}).show.json);
  const Options file = Parsed({"--journal", "./-", "a.apk"});
  EXPECT_FALSE(file.show.json);
  EXPECT_EQ(file.show.journal, "./-");
}

TEST(Options, ToolIsOwnUnlessItIsNamed) {
  EXPECT_TRUE(Parsed({"a.apk"}).run.is_own_tool);
  EXPECT_FALSE(Parsed({"--tool", "t", "a.apk"}).run.is_own_tool);
}

TEST(Options, MistakesAreReportedWithStatusTwo) {
  const std::vector<Lines> mistakes = {{},
                                       {"--nonsense", "a.apk"},
                                       {"--sign-errno", "EWHAT", "a.apk"},
                                       {"--sign-errno", "1", "a.apk"},
                                       {"--verify-errno", "", "a.apk"},
                                       {"--zu-result", "x", "a.apk"},
                                       {"--zu-result", "2147483648", "a.apk"},
                                       {"--trust", "/nowhere/at-all", "a.apk"},
                                       {"--installer=maybe", "a.apk"},
                                       {"--installer=", "a.apk"},
                                       {"--api", "", "a.apk"},
                                       {"--api", "0", "a.apk"},
                                       {"--api", "x", "a.apk"},
                                       {"--api", "30-27", "a.apk"},
                                       {"--api", "27-x", "a.apk"},
                                       {"--api", "27-30-33", "a.apk"},
                                       {"--api=-30", "a.apk"},
                                       {"--api", "99999999999", "a.apk"},
                                       {"--signer", "", "a.apk"},
                                       {"--signer", "a.apk"},
                                       {"--signer", std::string(63, 'a'), "a.apk"},
                                       {"--signer", std::string(64, 'g'), "a.apk"},
                                       {"--verify", "--werror", "a.apk"},
                                       {"--verify", "--signer", std::string(64, 'a'), "a.apk"},
                                       {"--verify", "--junit", "/nowhere/j", "a.apk"},
                                       {"--verify", "--sarif", "/nowhere/s", "a.apk"},
                                       {"--journal", "", "a.apk"},
                                       {"--junit", "", "a.apk"},
                                       {"--sarif", "", "a.apk"},
                                       {"--html", "", "a.apk"},
                                       {"--state", "", "a.apk"},
                                       {"--junit", "-", "a.apk"},
                                       {"--sarif", "-", "a.apk"},
                                       {"--html", "-", "a.apk"},
                                       {"--timeout", "0", "a.apk"},
                                       {"--timeout", "-1", "a.apk"},
                                       {"--timeout", "nan", "a.apk"},
                                       {"--timeout", "inf", "a.apk"},
                                       {"--jobs", "0", "a.apk"},
                                       {"--jobs", "x", "a.apk"},
                                       {"--install=x86", "a.apk"},
                                       {"--install"},
                                       {"--recursive"},
                                       {"--files-from"},
                                       {"--files-from", ""},
                                       {"-0", "a.apk"},
                                       {"--recursive", "--verify", "a.apk"},
                                       {"--quiet", "--verbose", "a.apk"},
                                       {"--integrity"}};
  for (const Lines& words : mistakes) {
    const ProcessResult result = Told(words);
    EXPECT_EQ(result.status, 2) << Json(words);
    EXPECT_EQ(result.output, "");
    EXPECT_NE(result.errors, "");
  }
}

TEST(Options, UnknownErrorNameIsReported) {
  EXPECT_EQ(LinesOf(Told({"--sign-errno", "EWHAT", "a.apk"}).errors)[0],
            "--sign-errno: no error has the name EWHAT");
}

TEST(Options, OnlyTheJournalGoesToStandardOutput) {
  EXPECT_EQ(LinesOf(Told({"--junit", "-", "a.apk"}).errors)[0],
            "--junit: it cannot be written to standard output; for a file named -, write ./-");
  EXPECT_TRUE(Parsed({"--journal", "-", "a.apk"}).show.json);
}

TEST(Options, FileThatLooksLikeAnOptionIsNamed) {
  EXPECT_EQ(LinesOf(Told({"-dash.apk"}).errors)[0],
            "there is no option -dash.apk; for a file of this name, write ./-dash.apk");
}

TEST(Options, HelpNamesEveryOptionAndStatus) {
  const ProcessResult result = Told({"--help"});
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.errors, "");
  for (const char* word : {"\nThe phone:\n",
                           "--integrity TEXT[,TEXT]...",
                           "--trust FILE ",
                           "--sign-errno NAME",
                           "--verify-errno NAME",
                           "--zu-result N",
                           "--state DIR",
                           "\nThe run:\n",
                           "--recursive ",
                           "--files-from LIST",
                           "-0,--null ",
                           "--install [=ABI]",
                           "--strict ",
                           "--installer WHEN",
                           "--api LEVEL[-LEVEL]",
                           "--verify ",
                           "--quiet ",
                           "--verbose ",
                           "--signer SHA256",
                           "--werror ",
                           "--journal FILE",
                           "--junit FILE",
                           "--sarif FILE",
                           "--html FILE",
                           "--json ",
                           "--jobs N",
                           "--tool PATH",
                           "--timeout SECONDS",
                           "--runner COMMAND",
                           "--help ",
                           "--version ",
                           "\n  0  everything ",
                           "\n  1  ",
                           "\n  2  ",
                           "\n  3  ",
                           "\n  4  ",
                           "man apktoolkit-sim"}) {
    EXPECT_NE(result.output.find(word), std::string::npos) << word << "\n" << result.output;
  }
}

TEST(Options, HelpFitsATerminalAndShowsDefaultsInOneWay) {
  constexpr size_t kColumns = 80;
  std::string help = Told({"--help"}).output;
  for (const std::string& line : LinesOf(help)) EXPECT_LE(line.size(), kColumns) << line;
  EXPECT_EQ(help.find("=30"), std::string::npos);
  size_t defaults = 0;
  for (size_t at = 0; (at = help.find("[default: ", at)) != std::string::npos; ++at) ++defaults;
  EXPECT_EQ(defaults, 11U);
}

TEST(Options, VersionIsThatOfTheProject) {
  const ProcessResult result = Told({"--version"});
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.output, "apktoolkit-sim " APKTOOLKIT_VERSION "\n");
}
