// Tests how the simulator runs the Java program that judges packages as a phone's installer does.
// Most tests replace java by a script of their own.
#include "simulator/installer/installer.h"

#include <gtest/gtest.h>

#include <cstdlib>

#include "support/files.h"
#include "support/package.h"
#include "support/process.h"
#include "support/simulation.h"

using namespace simulator;

namespace {

// While a FakeJava exists, `script` is the first program named java on PATH.
class FakeJava {
 public:
  explicit FakeJava(const std::string& script) : path_(getenv("PATH")) {
    directory_.WriteProgram("java", "#!/bin/bash\n" + script);
    setenv("PATH", (directory_.path() + ":" + path_).c_str(), 1);
  }
  ~FakeJava() { setenv("PATH", path_.c_str(), 1); }

  std::string operator/(const std::string& name) const { return directory_ / name; }

 private:
  const TempDir directory_;
  const std::string path_;
};

constexpr char kRefusal[] =
    R"({"ranges":[{"first":27,"last":30,"verified":false,"schemes":[],"signers":[],)"
    R"("errors":[{"issue":"A","parameters":[],"text":""}],"warnings":[]}]})";

InstallerOptions Patient(double seconds) {
  InstallerOptions options;
  options.timeout = seconds;
  options.program = "/proc/self/exe";  // any readable file; the fake java does not use it
  return options;
}

}  // namespace

TEST(InstallerProcess, GetsTheLevelsAndOnePathPerLine) {
  const FakeJava java(
      "echo \"${@: -2}\" >>\"$(dirname \"$0\")/asked\"\n"
      "while read -r path; do cp \"$path\" \"$(dirname \"$0\")/copy\"\necho '" +
      std::string(kRefusal) + "'; done");
  const DiskFile package(MakePackage().Build());
  InstallerOptions options = Patient(30);
  options.levels = {28, 33};
  Installer installer(options);
  EXPECT_EQ(installer.Judge(package.path()).state, Judgement::State::kJudged);
  EXPECT_EQ(ContentOf(java / "copy"), ContentOf(package.path()));
  // The same process judges all packages.
  EXPECT_EQ(installer.Judge(package.path()).state, Judgement::State::kJudged);
  EXPECT_EQ(ContentOf(java / "asked"), "28 33\n");
}

TEST(InstallerProcess, IsNotStartedForAFileThatIsNotAPackage) {
  const FakeJava java("touch \"$(dirname \"$0\")/started\"");
  const DiskFile text(ToBytes("no archive")), jar(MakePackage(PlainJar()).Build());
  const InstallerOptions options = Patient(30);
  Installer installer(options);
  for (const std::string& file : {text.path(), jar.path(), std::string("/nowhere"),
                                  std::string("/dev/zero"), std::string("/tmp")}) {
    EXPECT_EQ(installer.Judge(file).state, Judgement::State::kNotAsked) << file;
  }
  EXPECT_EQ(ContentOf(java / "started"), "");
  EXPECT_NE(RunProcess({"test", "-e", java / "started"}).status, 0);
}

TEST(InstallerProcess, IsNotStartedWhenItIsOff) {
  const FakeJava java("touch \"$(dirname \"$0\")/started\"");
  const DiskFile package(MakePackage().Build());
  InstallerOptions options = Patient(30);
  options.use = InstallerUse::kOff;
  EXPECT_EQ(Installer(options).Judge(package.path()).state, Judgement::State::kNotAsked);
  EXPECT_NE(RunProcess({"test", "-e", java / "started"}).status, 0);
}

// The first process ends without an answer. The second call of Judge() starts a new process.
TEST(InstallerProcess, IsStartedAgainWhenItEnds) {
  const FakeJava java(
      "if [[ ! -e $0.was ]]; then touch \"$0.was\"; read -r path; exit 1; fi\n"
      "while read -r path; do echo '" +
      std::string(kRefusal) + "'; done");
  const DiskFile package(MakePackage().Build());
  const InstallerOptions options = Patient(30);
  Installer installer(options);
  const Judgement first = installer.Judge(package.path());
  EXPECT_EQ(first.state, Judgement::State::kGaveUp);
  EXPECT_EQ(first.why, "it ended");
  EXPECT_EQ(installer.Judge(package.path()).state, Judgement::State::kJudged);
}

TEST(InstallerProcess, IsEndedAndStartedAgainWhenTheTimeIsUp) {
  const FakeJava java(
      "if [[ ! -e $0.was ]]; then echo $$ >\"$0.was\"; exec sleep 60; fi\n"
      "while read -r path; do echo '" +
      std::string(kRefusal) + "'; done");
  const DiskFile package(MakePackage().Build());
  const InstallerOptions options = Patient(1.5);
  Installer installer(options);
  const Judgement first = installer.Judge(package.path());
  EXPECT_EQ(first.state, Judgement::State::kGaveUp);
  EXPECT_EQ(first.why, "it was still busy after 1.5 s");
  const std::string pid = ContentOf(java / "java.was");
  EXPECT_NE(RunProcess({"bash", "-c", "kill -0 " + pid}).status, 0)
      << "the first process must have ended";
  EXPECT_EQ(installer.Judge(package.path()).state, Judgement::State::kJudged);
}

TEST(InstallerProcess, EndlessOutputIsNoAnswer) {
  const FakeJava java("tr '\\0' x </dev/zero");
  const DiskFile package(MakePackage().Build());
  const InstallerOptions options = Patient(60);
  EXPECT_EQ(Installer(options).Judge(package.path()).state, Judgement::State::kGaveUp);
}

// ---- The messages to the user.

TEST(InstallerProcess, FailsTheRunWithStatusThreeWhenItGivesUp) {
  const FakeJava java("read -r path");
  const DiskFile package(MakePackage().Build());
  const ProcessResult run = RunProcess({"env", "LC_ALL=C.UTF-8", SimulatorPath(), package.path()});
  EXPECT_EQ(run.status, 3);
  EXPECT_EQ(run.output.substr(0, 15), "NOT SIMULATED  ");
  EXPECT_NE(run.output.find("the installer's verifier gave up: it ended\n"), std::string::npos)
      << run.output;
  EXPECT_EQ(run.errors,
            "apktoolkit-sim: " + package.path() + ": the installer's verifier gave up: it ended\n");
}

TEST(InstallerProcess, IsReportedOnceWhenItIsMissing) {
  const DiskFile package(MakePackage().Build());
  const auto run = [&](const std::string& when) {
    return RunProcess(
        {"env", "PATH=/nowhere", SimulatorPath(), "--quiet", when, package.path(), package.path()});
  };
  const ProcessResult without = run("--installer=auto");
  EXPECT_EQ(without.status, 0);
  EXPECT_EQ(without.errors,
            "apktoolkit-sim: no phone's installer was asked: java is missing; run apt-get install "
            "default-jre-headless libapksig-java\n");
  const ProcessResult required = run("--installer=required");
  EXPECT_EQ(required.status, 3);
  EXPECT_EQ(required.output, "");
  EXPECT_EQ(required.errors,
            "apktoolkit-sim: java is missing; run apt-get install default-jre-headless "
            "libapksig-java\n");
  EXPECT_EQ(run("--installer=off").errors, "");
}
