// Tests how the signers of a package are compared. The Java side (SignerDigests.java) lists the
// signers that the package manager knows. The C++ side (apktoolkit-bound) checks that the JAR
// signer, which apktoolkit uses, is in this list.
#include <gtest/gtest.h>

#include <filesystem>

#include "support/files.h"
#include "support/lease.h"
#include "support/package.h"
#include "support/process.h"
#include "support/signing_block.h"
#include "support/simulation.h"

namespace {

namespace fs = std::filesystem;
using Words = std::vector<std::string>;

// The path of `name` in the directory of golden packages. tests/journeys/make_golden_packages makes
// these packages, most of them with real signing tools.
std::string Golden(const std::string& name) { return std::string(GOLDEN_PACKAGES) + "/" + name; }

// The SHA-256 digest of the modulus of the golden package's signer. make_golden_packages computed
// this digest with openssl.
std::string DigestOfKey(const std::string& golden) {
  return ContentOf(Golden(golden) + "/digest").substr(0, 64);
}

// Runs the Java side for a phone of this API level.
ProcessResult PackageManager(int level, const std::string& apk, const Words& more = {}) {
  Words command = {JAVA_PROGRAM,          "-cp", SIGNERS_CLASSPATH, "PrintSignerDigests",
                   std::to_string(level), apk};
  command.insert(command.end(), more.begin(), more.end());
  return RunProcess(command);
}

std::string SignersOf(const std::string& apk, int level = 33) {
  const ProcessResult run = PackageManager(level, apk);
  EXPECT_EQ(run.status, 0) << run.errors;
  return run.output.substr(0, run.output.find('\n'));
}

// Runs apktoolkit-bound with a command that prints "run for FILE".
ProcessResult Bound(const std::string& digests, const std::string& file) {
  return RunProcess({APKTOOLKIT_BOUND_PATH, digests, "/bin/echo", "run for", file});
}

void ExpectRun(const std::string& digests, const std::string& file) {
  const ProcessResult run = Bound(digests, file);
  EXPECT_EQ(run.status, 0) << run.errors;
  EXPECT_EQ(run.output, "run for " + file + "\n");
}

void ExpectNotRun(int status, const std::string& digests, const std::string& file) {
  const ProcessResult run = Bound(digests, file);
  EXPECT_EQ(run.status, status) << run.errors;
  EXPECT_EQ(run.output, "");
}

constexpr int kUsageError = 2;
constexpr int kOtherSigner = 3;
constexpr int kNoJarSigner = 4;
constexpr int kNotStarted = 5;

// A package with two different signers. META-INF, the dex file and the libraries are a victim's.
// The signing block is the attacker's.
class PackageWithTwoFaces : public testing::Test {
 protected:
  // The signing block is made with the key "rsa-2048-other". The golden package
  // "openssl-cms-issued" is signed with this key, too.
  PackageWithTwoFaces() : apk_(directory_ / "base.apk") {
    const std::string victims = std::string(THREAT_PACKAGES) + "/foreign/base.apk";
    WriteFile(apk_, AddSigningBlock(ToBytes(ContentOf(victims)), "rsa-2048-other"));
  }

  TempDir directory_;
  const std::string apk_;
};

TEST_F(PackageWithTwoFaces, ShowsTheAttackersKeyToThePackageManager) {
  EXPECT_EQ(SignersOf(apk_, 27), DigestOfKey("openssl-cms-issued"));
  EXPECT_EQ(SignersOf(apk_, 33), DigestOfKey("openssl-cms-issued"));
}

TEST_F(PackageWithTwoFaces, IsNotGivenToTheTool) {
  const ProcessResult run = Bound(SignersOf(apk_), apk_);
  EXPECT_EQ(run.status, kOtherSigner);
  EXPECT_EQ(run.output, "");
  EXPECT_NE(run.errors.find("apktoolkit-bound: " + apk_ + ": the JAR signer " +
                            DigestOfKey("apksigner-sha256-2048") +
                            " is not one of the package's signers " +
                            DigestOfKey("openssl-cms-issued") + "\n"),
            std::string::npos)
      << run.errors;
}

TEST_F(PackageWithTwoFaces, IsRejectedByTheJavaSideToo) {
  const std::string jar_signer = DigestOfKey("apksigner-sha256-2048");
  EXPECT_EQ(PackageManager(33, apk_, {jar_signer}).output, "false\n");
  const std::string good = Golden("apksigner-sha256-2048/base.apk");
  EXPECT_EQ(PackageManager(33, good, {jar_signer}).output, "true\n");
}

class OneSigner : public testing::TestWithParam<const char*> {};

TEST_P(OneSigner, IsTheSameOnBothSides) {
  const std::string apk = Golden(GetParam()) + "/base.apk";
  EXPECT_EQ(SignersOf(apk), DigestOfKey(GetParam()));
  ExpectRun(SignersOf(apk), apk);
}

INSTANTIATE_TEST_SUITE_P(Of, OneSigner,
                         testing::Values("apksigner-sha256-2048", "apksigner-sha1-2048",
                                         "apksigner-sha256-4096"),
                         [](const auto& info) {
                           std::string name = info.param;
                           for (char& c : name) c = c == '-' ? '_' : c;
                           return name;
                         });

// The tool uses the first signature file. The package manager uses all signers.
TEST(Signers, OneOfSeveralIsEnough) {
  const std::string apk = Golden("two-signers/base.apk");
  const std::string digests = SignersOf(apk, 27);
  EXPECT_EQ(digests,
            DigestOfKey("apksigner-sha256-2048") + "," + DigestOfKey("openssl-cms-issued"));
  ExpectRun(digests, apk);
  ExpectRun(DigestOfKey("openssl-cms-issued") + "," + DigestOfKey("apksigner-sha256-2048"), apk);
}

// At API level 33, the package manager uses the new key. The JAR signature is made with the old
// key.
TEST(Signers, RetiredKeyIsNotASigner) {
  const std::string apk = Golden("rotated-key/base.apk");
  EXPECT_EQ(SignersOf(apk, 33), DigestOfKey("openssl-cms-issued"));
  ExpectNotRun(kOtherSigner, SignersOf(apk, 33), apk);
  ExpectRun(SignersOf(apk, 27), apk);
}

// Like the tool, apktoolkit-bound reads a leased package after the holder gives up the lease.
TEST(Signers, LeasedPackageIsReadAfterTheLeaseIsGivenUp) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  fs::copy_file(Golden("apksigner-sha256-2048/base.apk"), apk);
  const Lease lease(apk);
  if (!lease.IsHeld()) GTEST_SKIP() << "the file system of " << apk << " does not support leases";
  ExpectRun(DigestOfKey("apksigner-sha256-2048"), apk);
  EXPECT_TRUE(lease.WasGivenUp());
}

TEST(Signers, EcSignerHasNoDigest) {
  const std::string apk = Golden("apksigner-ec/base.apk");
  EXPECT_EQ(SignersOf(apk), "");
  ExpectNotRun(kNoJarSigner, "", apk);
}

TEST(Signers, FileWithoutAGoodJarSignatureHasNoJarSigner) {
  const TempDir directory;
  const std::string text = directory.Write("text", ToBytes("no archive"));
  PackageOptions jar;
  jar.android_manifest = Bytes();
  MakePackage(jar).WriteTo(directory / "plain.jar");
  const std::string key = DigestOfKey("apksigner-sha256-2048");
  for (const std::string& file :
       {Golden("apksigner-newer-only/base.apk"), Golden("unsigned.apk"),
        Golden("jarsigner-sha256/base.apk"), Golden("openssl-cms-issued/base.apk"), text,
        directory / "plain.jar", directory / "missing", directory.path()}) {
    ExpectNotRun(kNoJarSigner, key, file);
    ExpectNotRun(kNoJarSigner, "", file);
  }
}

// Only a whole digest matches. An empty list of signers matches no package.
TEST(Signers, AreComparedAsWholeDigests) {
  const std::string apk = Golden("apksigner-sha256-2048/base.apk");
  const std::string key = DigestOfKey("apksigner-sha256-2048");
  for (const std::string& digests :
       {std::string(), std::string(","), key.substr(1), key.substr(0, 63), key + "0", " " + key}) {
    ExpectNotRun(kOtherSigner, digests, apk);
  }
  ExpectRun("," + key + ",", apk);
}

TEST(ApktoolkitBound, ReturnsTheCommandsStatusOrItsOwnError) {
  const std::string apk = Golden("apksigner-sha256-2048/base.apk");
  const std::string key = DigestOfKey("apksigner-sha256-2048");
  EXPECT_EQ(RunProcess({APKTOOLKIT_BOUND_PATH, key, "/nowhere/apktoolkit", apk}).status,
            kNotStarted);
  EXPECT_EQ(RunProcess({APKTOOLKIT_BOUND_PATH, key, apk}).status, kUsageError);
  EXPECT_EQ(RunProcess({APKTOOLKIT_BOUND_PATH, key, "/bin/false", apk}).status, 1);
}

TEST(ApktoolkitBound, PassesOnlyTheStandardDescriptorsToTheCommand) {
  const ProcessResult run =
      RunProcess({APKTOOLKIT_BOUND_PATH, DigestOfKey("apksigner-sha256-2048"), "/bin/sh", "-c",
                  "ls /proc/self/fd", Golden("apksigner-sha256-2048/base.apk")});
  EXPECT_EQ(run.output, "0\n1\n2\n3\n");  // 3: the directory that ls reads
}

// The command that apktoolkit-bound executes here is the simulator, which runs the tool.
TEST(ApktoolkitBound, LetsTheToolSignThePackage) {
  const std::string apk = Golden("apksigner-sha256-2048/base.apk");
  const ProcessResult run = RunProcess({APKTOOLKIT_BOUND_PATH, DigestOfKey("apksigner-sha256-2048"),
                                        SimulatorPath(), "--quiet", apk});
  EXPECT_EQ(run.status, 0) << run.errors;
  EXPECT_EQ(run.output.substr(0, 6), "SIGNED");
}

}  // namespace
