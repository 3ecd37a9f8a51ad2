#include "simulator/program/options.h"

#include <gtest/gtest.h>

#include <cerrno>

#include "simulator/phone/probe_run.h"
#include "simulator/program/run.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

// What the options are after this command line; it must be a good one.
Options Parsed(Lines words) {
  Options options;
  words.insert(words.begin(), "apktoolkit-sim");
  std::vector<char*> arguments;
  for (std::string& word : words) arguments.push_back(word.data());
  arguments.push_back(nullptr);
  EXPECT_EQ(ParseOptions(static_cast<int>(words.size()), arguments.data(), &options), std::nullopt);
  return options;
}

// The status and the standard error of the simulator for a command line.
ProcessResult Told(const Lines& words) {
  Lines command = {SimulatorPath()};
  command.insert(command.end(), words.begin(), words.end());
  return RunProcess(command);
}

}  // namespace

TEST(Options, DefaultIsAHealthyPhone) {
  const Options options = Parsed({"a.apk"});
  EXPECT_EQ(options.files, Lines({"a.apk"}));
  EXPECT_EQ(options.phone.integrity, Lines({"1f"}));
  EXPECT_EQ(options.phone.sign_errno, 0);
  EXPECT_EQ(options.phone.verify_errno, ENOKEY);
  EXPECT_EQ(options.phone.zu_result, 0);
  EXPECT_EQ(options.trust, Lines());
  EXPECT_EQ(options.state, "");
  EXPECT_EQ(options.journal, "");
  EXPECT_FALSE(options.json);
  EXPECT_EQ(options.tool, ProgramDirectory() + "/apktoolkit");
  EXPECT_EQ(options.runner, Lines());
  EXPECT_EQ(options.timeout, 30);
}

TEST(Options, EachChangesItsPartOfThePhone) {
  const Options options = Parsed({"--integrity", "ffffffff,missing,", "--sign-errno", "EPERM",
                                  "--verify-errno", "EBADMSG", "--zu-result", "-5", "a.apk"});
  EXPECT_EQ(options.phone.integrity, Lines({"ffffffff", "missing", ""}));
  EXPECT_EQ(options.phone.sign_errno, EPERM);
  EXPECT_EQ(options.phone.verify_errno, EBADMSG);
  EXPECT_EQ(options.phone.zu_result, -5);
}

TEST(Options, ZuResultMayBeHexadecimal) {
  EXPECT_EQ(Parsed({"--zu-result", "0x10004", "a.apk"}).phone.zu_result, 65540);
}

TEST(Options, TrustTakesOneFileAtATime) {
  const Options options =
      Parsed({"--trust", "/dev/zero", "--trust", "/dev/null", "a.apk", "b.apk"});
  EXPECT_EQ(options.trust, Lines({"/dev/zero", "/dev/null"}));
  EXPECT_EQ(options.files, Lines({"a.apk", "b.apk"}));
}

TEST(Options, TheRestIsTakenAsItIs) {
  const Options options =
      Parsed({"--state", "s", "--journal", "j", "--json", "--tool", "t", "--timeout", "0.5",
              "--runner", "emulator  -L /root", "--", "-a.apk"});
  EXPECT_EQ(options.state, "s");
  EXPECT_EQ(options.journal, "j");
  EXPECT_TRUE(options.json);
  EXPECT_EQ(options.tool, "t");
  EXPECT_EQ(options.timeout, 0.5);
  EXPECT_EQ(options.runner, Lines({"emulator", "-L", "/root"}));
  EXPECT_EQ(options.files, Lines({"-a.apk"}));
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
                                       {"--timeout", "0", "a.apk"},
                                       {"--timeout", "-1", "a.apk"},
                                       {"--integrity"}};
  for (const Lines& words : mistakes) {
    const ProcessResult result = Told(words);
    EXPECT_EQ(result.status, 2) << Json(words);
    EXPECT_EQ(result.output, "");
    EXPECT_NE(result.errors, "");
  }
}

TEST(Options, AnUnknownErrorIsNamed) {
  EXPECT_EQ(LinesOf(Told({"--sign-errno", "EWHAT", "a.apk"}).errors)[0],
            "--sign-errno: no error has the name EWHAT");
}

TEST(Options, HelpNamesEveryOptionAndStatus) {
  const ProcessResult result = Told({"--help"});
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.errors, "");
  for (const char* word : {"--integrity TEXT[,TEXT]...", "--trust FILE ", "--sign-errno NAME",
                           "--verify-errno NAME", "--zu-result N", "--state DIR", "--journal FILE",
                           "--json", "--tool PATH", "--timeout SECONDS", "--runner COMMAND",
                           "\n  0  all that", "\n  1  ", "\n  2  ", "\n  3  "}) {
    EXPECT_NE(result.output.find(word), std::string::npos) << word << "\n" << result.output;
  }
}
