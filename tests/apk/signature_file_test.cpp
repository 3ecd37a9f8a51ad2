// The signature of a package: signature file, signature block, and the digest of the manifest.
#include <gtest/gtest.h>

#include <algorithm>

#include "support/certificate.h"
#include "support/jar.h"
#include "support/log_capture.h"
#include "support/open_package.h"
#include "support/signature_block.h"

using ApkTools::Apk;

namespace {

constexpr char kNotVerified[] = "file not verified: META-INF/CERT.SF\n";

// What opening the package logs.
Records LogOf(const Package& package) {
  LogCapture log;
  OpenPackage open(package);
  EXPECT_EQ(open.apk.IsGoodApk(), log.records().empty());
  return log.records();
}

Records LogOf(const PackageOptions& options) { return LogOf(MakePackage(options)); }

PackageOptions WithBlock(const SignatureBlock& block) {
  PackageOptions options;
  options.block = block;
  return options;
}

PackageOptions WithSignatureFile(const std::string& text) {
  PackageOptions options;
  options.edit_signature_file = [=](const std::string&) { return text; };
  return options;
}

// ---- Finding the signature file and its block.

TEST(InitCertSf, ThePackageThatIsSignedAsUsualIsGood) {
  EXPECT_EQ(LogOf(PackageOptions()), Records());
}

TEST(InitCertSf, ABlockGoesByTheBaseNameOfItsSignatureFile) {
  PackageOptions options;
  options.base_name = "META-INF/ANDROIDD";
  EXPECT_EQ(LogOf(options), Records());

  Package package = MakePackage(options);
  package.Item("META-INF/ANDROIDD.RSA").name = "META-INF/CERT.RSA";
  EXPECT_EQ(LogOf(package),
            Records({Error("Can't extract RSA certificate: META-INF/ANDROIDD.RSA\n")}));
}

TEST(InitCertSf, TheLastDotEndsTheBaseName) {
  PackageOptions options;
  options.base_name = "META-INF/A.B";
  EXPECT_EQ(LogOf(options), Records());
}

TEST(InitCertSf, WithoutASignatureFileItFailsSilently) {
  Package package = MakePackage();
  package.Remove("META-INF/CERT.SF");
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(InitCertSf, ASignatureFileInLowerCaseIsNone) {
  Package package = MakePackage();
  package.Item("META-INF/CERT.SF").name = "META-INF/cert.sf";
  package.Item("META-INF/CERT.RSA").name = "META-INF/cert.RSA";
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(InitCertSf, ASignatureFileElsewhereIsNone) {
  PackageOptions options;
  options.base_name = "OTHER/CERT";
  LogCapture log;
  OpenPackage open(options);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(InitCertSf, ASignatureFileThatCannotBeExtractedFailsSilently) {
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

TEST(InitCertSf, ASignatureFileThatDoesNotParseIsTheParsersMessageAlone) {
  EXPECT_EQ(LogOf(WithSignatureFile("Key:x")),
            Records({Error("Parse manifest: Error: P_COLON: unexpected 0x78 after colon: x\n")}));
}

TEST(InitCertSf, ABlockThatIsMissingIsReported) {
  Package package = MakePackage();
  package.Remove("META-INF/CERT.RSA");
  EXPECT_EQ(LogOf(package), Records({Error("Can't extract RSA certificate: META-INF/CERT.RSA\n")}));
}

TEST(InitCertSf, ABlockThatCannotBeExtractedIsReported) {
  Package package = MakePackage();
  ZipItem& block = package.Item("META-INF/CERT.RSA");
  block.deflated = true;
  block = ClaimingLength(block, 0xfffffffe);
  EXPECT_EQ(LogOf(package), Records({Error("Can't extract RSA certificate: META-INF/CERT.RSA\n")}));
}

TEST(InitCertSf, BlocksOfOtherKindsAreNotLookedFor) {
  for (const char* extension : {".DSA", ".EC"}) {
    PackageOptions options;
    options.block_extension = extension;
    EXPECT_EQ(LogOf(options),
              Records({Error("Can't extract RSA certificate: META-INF/CERT.RSA\n")}));
  }
}

// The library's order of entries is its own; which comes first is asked of it.
TEST(InitCertSf, OfTwoSignersTheFirstInTheArchivesOrderDecides) {
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

TEST(InitCertSf, ATamperedSignatureFileIsNotVerified) {
  Package package = MakePackage();
  Bytes& text = package.Item("META-INF/CERT.SF").data;
  *std::find(text.begin(), text.end(), '1') = '2';  // of "Signature-Version: 1.0"
  EXPECT_EQ(LogOf(package),
            Records({Error("SHA256 hash does not match"), Error("RSA could not verify data: 12\n"),
                     Error(kNotVerified)}));
}

// ---- The signature block.

TEST(VerifyCertificate, EveryDigestASignerMayUseVerifies) {
  for (const Digest digest : {Digest::kMd5, Digest::kSha1, Digest::kSha256}) {
    SignatureBlock block;
    block.digest = digest;
    EXPECT_EQ(LogOf(WithBlock(block)), Records());
  }
}

TEST(VerifyCertificate, KeysFrom1024To4096BitsVerifyAndBecomeTheManufacturerKey) {
  for (const char* key : {"rsa-1024", "rsa-1536", "rsa-2048", "rsa-3072", "rsa-4096"}) {
    SignatureBlock block;
    block.key = key;
    OpenPackage open(WithBlock(block));
    EXPECT_TRUE(open.apk.IsGoodApk()) << key;
    EXPECT_EQ(open.apk.GetManufacturerKey(), ModulusOf(key));
  }
}

TEST(VerifyCertificate, A2048BitKeyIsKeptAs256Bytes) {
  OpenPackage open{PackageOptions()};
  EXPECT_EQ(open.apk.GetManufacturerKey().size(), 256u);
}

TEST(VerifyCertificate, ExponentsOfOneByteVerify) {
  for (const char* key : {"rsa-2048-e3", "rsa-2048-e17"}) {
    SignatureBlock block;
    block.key = key;
    EXPECT_EQ(LogOf(WithBlock(block)), Records()) << key;
  }
}

TEST(VerifyCertificate, WhatIsNoSignatureBlockIsAnUnknownType) {
  Package package = MakePackage();
  package.Item("META-INF/CERT.RSA").data = ToBytes("no block");
  testing::internal::CaptureStdout();
  EXPECT_EQ(LogOf(package), Records({Error("Unknown certificate type"), Error(kNotVerified)}));
  EXPECT_NE(testing::internal::GetCapturedStdout(), "");
}

TEST(VerifyCertificate, AnEmptyBlockIsAnUnknownType) {
  Package package = MakePackage();
  package.Item("META-INF/CERT.RSA").data = {};
  testing::internal::CaptureStdout();
  EXPECT_EQ(LogOf(package), Records({Error("Unknown certificate type"), Error(kNotVerified)}));
  testing::internal::GetCapturedStdout();
}

TEST(VerifyCertificate, AnEllipticCurveKeyIsAnUnknownType) {
  SignatureBlock block;
  block.key = "ec-p256";
  testing::internal::CaptureStdout();
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("Unknown certificate type"), Error(kNotVerified)}));
  testing::internal::GetCapturedStdout();
}

TEST(VerifyCertificate, ACertificateOfAnotherIssuerFailsThoughTheSignatureIsGood) {
  SignatureBlock block;
  block.issuer_key = "rsa-2048-other";
  const Records records = LogOf(WithBlock(block));
  ASSERT_FALSE(records.empty());
  // What the other key's signature decrypts to is no padding (7), or is not below the modulus (5).
  EXPECT_TRUE(
      records == Records({Error("RSA could not verify certificate: 7\n"), Error(kNotVerified)}) ||
      records == Records({Error("RSA could not verify certificate: 5\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, ASignatureOverOtherBytesFails) {
  SignatureBlock block;
  block.wrong_digest = true;
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("SHA256 hash does not match"), Error("RSA could not verify data: 12\n"),
                     Error(kNotVerified)}));
}

TEST(VerifyCertificate, AuthenticatedAttributesFail) {
  SignatureBlock block;
  block.authenticated_attributes = true;
  const Records records = LogOf(WithBlock(block));
  ASSERT_EQ(records.size(), 2u);
  EXPECT_EQ(records[0].text.rfind("RSA could not verify data: ", 0), 0u) << records[0];
  EXPECT_EQ(records[1], Error(kNotVerified));
}

// A certificate with this RSAPublicKey, and a signature that fills the block.
SignatureBlock WithPublicKey(const Bytes& modulus, const Bytes& exponent, size_t signature_length) {
  Certificate certificate;
  certificate.public_key_info =
      PublicKeyInfoAround(der::Sequence({der::Integer(modulus), der::Integer(exponent)}));
  certificate.signature = der::BitString(Bytes(signature_length, 1));
  SignatureBlock block;
  block.certificates = certificate.Build();
  return block;
}

TEST(VerifyCertificate, AKeyOf2048BytesAlreadyFailsAtTheCertificate) {
  EXPECT_EQ(LogOf(WithBlock(WithPublicKey(Bytes(2048, 0x55), {1, 0, 1}, 2048))),
            Records({Error("RSA could not verify certificate: 5\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, AnEmptyKeyFailsAtTheCertificate) {
  // An INTEGER of two bytes, 0 and 1, is the one-byte modulus 1; its length bounds the exponent.
  EXPECT_EQ(LogOf(WithBlock(WithPublicKey({0, 1}, {}, 256))),
            Records({Error("RSA could not verify certificate: 5\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, AnExponentThatRunsIntoTheModulusLengthStaysInTheBlock) {
  for (const Bytes& length : {FromHex("ffffff7f"), FromHex("ffffffff"), FromHex("00100000")}) {
    const Bytes exponent = Concat({FromHex("01000100"), length});
    EXPECT_EQ(LogOf(WithBlock(WithPublicKey(Bytes(256, 0x55), exponent, 256))),
              Records({Error("RSA could not set key: 5\n"), Error(kNotVerified)}));
  }
}

TEST(VerifyCertificate, AModulusThatEndsWithTheBlockIsRead) {
  // The exponent's second half says how long the modulus is: up to the block's last byte, then one
  // more.
  const auto block_with_length = [](uint32_t length) {
    Bytes exponent = FromHex("01000100");
    for (int i = 0; i < 4; ++i) exponent.push_back(static_cast<uint8_t>(length >> (8 * i)));
    SignatureBlock block = WithPublicKey(Bytes(256, 0x55), exponent, 256);
    block.encrypted_digest = der::OctetString(Bytes(256, 1));
    return block;
  };
  const Bytes bytes = block_with_length(0).Build({});
  const Bytes modulus(256, 0x55);
  const auto start = std::search(bytes.begin(), bytes.end(), modulus.begin(), modulus.end());
  const auto rest = static_cast<uint32_t>(bytes.end() - start);

  EXPECT_EQ(LogOf(WithBlock(block_with_length(rest))),
            Records({Error("RSA could not verify certificate: 5\n"), Error(kNotVerified)}));
  EXPECT_EQ(LogOf(WithBlock(block_with_length(rest + 1))),
            Records({Error("RSA could not set key: 5\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, ACertificateSignatureThatTheBlockEndsBeforeFails) {
  SignatureBlock block = WithPublicKey(Bytes(512, 0x55), {1, 0, 1}, 1);
  block.encrypted_digest = der::OctetString({1});
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("RSA could not verify certificate: 5\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, ASignatureThatTheBlockEndsBeforeFails) {
  SignatureBlock block;
  block.encrypted_digest = der::OctetString({1});
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("RSA could not verify data: 5\n"), Error(kNotVerified)}));
}

// The package whose block holds, for the signature, what `encode` makes of it.
template <typename Encode>
PackageOptions WithEncodedSignature(Encode encode) {
  PackageOptions options;
  const Bytes signature_file = MakePackage(options).Item("META-INF/CERT.SF").data;
  options.block.encrypted_digest = encode(SignWith("rsa-2048", Digest::kSha256, signature_file));
  return options;
}

TEST(VerifyCertificate, ALongerSignatureStringIsReadAsFarAsTheKeyIsLong) {
  EXPECT_EQ(LogOf(WithEncodedSignature([](Bytes signature) {
              signature.push_back(0xaa);
              return der::OctetString(signature);
            })),
            Records());
}

TEST(VerifyCertificate, AShorterSignatureStringIsReadBeyondItsEnd) {
  EXPECT_EQ(LogOf(WithEncodedSignature([](const Bytes& signature) {
              const Bytes shorter(signature.begin(), signature.end() - 1);
              return Concat({der::OctetString(shorter), {signature.back()}});
            })),
            Records());
}

TEST(VerifyCertificate, AShorterSignatureStringAtTheBlocksEndFails) {
  EXPECT_EQ(LogOf(WithEncodedSignature([](const Bytes& signature) {
              return der::OctetString(Bytes(signature.begin(), signature.end() - 1));
            })),
            Records({Error("RSA could not verify data: 5\n"), Error(kNotVerified)}));
}

// VerifyCertificate by itself, on the block over this signature file.
struct Verification {
  bool verified;
  Bytes key;
};
Verification Verify(SignatureBlock block, const std::string& covered, const std::string& claimed) {
  LogCapture log;
  Apk apk(-1);
  Bytes bytes = block.Build(ToBytes(covered));
  Bytes sha1 = DigestOf(Digest::kSha1, ToBytes(claimed));
  Bytes sha256 = DigestOf(Digest::kSha256, ToBytes(claimed));
  Bytes md5 = DigestOf(Digest::kMd5, ToBytes(claimed));
  Verification result{false, ToBytes("before")};
  result.verified = apk.VerifyCertificate(bytes, sha1, sha256, md5, result.key);
  return result;
}

TEST(VerifyCertificate, TheKeyIsReplacedOnSuccess) {
  const Verification result = Verify({}, "signature file", "signature file");
  EXPECT_TRUE(result.verified);
  EXPECT_EQ(result.key, ModulusOf("rsa-2048"));
}

TEST(VerifyCertificate, TheKeyIsUntouchedOnFailure) {
  const Verification result = Verify({}, "signature file", "other file");
  EXPECT_FALSE(result.verified);
  EXPECT_EQ(result.key, ToBytes("before"));
}

TEST(VerifyCertificate, ABlockCutShortAnywhereFailsWithoutHarm) {
  const Bytes whole = SignatureBlock().Build(ToBytes("signature file"));
  Bytes sha1 = DigestOf(Digest::kSha1, ToBytes("signature file"));
  Bytes sha256 = DigestOf(Digest::kSha256, ToBytes("signature file"));
  Bytes md5 = DigestOf(Digest::kMd5, ToBytes("signature file"));
  LogCapture log;
  Apk apk(-1);
  testing::internal::CaptureStdout();
  for (size_t length = 0; length < whole.size(); ++length) {
    Bytes cut(whole.begin(), whole.begin() + static_cast<ptrdiff_t>(length));
    cut.shrink_to_fit();
    Bytes key;
    EXPECT_FALSE(apk.VerifyCertificate(cut, sha1, sha256, md5, key)) << length;
  }
  testing::internal::GetCapturedStdout();
}

// ---- The digest of the manifest.

Records RefusedTwice() {
  return {Error("Can't validate manifest.\n"), Error("Can't validate manifest.\n")};
}

// A section of "-Digest-Manifest" attributes, each over the package's manifest or over other bytes.
JarText ManifestDigests(const std::vector<std::string>& right,
                        const std::vector<std::string>& wrong) {
  const Bytes manifest = MakePackage().Item(kManifestName).data;
  return JarText().Digests(right, manifest, "-Manifest").Digests(wrong, {}, "-Manifest");
}

Records LogOfDigests(const std::vector<std::string>& right, const std::vector<std::string>& wrong) {
  return LogOf(WithSignatureFile(ManifestDigests(right, wrong).EndSection().text()));
}

TEST(ValidateManifest, Sha256AloneIsUsed) {
  EXPECT_EQ(LogOfDigests({"SHA-256-Digest"}, {}), Records());
  EXPECT_EQ(LogOfDigests({}, {"SHA-256-Digest"}), RefusedTwice());
}

TEST(ValidateManifest, Sha1AloneIsUsed) {
  EXPECT_EQ(LogOfDigests({"SHA1-Digest"}, {}), Records());
  EXPECT_EQ(LogOfDigests({}, {"SHA1-Digest"}), RefusedTwice());
}

TEST(ValidateManifest, OfBothSha1AloneIsUsed) {
  EXPECT_EQ(LogOfDigests({"SHA1-Digest"}, {"SHA-256-Digest"}), Records());
  EXPECT_EQ(LogOfDigests({"SHA-256-Digest"}, {"SHA1-Digest"}), RefusedTwice());
}

TEST(ValidateManifest, Md5LosesToBothOthers) {
  EXPECT_EQ(LogOfDigests({"SHA1-Digest"}, {"MD5-Digest"}), Records());
  EXPECT_EQ(LogOfDigests({"SHA-256-Digest"}, {"MD5-Digest"}), Records());
}

TEST(ValidateManifest, Md5AloneIsUnsupported) {
  EXPECT_EQ(LogOfDigests({"MD5-Digest"}, {}),
            Records({Error("verifyData: Unsupported digest type: MD5-Digest\n"),
                     Error("Can't validate manifest.\n"), Error("Can't validate manifest.\n")}));
}

TEST(ValidateManifest, ASignatureFileWithoutTheDigestIsRefused) {
  EXPECT_EQ(LogOf(WithSignatureFile("Signature-Version: 1.0\r\n\r\n")), RefusedTwice());
}

TEST(ValidateManifest, ASignatureFileWhoseSectionDoesNotEndHasNoDigest) {
  EXPECT_EQ(LogOf(WithSignatureFile(ManifestDigests({"SHA1-Digest"}, {}).text())), RefusedTwice());
}

TEST(ValidateManifest, TheMainAttributesDigestIsIgnored) {
  const Bytes manifest = MakePackage().Item(kManifestName).data;
  EXPECT_EQ(LogOf(WithSignatureFile(
                JarText()
                    .Digests({"SHA-256-Digest"}, manifest, "-Manifest-Main-Attributes")
                    .EndSection()
                    .text())),
            RefusedTwice());
}

TEST(ValidateManifest, TheFirstSectionMayHaveNoDigest) {
  EXPECT_EQ(LogOf(WithSignatureFile("Signature-Version: 1.0\r\n\r\n" +
                                    ManifestDigests({"SHA-256-Digest"}, {}).EndSection().text())),
            Records());
}

TEST(ValidateManifest, TheFirstSectionWithADigestDecides) {
  const std::string wrong = ManifestDigests({}, {"SHA-256-Digest"}).EndSection().text();
  const std::string right = ManifestDigests({"SHA-256-Digest"}, {}).EndSection().text();
  EXPECT_EQ(LogOf(WithSignatureFile(wrong + right)), RefusedTwice());
  EXPECT_EQ(LogOf(WithSignatureFile(right + wrong)), Records());
}

TEST(ValidateManifest, ADigestThatDoesNotDecodeIsRefused) {
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

TEST(ValidateManifest, ANameThatIsTheSuffixAloneIsAMatchWithoutAnAlgorithm) {
  EXPECT_EQ(LogOf(WithSignatureFile("-Digest-Manifest: AAAA\r\n\r\n")),
            Records({Error("verifyData: Unsupported digest type: -Digest\n"),
                     Error("Can't validate manifest.\n"), Error("Can't validate manifest.\n")}));
}

TEST(ValidateManifest, WithoutAValidSignatureFileItIsRefused) {
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  EXPECT_FALSE(apk.ValidateManifest(ToBytes("manifest")));
  EXPECT_EQ(log.records(), Records({Error("Can't validate manifest. Bad SF file.\n")}));
}

// ---- Digests by the names of their attributes.

class VerifyData : public testing::Test {
 protected:
  VerifyData() : apk_(-1) { log_.Clear(); }

  LogCapture log_;
  Apk apk_;
  // FIPS 180-4: the digests of "abc".
  const Bytes sha1_ = FromHex("a9993e36 4706816a ba3e2571 7850c26c 9cd0d89d");
  const Bytes sha256_ =
      FromHex("ba7816bf 8f01cfea 414140de 5dae2223 b00361a3 96177a9c b410ff61 f20015ad");
  const Bytes abc_ = ToBytes("abc");
};

TEST_F(VerifyData, TheNameSelectsTheDigest) {
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

TEST_F(VerifyData, AnExpectedDigestOneByteShortOrLongIsAMismatch) {
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
  for (const char* name : {"", "MD5-Digest", "SHA-512-Digest", "SHA-1-Digest", "sha1-digest",
                           "SHA1-Digest ", "SHA256-Digest"}) {
    log_.Clear();
    EXPECT_FALSE(apk_.VerifyData(name, sha1_, abc_));
    EXPECT_EQ(log_.records(),
              Records({Error(std::string("verifyData: Unsupported digest type: ") + name + "\n")}));
  }
}

}  // namespace
