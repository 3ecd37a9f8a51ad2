// JARs, which are signed only if the kernel already trusts them, and other files that are not
// packages.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <openssl/sha.h>
#include <sys/xattr.h>
#include <ziparchive/zip_archive.h>

#include <cerrno>
#include <cstring>

#include "support/expected_timeline.h"
#include "support/files.h"
#include "support/package.h"
#include "support/simulation.h"

namespace {

const Bytes kEmptyPayload = {0, 0};

void WriteJar(const std::string& path) {
  PackageOptions options;
  options.android_manifest = Bytes();
  options.entries = {{"classes.dex", ToBytes("dex\n035")}};
  MakePackage(options).WriteTo(path);
}

// A directory on a file system that supports extended attributes with names user.*.
std::string PlaceForAttributes() {
  for (const char* place : {"/tmp", "/var/tmp", "/dev/shm", "."}) {
    const TempDir directory(place);
    const std::string file = directory.Write("probe", {});
    if (setxattr(file.c_str(), "user.zu", "1", 1, 0) == 0) return place;
  }
  ADD_FAILURE() << "no file system with user extended attributes";
  return "/tmp";
}

void SetAttribute(const std::string& path, const std::string& value) {
  ASSERT_EQ(setxattr(path.c_str(), "user.zu", value.data(), value.size(), 0), 0) << strerror(errno);
}

// The key block that is registered for a JAR: four SHA-256 digests. The first is the digest of the
// path. Each later digest is the digest of the previous digest.
Bytes KeyBlock(const std::string& path) {
  Bytes block(4 * SHA256_DIGEST_LENGTH);
  SHA256(reinterpret_cast<const uint8_t*>(path.data()), path.size(), &block[0]);
  SHA256(&block[0], 32, &block[32]);
  SHA256(&block[32], 32, &block[64]);
  SHA256(&block[64], 32, &block[96]);
  return block;
}

// The timeline of a run for a plain JAR, up to the "verify" event. `refusal` is 0 if the kernel
// trusts the JAR, else the kernel's errno.
std::string JarUpToVerify(const std::string& path, int refusal = 0) {
  return Timeline({Log(6, "Can't extract Android Manifest: Entry not found\n"),
                   Log(4, "VeltSignJni starts: 3.\n"),
                   Log(6, "VeltSignJni: malformed apk: " + path + "\n"),
                   Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n"),
                   Log(4, "VeltSignOat: non-Apk (Jar) case\n"), Verify(3, path, refusal)});
}

std::string SignedJar(const std::string& path) {
  return Timeline({JarUpToVerify(path), Integrity("1f"), Sign(3, path, kEmptyPayload),
                   Log(4, "VeltSign finished: 0.\n")});
}

std::string UntrustedJar(const std::string& path, int refusal = ENOKEY) {
  return Timeline({JarUpToVerify(path, refusal),
                   Log(4, "VELT can't verify a file " + std::to_string(refusal) + ": /" +
                              strerror(refusal) + ".\n"),
                   Log(4, "VeltSign finished: 65536.\n")});
}

std::string RegisteredJar(const std::string& path) {
  return Timeline({Log(4, "ZuAddCertificate: Call ZuNewCertificate for JAR.\n"),
                   Register(3, path, path, KeyBlock(path)),
                   Log(4, "ZuAddCertificate: ZuNewCertificate return 0.\n")});
}

TEST(Jar, TrustedJarIsSignedWithAnEmptyPayload) {
  const TempDir directory;
  const std::string jar = directory / "framework.jar";
  WriteJar(jar);

  const Simulation run = Simulate(jar, {"--trust", jar});

  EXPECT_EQ(run.timeline,
            Timeline({Log(6, "Can't extract Android Manifest: Entry not found\n"),
                      Log(4, "VeltSignJni starts: 3.\n"),
                      Log(6, "VeltSignJni: malformed apk: " + jar + "\n"),
                      Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n"),
                      Log(4, "VeltSignOat: non-Apk (Jar) case\n"), Verify(3, jar), Integrity("1f"),
                      Sign(3, jar, {0, 0}), Log(4, "VeltSign finished: 0.\n"), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

TEST(Jar, UntrustedJarIsNotSigned) {
  const TempDir directory;
  const std::string jar = directory / "framework.jar";
  WriteJar(jar);

  const Simulation run = Simulate(jar);

  EXPECT_EQ(run.timeline, Timeline({UntrustedJar(jar), Exit(0)}));
  EXPECT_EQ(run.status, 1);
}

TEST(Jar, KernelsReasonIsLogged) {
  const TempDir directory;
  const std::string jar = directory / "framework.jar";
  WriteJar(jar);

  const Simulation run = Simulate(jar, {"--verify-errno", "EKEYREVOKED"});

  EXPECT_EQ(run.timeline, Timeline({UntrustedJar(jar, EKEYREVOKED), Exit(0)}));
  EXPECT_EQ(run.status, 1);
}

TEST(Jar, TrustedJarWithAttributeIsSignedAndRegisteredUnderItsPath) {
  const TempDir directory(PlaceForAttributes());
  const std::string jar = directory / "framework.jar";
  WriteJar(jar);
  SetAttribute(jar, "1");

  const Simulation run = Simulate(jar, {"--trust", jar});

  EXPECT_EQ(run.timeline, Timeline({SignedJar(jar), RegisteredJar(jar), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

TEST(Jar, UntrustedJarWithAttributeIsStillRegistered) {
  const TempDir directory(PlaceForAttributes());
  const std::string jar = directory / "framework.jar";
  WriteJar(jar);
  SetAttribute(jar, "1");

  const Simulation run = Simulate(jar);

  EXPECT_EQ(run.timeline, Timeline({UntrustedJar(jar), RegisteredJar(jar), Exit(0)}));
  EXPECT_EQ(run.status, 1);
}

TEST(Jar, JarWithAnEmptyAttributeIsNotRegistered) {
  const TempDir directory(PlaceForAttributes());
  const std::string jar = directory / "framework.jar";
  WriteJar(jar);
  SetAttribute(jar, "");

  const Simulation run = Simulate(jar, {"--trust", jar});

  EXPECT_EQ(run.timeline, Timeline({SignedJar(jar), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

TEST(Jar, RefusedRegistrationIsLogged) {
  const TempDir directory(PlaceForAttributes());
  const std::string jar = directory / "framework.jar";
  WriteJar(jar);
  SetAttribute(jar, "1");

  const Simulation run = Simulate(jar, {"--trust", jar, "--zu-result", "-5"});

  EXPECT_EQ(run.timeline,
            Timeline({SignedJar(jar), Log(4, "ZuAddCertificate: Call ZuNewCertificate for JAR.\n"),
                      Register(3, jar, jar, KeyBlock(jar), -5),
                      Log(6, "ZuAddCertificate: ZuNewCertificate failed -5.\n"), Exit(0)}));
  EXPECT_EQ(run.status, 1);
}

TEST(Jar, RefusedSignatureIsLogged) {
  const TempDir directory;
  const std::string jar = directory / "framework.jar";
  WriteJar(jar);

  const Simulation run = Simulate(jar, {"--trust", jar, "--sign-errno", "EPERM"});

  EXPECT_EQ(
      run.timeline,
      Timeline({JarUpToVerify(jar), Integrity("1f"), Sign(3, jar, kEmptyPayload, EPERM),
                Log(6, std::string("VELT can't sign a non-APK file (result=10000, errno 1: ") +
                           strerror(EPERM) + ").\n"),
                Log(4, "VeltSign finished: 65536.\n"), Exit(0)}));
  EXPECT_EQ(run.status, 1);
}

TEST(Jar, TrustedJarWithATamperedManifestIsSigned) {
  const TempDir directory;
  const std::string jar = directory / "framework.jar";
  PackageOptions options;
  options.android_manifest = Bytes();
  Package package = MakePackage(options);
  package.Tamper(kManifestName);
  package.WriteTo(jar);

  const Simulation run = Simulate(jar, {"--trust", jar});

  EXPECT_EQ(run.timeline, Timeline({SignedJar(jar), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

// The timeline of a run for a file that the zip library refuses.
std::string NotAnArchive(const std::string& path, const std::string& reason) {
  return Timeline({Log(6, "OpenArchiveFd(3) [file: " + path + "] returned: " + reason + "\n"),
                   Log(4, "VeltSignJni starts: 3.\n"),
                   Log(6, "VeltSignJni: malformed apk: " + path + "\n"),
                   Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n"),
                   Log(6, "Zip archive is not valid for fd=3\n"), Exit(0)});
}

TEST(FileThatIsNotAnArchive, TextFileIsRefusedByBothSigningSteps) {
  const TempDir directory;
  const std::string file = directory.Write("notes.txt", Bytes(1000, 'x'));

  const Simulation run = Simulate(file, {"--trust", file});

  EXPECT_EQ(run.timeline, NotAnArchive(file, "-3: Invalid file"));
  EXPECT_EQ(run.status, 1);
}

TEST(FileThatIsNotAnArchive, EmptyFileIsRefusedByBothSigningSteps) {
  const TempDir directory;
  const std::string file = directory.Write("empty.apk", {});

  const Simulation run = Simulate(file, {"--trust", file});

  EXPECT_EQ(run.timeline, NotAnArchive(file, "-3: Invalid file"));
  EXPECT_EQ(run.status, 1);
}

// An empty archive has only the end-of-central-directory record.
TEST(FileThatIsNotAnArchive, EmptyArchiveIsRefusedByBothSigningSteps) {
  const TempDir directory;
  const std::string file = directory.Write("empty.zip", BuildZip({}));

  const Simulation run = Simulate(file, {"--trust", file});

  EXPECT_EQ(run.timeline, NotAnArchive(file, "-6: Empty archive"));
  EXPECT_EQ(run.status, 1);
}

TEST(FileThatIsNotAnArchive, TextFileWithTheAttributeIsNotRegistered) {
  const TempDir directory(PlaceForAttributes());
  const std::string file = directory.Write("notes.txt", Bytes(1000, 'x'));
  SetAttribute(file, "1");

  const Simulation run = Simulate(file, {"--trust", file});

  EXPECT_EQ(run.timeline, NotAnArchive(file, "-3: Invalid file"));
  EXPECT_EQ(run.status, 1);
}

// The zip library's result for a file that the library does not open, in the form of the tool's
// log: "CODE: TEXT".
std::string ZipRefusal(const std::string& path) {
  const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  ZipArchiveHandle archive = nullptr;
  const int32_t result = OpenArchiveFd(fd, "", &archive);
  CloseArchive(archive);
  return std::to_string(result) + ": " + ErrorCodeString(result);
}

// No version of the zip library opens a directory, but the versions return different codes.
TEST(FileThatIsNotAnArchive, DirectoryIsRefusedByBothSigningSteps) {
  const TempDir directory;
  const std::string refusal = ZipRefusal(directory.path());
  ASSERT_EQ(refusal[0], '-');

  const Simulation run = Simulate(directory.path());

  EXPECT_EQ(run.timeline, NotAnArchive(directory.path(), refusal));
  EXPECT_EQ(run.status, 1);
}

}  // namespace
