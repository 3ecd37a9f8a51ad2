// Runs the code of integration/caller. Scripts run the real apktoolkit and apktoolkit-verify in the
// simulated phone, which remembers signed files. Some tests replace or remove programs.
#include "integration/caller/sign_package.h"

#include <gtest/gtest.h>

#include <filesystem>

#include "support/files.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

namespace fs = std::filesystem;

std::string Golden(const std::string& name) { return std::string(GOLDEN_PACKAGES) + "/" + name; }

// A phone: its programs, its packages, and the files that its kernel has signed.
class Phone : public testing::Test {
 protected:
  Phone() {
    InstallProgram("apktoolkit", Simulator(""));
    InstallProgram("apktoolkit-verify", Simulator("--verify "));
    InstallProgram("apktoolkit-bound", std::string("exec '") + APKTOOLKIT_BOUND_PATH + "'");
  }

  // Installs a script in place of a program. The script appends its own arguments to `command`.
  void InstallProgram(const std::string& name, const std::string& command) const {
    bin_.WriteProgram(name, "#!/bin/sh\n" + command + " \"$@\"\n");
  }

  std::string Simulator(const std::string& options) const {
    return "exec '" + SimulatorPath() + "' --state '" + (data_ / "signed") + "' " + options;
  }

  // Installs a package of make_golden_packages. In the returned InstalledPackage, the package's JAR
  // signer is the only signer that the package manager knows.
  InstalledPackage Install(const std::string& name) const {
    fs::copy(Golden(name), data_ / name, fs::copy_options::recursive);
    return {data_ / (name + "/base.apk"), ContentOf(Golden(name) + "/digest").substr(0, 64)};
  }

  SignOutcome Sign(const InstalledPackage& package, const RunLimits& limits = {}) const {
    return SignPackage(bin_.path(), package, limits);
  }

  bool IsTrusted(const std::string& path) const {
    return RunProcess({bin_ / "apktoolkit-verify", path}).status == 0;
  }

  TempDir bin_, data_;
};

TEST_F(Phone, SignsAPackageOnce) {
  const InstalledPackage package = Install("apksigner-sha256-2048");
  EXPECT_EQ(Sign(package), SignOutcome::kTrusted);
  EXPECT_TRUE(IsTrusted(package.path));
  EXPECT_TRUE(IsTrusted(fs::path(package.path).parent_path() / "lib/arm64/libvault.so"));
  InstallProgram("apktoolkit", "exit 1");  // must not run for a signed package
  EXPECT_EQ(Sign(package), SignOutcome::kTrustedAlready);
}

TEST_F(Phone, DoesNotSignAPackageOfAnotherSigner) {
  InstalledPackage package = Install("apksigner-sha256-2048");
  package.signer_digests = Install("apksigner-sha256-4096").signer_digests;
  EXPECT_EQ(Sign(package), SignOutcome::kOtherSigner);
  EXPECT_FALSE(IsTrusted(package.path));
  EXPECT_FALSE(IsTrusted(fs::path(package.path).parent_path() / "lib/arm64/libvault.so"));
}

TEST_F(Phone, DoesNotSignAPackageWithoutAJarSignature) {
  const InstalledPackage package = Install("apksigner-newer-only");
  EXPECT_EQ(Sign(package), SignOutcome::kNoJarSigner);
  EXPECT_FALSE(IsTrusted(package.path));
}

// The signature file's signature is good, but classes.dex does not match the manifest.
TEST_F(Phone, DoesNotTrustAPackageThatTheToolRefuses) {
  const InstalledPackage package = Install("changed-dex");
  EXPECT_EQ(Sign(package), SignOutcome::kNotTrusted);
  EXPECT_FALSE(IsTrusted(package.path));
}

TEST_F(Phone, DoesNotTrustAPackageThatTheKernelRefuses) {
  InstallProgram("apktoolkit", Simulator("--sign-errno EPERM"));
  EXPECT_EQ(Sign(Install("apksigner-sha256-2048")), SignOutcome::kNotTrusted);
}

// The tool waits forever if the kernel never settles the tool's integrity value. Here, `sleep`
// replaces the waiting tool.
TEST_F(Phone, EndsARunThatTakesTooLong) {
  InstallProgram("apktoolkit", "exec sleep 60 #");
  RunLimits limits;
  limits.milliseconds = 3000;
  EXPECT_EQ(Sign(Install("apksigner-sha256-2048"), limits), SignOutcome::kTimedOut);
}

TEST_F(Phone, ReportsAnAbortedRunAsOutOfMemory) {
  InstallProgram("apktoolkit", "kill -ABRT $$; exit");
  EXPECT_EQ(Sign(Install("apksigner-sha256-2048")), SignOutcome::kOutOfMemory);
}

TEST_F(Phone, ReportsMissingPrograms) {
  const InstalledPackage package = Install("apksigner-sha256-2048");
  fs::remove(bin_ / "apktoolkit");
  EXPECT_EQ(Sign(package), SignOutcome::kCannotBeRun);
  fs::remove(bin_ / "apktoolkit-bound");
  EXPECT_EQ(Sign(package), SignOutcome::kCannotBeRun);
}

// ---- apktoolkit-all, which signs each package of a list.

class AfterAnUpdate : public Phone {
 protected:
  ProcessResult SignAll(const std::string& list) const {
    const std::string file = data_.Write("list", ToBytes(list));
    return RunProcess({APKTOOLKIT_ALL_PATH, bin_.path(), file});
  }

  static std::string Line(const InstalledPackage& package) {
    return package.signer_digests + " " + package.path + "\n";
  }
};

TEST_F(AfterAnUpdate, EveryPackageIsSignedAndReported) {
  const InstalledPackage first = Install("apksigner-sha256-2048");
  const InstalledPackage second = Install("apksigner-sha256-4096");
  ProcessResult run = SignAll(Line(first) + Line(second));
  EXPECT_EQ(run.output, first.path + ": trusted\n" + second.path + ": trusted\n");
  EXPECT_EQ(run.errors, "");
  EXPECT_EQ(run.status, 0);

  // Runs again, as after an interrupted run.
  run = SignAll(Line(first) + Line(second));
  EXPECT_EQ(run.output, first.path + ": trusted already\n" + second.path + ": trusted already\n");
  EXPECT_EQ(run.status, 0);
}

TEST_F(AfterAnUpdate, RefusedPackagesDoNotStopTheOthers) {
  InstalledPackage other = Install("apksigner-sha1-2048");
  other.signer_digests = std::string(64, '0');
  const InstalledPackage none = {Install("apksigner-newer-only").path, ""};
  const InstalledPackage good = Install("apksigner-sha256-2048");
  const ProcessResult run = SignAll(Line(other) + Line(none) + Line(good));
  EXPECT_EQ(
      run.output,
      other.path + ": not trusted: its JAR signer is not one of the package manager's signers\n" +
          none.path +
          ": not trusted: it cannot be read, is not a package, or has no good JAR signature\n" +
          good.path + ": trusted\n");
  EXPECT_EQ(run.status, 1);
}

TEST_F(AfterAnUpdate, WrongLinesAreReportedAndSkipped) {
  const InstalledPackage good = Install("apksigner-sha256-2048");
  const ProcessResult run = SignAll("nonsense\n\nabc relative/base.apk\n" + Line(good));
  EXPECT_EQ(run.output, good.path + ": trusted\n");
  EXPECT_EQ(
      run.errors,
      "apktoolkit-all: this line is not \"DIGEST[,DIGEST]... PATH\": nonsense\n"
      "apktoolkit-all: this line is not \"DIGEST[,DIGEST]... PATH\": \n"
      "apktoolkit-all: this line is not \"DIGEST[,DIGEST]... PATH\": abc relative/base.apk\n");
  EXPECT_EQ(run.status, 2);
}

TEST(ApktoolkitAll, NeedsADirectoryAndAReadableList) {
  for (const std::vector<std::string>& words : std::vector<std::vector<std::string>>{
           {}, {"/system/bin"}, {"/system/bin", "/dev/null", "/dev/null"}}) {
    std::vector<std::string> command = {APKTOOLKIT_ALL_PATH};
    command.insert(command.end(), words.begin(), words.end());
    const ProcessResult run = RunProcess(command);
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.errors, "usage: apktoolkit-all DIRECTORY LIST\n");
  }
  const ProcessResult run = RunProcess({APKTOOLKIT_ALL_PATH, "/system/bin", "/nowhere/list"});
  EXPECT_EQ(run.status, 2);
  EXPECT_EQ(run.errors, "apktoolkit-all: cannot open /nowhere/list: No such file or directory\n");
}

// A list that cannot be read must not look like a list whose packages are all trusted. A directory
// can be opened, but not read.
TEST(ApktoolkitAll, ListThatCannotBeReadGivesStatus2) {
  const ProcessResult run = RunProcess({APKTOOLKIT_ALL_PATH, "/system/bin", "/"});
  EXPECT_EQ(run.status, 2);
  EXPECT_EQ(run.output, "");
  EXPECT_EQ(run.errors, "apktoolkit-all: cannot read / to its end\n");
  const ProcessResult empty = RunProcess({APKTOOLKIT_ALL_PATH, "/system/bin", "/dev/null"});
  EXPECT_EQ(empty.status, 0);
  EXPECT_EQ(empty.errors, "");
}

}  // namespace
