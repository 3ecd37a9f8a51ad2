// The signature of a package: the signature file, and the digest of the manifest.
#include <gtest/gtest.h>

#include <algorithm>

#include "apk/package_log.h"
#include "support/certificate.h"
#include "support/jar.h"
#include "support/log_capture.h"
#include "support/open_package.h"
#include "support/signature_block.h"

using ApkTools::Apk;

namespace {

constexpr char kNotVerified[] = "file not verified: META-INF/CERT.SF\n";

PackageOptions WithSignatureFile(const std::string& text) {
  PackageOptions options;
  options.edit_signature_file = [=](const std::string&) { return text; };
  return options;
}

// ---- Finding the signature file and its block.

TEST(InitCertSf, PackageThatIsSignedAsUsualIsGood) {
  EXPECT_EQ(LogOf(PackageOptions()), Records());
}

TEST(InitCertSf, BlockIsFoundByTheBaseNameOfItsSignatureFile) {
  PackageOptions options;
  options.base_name = "META-INF/ANDROIDD";
  EXPECT_EQ(LogOf(options), Records());

  Package package = MakePackage(options);
  package.Item("META-INF/ANDROIDD.RSA").name = "META-INF/CERT.RSA";
  EXPECT_EQ(LogOf(package),
            Records({Error("Can't extract RSA certificate: META-INF/ANDROIDD.RSA\n")}));
}

TEST(InitCertSf, LastDotEndsTheBaseName) {
  PackageOptions options;
  options.base_name = "META-INF/A.B";
  EXPECT_EQ(LogOf(options), Records());
}

TEST(InitCertSf, FailsSilentlyWithoutASignatureFile) {
  Package package = MakePackage();
  package.Remove("META-INF/CERT.SF");
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(InitCertSf, SignatureFileInLowerCaseIsIgnored) {
  Package package = MakePackage();
  package.Item("META-INF/CERT.SF").name = "META-INF/cert.sf";
  package.Item("META-INF/CERT.RSA").name = "META-INF/cert.RSA";
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(InitCertSf, SignatureFileOutsideMetaInfIsIgnored) {
  PackageOptions options;
  options.base_name = "OTHER/CERT";
  LogCapture log;
  OpenPackage open(options);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(InitCertSf, SignatureFileThatCannotBeExtractedFailsSilently) {
  for (const uint32_t length : {1u, 0xfffffffeu}) {
    Package package = MakePackage();
    ZipItem& file = package.Item("META-INF/CERT.SF");
    file.deflated = true;
    file = ClaimingLength(file, length);
    LogCapture log;
    OpenPackage open(package);
    EXPECT_FALSE(open.apk.IsGoodApk());
    EXPECT_EQ(log.records(), Records());
  }
}

TEST(InitCertSf, SignatureFileThatCannotBeParsedIsReportedOnlyByTheParser) {
  EXPECT_EQ(LogOf(WithSignatureFile("Key:x")),
            Records({Error("Parse manifest: Error: P_COLON: unexpected 0x78 after colon: x\n")}));
}

TEST(InitCertSf, MissingBlockIsReported) {
  Package package = MakePackage();
  package.Remove("META-INF/CERT.RSA");
  EXPECT_EQ(LogOf(package), Records({Error("Can't extract RSA certificate: META-INF/CERT.RSA\n")}));
}

TEST(InitCertSf, BlockThatCannotBeExtractedIsReported) {
  Package package = MakePackage();
  ZipItem& block = package.Item("META-INF/CERT.RSA");
  block.deflated = true;
  block = ClaimingLength(block, 0xfffffffe);
  EXPECT_EQ(LogOf(package), Records({Error("Can't extract RSA certificate: META-INF/CERT.RSA\n")}));
}

TEST(InitCertSf, DsaAndEcBlocksAreIgnored) {
  for (const char* extension : {".DSA", ".EC"}) {
    PackageOptions options;
    options.block_extension = extension;
    EXPECT_EQ(LogOf(options),
              Records({Error("Can't extract RSA certificate: META-INF/CERT.RSA\n")}));
  }
}

// The zip library has its own order of entries, so the test asks the library for the first
// signature file.
TEST(InitCertSf, FirstOfTwoSignersInTheZipLibrarysOrderDecides) {
  PackageOptions options;
  options.base_name = "META-INF/OTHER";
  Package package = MakePackage(options);
  package.items.push_back({"META-INF/CERT.SF", ToBytes("Key:x")});

  LogCapture log;
  OpenPackage open(package);
  void* cookie;
  ASSERT_EQ(open.apk.StartIteration(&cookie, "META-INF/", ".SF"), 0);
  ZipEntry entry;
  std::string name;
  ASSERT_EQ(open.apk.Next(cookie, &entry, name), 0);
  open.apk.EndIteration(cookie);
  EXPECT_EQ(open.apk.IsGoodApk(), name == "META-INF/OTHER.SF");
}

TEST(InitCertSf, SignatureFileStaysLoadedIfALaterStepFails) {
  Package package = MakePackage();
  const Bytes manifest = package.Item(kManifestName).data;
  package.Remove("META-INF/CERT.RSA");
  LogCapture log;
  OpenPackage open(package);
  ASSERT_FALSE(open.apk.IsGoodApk());
  log.Clear();
  EXPECT_TRUE(open.apk.ValidateManifest(manifest));
  EXPECT_EQ(log.records(), Records());
}

TEST(InitCertSf, TamperedSignatureFileIsReported) {
  Package package = MakePackage();
  Bytes& text = package.Item("META-INF/CERT.SF").data;
  *std::find(text.begin(), text.end(), '1') = '2';  // of "Signature-Version: 1.0"
  EXPECT_EQ(LogOf(package),
            Records({Error("SHA256 hash does not match"), Error("RSA could not verify data: 12\n"),
                     Error(kNotVerified)}));
}

// ---- The digest of the manifest.

Records RefusedTwice() {
  return {Error("Can't validate manifest.\n"), Error("Can't validate manifest.\n")};
}

// A section without the empty line at its end. For each name in `right`, it has the digest of the
// package's manifest. For each name in `wrong`, it has the digest of empty data. Each name gets the
// suffix "-Manifest".
JarText ManifestDigests(const std::vector<std::string>& right,
                        const std::vector<std::string>& wrong) {
  const Bytes manifest = MakePackage().Item(kManifestName).data;
  return JarText().Digests(right, manifest, "-Manifest").Digests(wrong, {}, "-Manifest");
}

Records LogOfDigests(const std::vector<std::string>& right, const std::vector<std::string>& wrong) {
  return LogOf(WithSignatureFile(ManifestDigests(right, wrong).EndSection().text()));
}

TEST(ValidateManifest, Sha256IsUsedIfItIsTheOnlyDigest) {
  EXPECT_EQ(LogOfDigests({"SHA-256-Digest"}, {}), Records());
  EXPECT_EQ(LogOfDigests({}, {"SHA-256-Digest"}), RefusedTwice());
}

TEST(ValidateManifest, Sha1IsUsedIfItIsTheOnlyDigest) {
  EXPECT_EQ(LogOfDigests({"SHA1-Digest"}, {}), Records());
  EXPECT_EQ(LogOfDigests({}, {"SHA1-Digest"}), RefusedTwice());
}

TEST(ValidateManifest, Sha1IsUsedIfSha256IsAlsoPresent) {
  EXPECT_EQ(LogOfDigests({"SHA1-Digest"}, {"SHA-256-Digest"}), Records());
  EXPECT_EQ(LogOfDigests({"SHA-256-Digest"}, {"SHA1-Digest"}), RefusedTwice());
}

TEST(ValidateManifest, Md5IsIgnoredIfSha1OrSha256IsPresent) {
  EXPECT_EQ(LogOfDigests({"SHA1-Digest"}, {"MD5-Digest"}), Records());
  EXPECT_EQ(LogOfDigests({"SHA-256-Digest"}, {"MD5-Digest"}), Records());
}

TEST(ValidateManifest, Md5AloneIsUnsupported) {
  EXPECT_EQ(LogOfDigests({"MD5-Digest"}, {}),
            Records({Error("verifyData: Unsupported digest type: MD5-Digest\n"),
                     Error("Can't validate manifest.\n"), Error("Can't validate manifest.\n")}));
}

TEST(ValidateManifest, SignatureFileWithoutTheDigestIsRefused) {
  EXPECT_EQ(LogOf(WithSignatureFile("Signature-Version: 1.0\r\n\r\n")), RefusedTwice());
}

TEST(ValidateManifest, SignatureFileWhoseSectionDoesNotEndHasNoDigest) {
  EXPECT_EQ(LogOf(WithSignatureFile(ManifestDigests({"SHA1-Digest"}, {}).text())), RefusedTwice());
}

TEST(ValidateManifest, SectionsForSingleEntriesAreNotLookedAt) {
  const std::string wrong =
      JarText().Section("classes.dex", {"SHA-256-Digest"}, ToBytes("other bytes")).text();
  const std::string right = ManifestDigests({"SHA-256-Digest"}, {}).EndSection().text();
  EXPECT_EQ(LogOf(WithSignatureFile(wrong + right)), Records());
  EXPECT_EQ(LogOf(WithSignatureFile(right + wrong)), Records());
}

TEST(ValidateManifest, DigestOfTheMainAttributesIsIgnored) {
  const Bytes manifest = MakePackage().Item(kManifestName).data;
  EXPECT_EQ(LogOf(WithSignatureFile(
                JarText()
                    .Digests({"SHA-256-Digest"}, manifest, "-Manifest-Main-Attributes")
                    .EndSection()
                    .text())),
            RefusedTwice());
}

TEST(ValidateManifest, FirstSectionMayHaveNoDigest) {
  EXPECT_EQ(LogOf(WithSignatureFile("Signature-Version: 1.0\r\n\r\n" +
                                    ManifestDigests({"SHA-256-Digest"}, {}).EndSection().text())),
            Records());
}

TEST(ValidateManifest, FirstSectionWithADigestDecides) {
  const std::string wrong = ManifestDigests({}, {"SHA-256-Digest"}).EndSection().text();
  const std::string right = ManifestDigests({"SHA-256-Digest"}, {}).EndSection().text();
  EXPECT_EQ(LogOf(WithSignatureFile(wrong + right)), RefusedTwice());
  EXPECT_EQ(LogOf(WithSignatureFile(right + wrong)), Records());
}

TEST(ValidateManifest, DigestThatCannotBeDecodedIsRefused) {
  const Bytes manifest = MakePackage().Item(kManifestName).data;
  const std::string digest = DigestText("SHA-256-Digest", manifest);
  const auto file = [&](const std::string& value) {
    return WithSignatureFile("SHA-256-Digest-Manifest: " + value + "\r\n\r\n");
  };
  EXPECT_EQ(LogOf(file(digest)), Records());
  EXPECT_EQ(LogOf(file(digest.substr(0, 8) + " " + digest.substr(8))), RefusedTwice());
  EXPECT_EQ(LogOf(file("*" + digest)), RefusedTwice());
  EXPECT_EQ(LogOf(file("====")), RefusedTwice());
}

TEST(ValidateManifest, NameThatIsOnlyTheSuffixIsUnsupported) {
  EXPECT_EQ(LogOf(WithSignatureFile("-Digest-Manifest: AAAA\r\n\r\n")),
            Records({Error("verifyData: Unsupported digest type: -Digest\n"),
                     Error("Can't validate manifest.\n"), Error("Can't validate manifest.\n")}));
}

// An empty expected digest is refused before its algorithm is checked.
TEST(ValidateManifest, EmptyMd5DigestIsRefusedWithoutAMessageAboutMd5) {
  EXPECT_EQ(LogOf(WithSignatureFile("MD5-Digest-Manifest: ====\r\n\r\n")),
            Records({Error("Can't validate manifest.\n"), Error("Can't validate manifest.\n")}));
}

TEST(ValidateManifest, MissingSignatureFileIsReported) {
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  EXPECT_FALSE(apk.ValidateManifest(ToBytes("manifest")));
  EXPECT_EQ(log.records(), Records({Error("Can't validate manifest. Bad SF file.\n")}));
}

// ---- The name of the attribute selects the digest algorithm.

class VerifyData : public testing::Test {
 protected:
  VerifyData() : apk_(-1) { log_.Clear(); }

  LogCapture log_;
  Apk apk_;
  // The digests of "abc" (FIPS 180-2, appendices A.1 and B.1).
  const Bytes sha1_ = FromHex("a9993e36 4706816a ba3e2571 7850c26c 9cd0d89d");
  const Bytes sha256_ =
      FromHex("ba7816bf 8f01cfea 414140de 5dae2223 b00361a3 96177a9c b410ff61 f20015ad");
  const Bytes abc_ = ToBytes("abc");
};

TEST_F(VerifyData, NameSelectsTheDigest) {
  EXPECT_TRUE(apk_.VerifyData("SHA1-Digest", sha1_, abc_));
  EXPECT_TRUE(apk_.VerifyData("SHA-256-Digest", sha256_, abc_));
  EXPECT_FALSE(apk_.VerifyData("SHA1-Digest", sha256_, abc_));
  EXPECT_FALSE(apk_.VerifyData("SHA-256-Digest", sha1_, abc_));
  EXPECT_EQ(log_.records(), Records());
}

TEST_F(VerifyData, OtherDataIsAMismatch) {
  EXPECT_FALSE(apk_.VerifyData("SHA1-Digest", sha1_, ToBytes("abd")));
  EXPECT_FALSE(apk_.VerifyData("SHA-256-Digest", sha256_, ToBytes("abd")));
  EXPECT_EQ(log_.records(), Records());
}

TEST_F(VerifyData, ExpectedDigestOfAnotherLengthIsAMismatch) {
  Bytes expected = sha256_;
  expected.pop_back();
  EXPECT_FALSE(apk_.VerifyData("SHA-256-Digest", expected, abc_));
  expected = sha256_;
  expected.push_back(0);
  EXPECT_FALSE(apk_.VerifyData("SHA-256-Digest", expected, abc_));
  EXPECT_FALSE(apk_.VerifyData("SHA-256-Digest", {}, abc_));
}

TEST_F(VerifyData, EmptyDataHasADigest) {
  EXPECT_TRUE(
      apk_.VerifyData("SHA1-Digest", FromHex("da39a3ee 5e6b4b0d 3255bfef 95601890 afd80709"), {}));
}

TEST_F(VerifyData, AnyOtherNameIsUnsupported) {
  for (const char* name :
       {"", "MD5-Digest", "SHA-512-Digest", "SHA-1-Digest", "sha1-digest", "SHA1-Digest ",
        "SHA256-Digest", "X-SHA1-Digest", "X-SHA-256-Digest", " SHA-256-Digest", "SHA-256-Digest-X",
        "SHA1-Diges", "SHA-256-Diges", "1-Digest", "256-Digest"}) {
    for (const Bytes& expected : {sha1_, sha256_}) {
      log_.Clear();
      EXPECT_FALSE(apk_.VerifyData(name, expected, abc_));
      EXPECT_EQ(
          log_.records(),
          Records({Error(std::string("verifyData: Unsupported digest type: ") + name + "\n")}));
    }
  }
}

}  // namespace
