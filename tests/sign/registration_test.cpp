// Tests ZuSign: the file, the name and the bytes that it registers, and the messages that it logs.
#include "sign/registration.h"

#include <gtest/gtest.h>
#include <openssl/sha.h>

#include <cstring>

#include "support/files.h"
#include "support/log_capture.h"
#include "support/open_package.h"
#include "support/package.h"
#include "support/phone.h"

namespace {

using Events = std::vector<std::string>;

// An archive in memory, opened as main() opens it. `log` has only the messages after the opening,
// and `phone` takes the place of libzu.
struct ArchiveOnPhone {
  explicit ArchiveOnPhone(const Package& package) : open(package), apk(open.apk) { log.Clear(); }
  int fd() const { return open.file.fd(); }

  LogCapture log;
  Phone phone;
  OpenPackage open;
  ApkTools::Apk& apk;
};

Package SecureStoragePackage() {
  PackageOptions options;
  options.secure_storage = true;
  return MakePackage(options);
}

std::string RegisterPackage(int fd) {
  return "register " + std::to_string(fd) + " com.example.app " + Hex(ModulusOf("rsa-2048"));
}

// The event that registers a JAR. Its data are four SHA-256 digests, computed by libcrypto. The
// first is the digest of the path. Each later digest is the digest of the previous digest.
std::string RegisterJar(int fd, const std::string& path) {
  uint8_t block[4 * SHA256_DIGEST_LENGTH];
  SHA256(reinterpret_cast<const uint8_t*>(path.data()), path.size(), block);
  for (int i = 1; i < 4; ++i) {
    SHA256(block + (i - 1) * SHA256_DIGEST_LENGTH, SHA256_DIGEST_LENGTH,
           block + i * SHA256_DIGEST_LENGTH);
  }
  return "register " + std::to_string(fd) + " " + path + " " + Hex(block, sizeof(block));
}

TEST(ZuSign, PackageWithoutThePermissionIsSkippedSilently) {
  ArchiveOnPhone file(MakePackage());
  ZuSign(file.apk, file.fd(), file.fd());
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(), Records());
}

TEST(ZuSign, PackageIsRegisteredUnderItsNameWithItsSignersKey) {
  ArchiveOnPhone file(SecureStoragePackage());
  ZuSign(file.apk, file.fd(), file.fd());
  EXPECT_EQ(file.phone.events, Events({RegisterPackage(file.fd())}));
  EXPECT_EQ(file.log.records(), Records({Info("ZuAddCertificate: ZuNewCertificate return 0.\n")}));
}

TEST(ZuSign, Result65540IsLoggedAsSuccess) {
  ArchiveOnPhone file(SecureStoragePackage());
  file.phone.zu_result = 0x10004;
  ZuSign(file.apk, file.fd(), file.fd());
  EXPECT_EQ(file.phone.events, Events({RegisterPackage(file.fd())}));
  EXPECT_EQ(file.log.records(),
            Records({Info("ZuAddCertificate: ZuNewCertificate return 65540.\n")}));
}

TEST(ZuSign, EveryOtherResultIsAFailure) {
  for (const int result : {1, -1, 0x10000, 0x10003, 0x10005}) {
    ArchiveOnPhone file(SecureStoragePackage());
    file.phone.zu_result = result;
    ZuSign(file.apk, file.fd(), file.fd());
    EXPECT_EQ(file.log.records(), Records({Error("ZuAddCertificate: ZuNewCertificate failed " +
                                                 std::to_string(result) + ".\n")}));
  }
}

TEST(ZuSign, RegistersTheSecondDescriptor) {
  ArchiveOnPhone file(SecureStoragePackage());
  ZuSign(file.apk, file.fd(), 0);
  EXPECT_EQ(file.phone.events, Events({RegisterPackage(0)}));
}

TEST(ZuSign, PackageWithABadDexFileIsNotRegistered) {
  // The tool reads the permission only after it has verified META-INF/MANIFEST.MF. This test
  // therefore damages only the dex file.
  Package package = SecureStoragePackage();
  package.Tamper("classes.dex");
  ArchiveOnPhone file(package);
  EXPECT_FALSE(file.apk.IsGoodApk());
  file.log.Clear();
  ZuSign(file.apk, 77, 78);
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(),
            Records({Error("Apk archive is not valid for fd=" + std::to_string(file.fd()) +
                           ", path=/memfd:test (deleted)\n")}));
}

TEST(ZuSign, PackageWhoseSecondFdHasNoPathIsReportedAndRegistered) {
  ArchiveOnPhone file(SecureStoragePackage());
  file.phone.nameless_fds = {file.fd()};
  const std::string fd = std::to_string(file.fd());
  ZuSign(file.apk, file.fd(), file.fd());
  EXPECT_EQ(file.phone.events, Events({RegisterPackage(file.fd())}));
  EXPECT_EQ(file.log.records(), Records({Error("Can't get oat location from fd=" + fd + "\n"),
                                         Info("ZuAddCertificate: ZuNewCertificate return 0.\n")}));
}

TEST(ZuSign, JarWithoutTheAttributeIsSkippedSilently) {
  ArchiveOnPhone file(MakePackage(PlainJar()));
  ZuSign(file.apk, file.fd(), file.fd());
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(), Records());
}

// An attribute of any size above 0 asks for the registration. The tool therefore reads only the
// attribute's size, not its value.
TEST(ZuSign, AttributeSizeIsReadFromTheFirstDescriptor) {
  ArchiveOnPhone file(MakePackage(PlainJar()));
  file.phone.zu_attribute_size = 1;
  ZuSign(file.apk, file.fd(), 78);
  EXPECT_EQ(file.phone.attributes, Events({std::to_string(file.fd()) + " user.zu null 0"}));
}

TEST(ZuSign, JarWithAnEmptyAttributeIsSkippedSilently) {
  ArchiveOnPhone file(MakePackage(PlainJar()));
  file.phone.zu_attribute_size = 0;
  ZuSign(file.apk, file.fd(), file.fd());
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(), Records());
}

TEST(ZuSign, JarIsRegisteredUnderItsPathWithFourChainedDigests) {
  ArchiveOnPhone file(MakePackage(PlainJar()));
  file.phone.zu_attribute_size = 1;
  ZuSign(file.apk, file.fd(), file.fd());
  EXPECT_EQ(file.phone.events, Events({RegisterJar(file.fd(), "/memfd:test (deleted)")}));
  EXPECT_EQ(file.log.records(), Records({Info("ZuAddCertificate: Call ZuNewCertificate for JAR.\n"),
                                         Info("ZuAddCertificate: ZuNewCertificate return 0.\n")}));
}

TEST(ZuSign, KeyBlockOfAJarIs128Bytes) {
  ArchiveOnPhone file(MakePackage(PlainJar()));
  file.phone.zu_attribute_size = 1;
  ZuSign(file.apk, file.fd(), file.fd());
  ASSERT_EQ(file.phone.events.size(), 1U);
  const std::string& event = file.phone.events[0];
  EXPECT_EQ(event.size() - event.rfind(' ') - 1, 2 * 128U);
}

TEST(ZuSign, JarWithoutAPathIsReportedAndNotRegistered) {
  ArchiveOnPhone file(MakePackage(PlainJar()));
  file.phone.zu_attribute_size = 1;
  file.phone.nameless_fds = {file.fd()};
  ZuSign(file.apk, file.fd(), 0);
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(),
            Records({Error("Can't get jar location from fd=" + std::to_string(file.fd()) + "\n")}));
}

TEST(ZuSign, JarWhoseSecondFdHasNoPathIsReportedAndRegistered) {
  ArchiveOnPhone file(MakePackage(PlainJar()));
  file.phone.zu_attribute_size = 1;
  file.phone.nameless_fds = {78};
  ZuSign(file.apk, file.fd(), 78);
  EXPECT_EQ(file.phone.events, Events({RegisterJar(78, "/memfd:test (deleted)")}));
  EXPECT_EQ(file.log.records(), Records({Error("Can't get oat location from fd=78\n"),
                                         Info("ZuAddCertificate: Call ZuNewCertificate for JAR.\n"),
                                         Info("ZuAddCertificate: ZuNewCertificate return 0.\n")}));
}

TEST(ZuSign, RefusedRegistrationOfAJarIsReported) {
  ArchiveOnPhone file(MakePackage(PlainJar()));
  file.phone.zu_attribute_size = 1;
  file.phone.zu_result = 5;
  ZuSign(file.apk, file.fd(), file.fd());
  EXPECT_EQ(file.log.records(), Records({Info("ZuAddCertificate: Call ZuNewCertificate for JAR.\n"),
                                         Error("ZuAddCertificate: ZuNewCertificate failed 5.\n")}));
}

TEST(ZuSign, FileThatIsNotAZipArchiveIsSkippedSilently) {
  LogCapture log;
  Phone phone;
  phone.zu_attribute_size = 1;
  MemoryFile file(ToBytes("no archive"));
  ApkTools::Apk apk(file.fd());
  log.Clear();
  ZuSign(apk, file.fd(), file.fd());
  EXPECT_EQ(phone.events, Events());
  EXPECT_EQ(log.records(), Records());
}

}  // namespace
