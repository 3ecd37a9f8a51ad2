// Tests each reason except kUnknown with an input that leads to the reason. Also tests that the
// tool's lines stay in the log, and that the archive is released.
#include "library/verification.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <set>
#include <sstream>

#include "support/files.h"
#include "support/open_package.h"
#include "support/package.h"
#include "util/log.h"

using ApkTools::Reason;
using ApkTools::TextOf;
using ApkTools::Verification;

namespace {

// Returns the reason for a file with the bytes `content`. The parser of signature blocks prints to
// standard output, and the log prints to standard error. ReasonOf discards both outputs.
Reason ReasonOf(const Bytes& content) {
  const MemoryFile file(content);
  testing::internal::CaptureStdout();
  testing::internal::CaptureStderr();
  Verification verification(file.fd());
  testing::internal::GetCapturedStderr();
  testing::internal::GetCapturedStdout();
  EXPECT_EQ(verification.apk().IsGoodApk(), verification.reason() == Reason::kGood);
  return verification.reason();
}

Reason ReasonOf(const Package& package) { return ReasonOf(package.Build()); }
Reason ReasonOf(const PackageOptions& options) { return ReasonOf(MakePackage(options)); }

Reason ReasonOf(const SignatureBlock& block) {
  PackageOptions options;
  options.block = block;
  return ReasonOf(options);
}

Reason ReasonWithSignatureFile(const std::string& text) {
  PackageOptions options;
  options.edit_signature_file = [=](const std::string&) { return text; };
  return ReasonOf(options);
}

// A good package from which the entry `name` was removed.
Package Without(const std::string& name) {
  Package package = MakePackage();
  package.Remove(name);
  return package;
}

// A good package in which the entry `name` was changed and cannot be extracted.
Package WithUnreadable(const std::string& name) {
  Package package = MakePackage();
  ZipItem& item = package.Item(name);
  item.deflated = true;
  item = ClaimingLength(item, 0xfffffffe);
  return package;
}

Package WithTampered(const std::string& name) {
  Package package = MakePackage();
  package.Tamper(name);
  return package;
}

size_t CountMappings() {
  std::istringstream maps(ContentOf("/proc/self/maps"));
  size_t count = 0;
  for (std::string line; std::getline(maps, line);) ++count;
  return count;
}

}  // namespace

TEST(VerificationReason, IsGoodForAGoodPackageWithOrWithoutDex) {
  EXPECT_EQ(ReasonOf(PackageOptions()), Reason::kGood);
  EXPECT_EQ(ReasonOf(WithoutDex()), Reason::kGood);
}

TEST(VerificationReason, SaysWhyTheFileIsNotAPackage) {
  testing::internal::CaptureStderr();
  EXPECT_EQ(Verification(-1).reason(), Reason::kNoDescriptor);
  testing::internal::GetCapturedStderr();
  EXPECT_EQ(ReasonOf(ToBytes("This is not a zip archive, but a text.")), Reason::kNoArchive);
  EXPECT_EQ(ReasonOf(PlainJar()), Reason::kNoPackage);
  EXPECT_EQ(ReasonOf(WithUnreadable(kAndroidManifestName)), Reason::kAndroidManifestUnreadable);
}

// AndroidManifest.xml.bak does not count as AndroidManifest.xml. META-INF/MANIFEST.MF.bak does not
// count as META-INF/MANIFEST.MF.
TEST(VerificationReason, DependsOnTheWholeNameOfAnEntry) {
  PackageOptions options = PlainJar();
  options.entries.push_back({"AndroidManifest.xml.bak", ToBytes("x")});
  EXPECT_EQ(ReasonOf(options), Reason::kNoPackage);
  Package package = Without(kManifestName);
  package.items.push_back({"META-INF/MANIFEST.MF.bak", ToBytes("x")});
  EXPECT_EQ(ReasonOf(package), Reason::kUnsigned);
}

TEST(VerificationReason, SaysWhichPartOfTheSignatureIsMissingOrUnreadable) {
  EXPECT_EQ(ReasonOf(Without(kManifestName)), Reason::kUnsigned);
  EXPECT_EQ(ReasonOf(Without("META-INF/CERT.SF")), Reason::kUnsigned);
  EXPECT_EQ(ReasonOf(WithUnreadable(kManifestName)), Reason::kSignatureUnreadable);
  EXPECT_EQ(ReasonOf(WithUnreadable("META-INF/CERT.SF")), Reason::kSignatureUnreadable);
  EXPECT_EQ(ReasonOf(Without("META-INF/CERT.RSA")), Reason::kNoRsaBlock);
  EXPECT_EQ(ReasonOf(WithUnreadable("META-INF/CERT.RSA")), Reason::kNoRsaBlock);
}

TEST(VerificationReason, SaysWhichPartCannotBeParsed) {
  EXPECT_EQ(ReasonWithSignatureFile("Key:x"), Reason::kSignatureFileMalformed);
  EXPECT_EQ(ReasonWithSignatureFile("Key"), Reason::kSignatureFileMalformed);
  EXPECT_EQ(ReasonOf(WithManifest("Key:x")), Reason::kManifestMalformed);
  Package package = MakePackage();
  package.Item("META-INF/CERT.RSA").data = ToBytes("no block");
  EXPECT_EQ(ReasonOf(package), Reason::kBlockMalformed);
  SignatureBlock block;
  block.key = "ec-p256";
  EXPECT_EQ(ReasonOf(block), Reason::kBlockMalformed);
  PackageOptions options = WithoutDex();
  options.android_manifest = ToBytes("<manifest package=\"com.example.app\"/>");
  EXPECT_EQ(ReasonOf(options), Reason::kAndroidManifestMalformed);
}

TEST(VerificationReason, SaysWhichStepOfTheVerificationFails) {
  SignatureBlock block;
  Certificate certificate;
  certificate.public_key_info =
      PublicKeyInfoAround(der::Sequence({der::Integer(Bytes(256, 0x55)), der::Integer(Bytes{1})}));
  block.certificates = certificate.Build();
  EXPECT_EQ(ReasonOf(block), Reason::kKeyRefused) << "anyone can sign with the exponent 1";
  block = {};
  block.issuer_key = "rsa-2048-other";
  EXPECT_EQ(ReasonOf(block), Reason::kCertificateRefused);
  block = {};
  block.wrong_digest = true;
  EXPECT_EQ(ReasonOf(block), Reason::kSignatureRefused);
  Package package = MakePackage();
  Bytes& signature_file = package.Item("META-INF/CERT.SF").data;
  signature_file = Concat({signature_file, ToBytes("Name: x\r\n\r\n")});
  EXPECT_EQ(ReasonOf(package), Reason::kSignatureRefused);
  EXPECT_EQ(ReasonOf(WithTampered(kManifestName)), Reason::kManifestRefused);
  EXPECT_EQ(ReasonWithSignatureFile("Signature-Version: 1.0\r\n\r\n"), Reason::kManifestRefused);
  EXPECT_EQ(ReasonOf(WithTampered("classes.dex")), Reason::kDexRefused);
}

TEST(VerificationReason, EachReasonHasItsOwnText) {
  std::set<std::string> texts;
  for (int i = 0; i <= static_cast<int>(Reason::kUnknown); ++i) {
    texts.insert(TextOf(static_cast<Reason>(i)));
  }
  EXPECT_EQ(texts.size(), static_cast<size_t>(Reason::kUnknown) + 1);
  EXPECT_STREQ(TextOf(Reason::kManifestRefused), "its manifest does not match the signature file");
}

// Two verifications exist at the same time. The second verification does not change the reason of
// the first. A later log line changes neither reason.
TEST(VerificationReason, TwoVerificationsHaveTheirOwnReasons) {
  const MemoryFile bad(WithTampered(kManifestName).Build());
  const MemoryFile good(MakePackage().Build());
  testing::internal::CaptureStderr();
  Verification first(bad.fd());
  Verification second(good.fd());
  LogError("Integrity not confirmed: classes.dex\n");
  testing::internal::GetCapturedStderr();
  EXPECT_EQ(first.reason(), Reason::kManifestRefused);
  EXPECT_EQ(second.reason(), Reason::kGood);
}

TEST(VerificationLog, StillHasTheLinesOfTheTool) {
  const MemoryFile file(WithTampered(kManifestName).Build());
  testing::internal::CaptureStderr();
  const Verification verification(file.fd());
  const std::string log = testing::internal::GetCapturedStderr();
  EXPECT_NE(log.find("Can't validate manifest."), std::string::npos) << log;
}

TEST(VerificationRelease, TwoThousandPackagesLeaveNoMappings) {
  const MemoryFile file(MakePackage().Build());
  const auto verify = [&file] {
    Verification verification(file.fd());
    EXPECT_EQ(verification.reason(), Reason::kGood);
  };
  verify();  // makes the mappings that a process makes only once
  const size_t before = CountMappings();
  for (size_t i = 0; i < 2000; ++i) verify();
  constexpr size_t kMostOfAllocators = 50;  // mappings that allocators may add or split
  EXPECT_LE(CountMappings(), before + kMostOfAllocators);
  EXPECT_GE(fcntl(file.fd(), F_GETFD), 0) << "the descriptor is the caller's";
}

// An Apk that is not released leaves its mapping. The test above would therefore detect a missing
// release.
TEST(VerificationRelease, UnreleasedPackageLeavesAMapping) {
  const MemoryFile file(MakePackage().Build());
  const size_t before = CountMappings();
  for (size_t i = 0; i < 100; ++i) ApkTools::Apk apk(file.fd());
  EXPECT_GE(CountMappings(), before + 100);
}

TEST(VerificationRelease, ClosesTheArchiveOnceAndKeepsTheFacts) {
  OpenPackage open{PackageOptions()};
  EXPECT_TRUE(open.apk.IsGoodApk());
  open.apk.Release();
  open.apk.Release();
  void* cookie;
  EXPECT_NE(open.apk.StartIteration(&cookie, "", ""), 0);
  EXPECT_TRUE(open.apk.IsGoodApk());
  EXPECT_EQ(open.apk.GetPackageName(), "com.example.app");
}

TEST(VerificationRelease, ClosesTheDescriptorThatInitOpened) {
  const DiskFile file(MakePackage().Build());
  ApkTools::Apk apk(-1);
  apk.Init(-1, file.path().c_str());
  const int fd = apk.GetFd();
  ASSERT_GE(fcntl(fd, F_GETFD), 0);
  apk.Release();
  EXPECT_EQ(fcntl(fd, F_GETFD), -1);
}
