// The facts of a JAR signature. The tool's own code finds some of them, and other parsers find the
// rest.
#include <gtest/gtest.h>

#include <algorithm>

#include "simulator/package/facts.h"
#include "support/files.h"
#include "support/package.h"

using namespace simulator;

namespace {

PackageFacts FactsOf(const Package& package) { return LookAt(DiskFile(package.Build()).path()); }

JarSignatureFacts SignatureOf(const Package& package) { return FactsOf(package).jar; }

// A package whose certificate has the RSAPublicKey of `modulus` and `exponent`.
Package WithKey(const Bytes& modulus, const Bytes& exponent) {
  Certificate certificate;
  certificate.public_key_info =
      PublicKeyInfoAround(der::Sequence({der::Integer(modulus), der::Integer(exponent)}));
  PackageOptions options;
  options.block.certificates = certificate.Build();
  return MakePackage(options);
}

Bytes Modulus() { return ModulusOf("rsa-2048"); }

std::string DigestOfModulus(const Bytes& bytes) { return Hex(DigestOf(Digest::kSha256, bytes)); }

const Bytes kExponent = {1, 0, 1};

}  // namespace

TEST(KeyReadByTool, IsThatOfTheCertificate) {
  const JarSignatureFacts jar = SignatureOf(WithKey(Concat({{0}, Modulus()}), kExponent));
  ASSERT_TRUE(jar.key.has_value());
  EXPECT_EQ(jar.key->modulus_sha256, DigestOfModulus(Modulus()));
  EXPECT_EQ(jar.key->size, 256U);
  EXPECT_EQ(jar.key->bits, 2048);
  EXPECT_FALSE(jar.key->is_forgeable);
  ASSERT_TRUE(jar.certificate.has_value());
  EXPECT_EQ(jar.certificate->key.modulus_sha256, jar.key->modulus_sha256);
  EXPECT_FALSE(jar.names_other_certificate);
}

// The last four bytes of an eight-byte exponent overwrite the tool's modulus length. In this test,
// these four bytes are 100 in the byte order of the host.
TEST(KeyReadByTool, MayBeAPartOfTheModulus) {
  const JarSignatureFacts jar =
      SignatureOf(WithKey(Concat({{0}, Modulus()}), {1, 0, 1, 0, 100, 0, 0, 0}));
  ASSERT_TRUE(jar.key.has_value());
  const Bytes modulus = Modulus();
  EXPECT_EQ(jar.key->modulus_sha256, DigestOfModulus({modulus.begin(), modulus.begin() + 100}));
  EXPECT_EQ(jar.key->size, 100U);
}

// The tool removes only one leading zero, even if there are more.
TEST(KeyReadByTool, MayBeginWithAZero) {
  const JarSignatureFacts jar = SignatureOf(WithKey(Concat({{0, 0}, Modulus()}), kExponent));
  ASSERT_TRUE(jar.key.has_value());
  EXPECT_EQ(jar.key->modulus_sha256, DigestOfModulus(Concat({{0}, Modulus()})));
  EXPECT_EQ(jar.key->size, 257U);
  EXPECT_EQ(jar.key->bits, 2048);
}

TEST(KeyReadByTool, IsForgeableWithExponentOneOrMinusOne) {
  const auto key = [](const Bytes& exponent) {
    return SignatureOf(WithKey(Concat({{0}, Modulus()}), exponent)).key.value_or(ToolKey());
  };
  EXPECT_TRUE(key({1}).is_forgeable);
  EXPECT_TRUE(key({1, 0, 0, 0}).is_forgeable);
  EXPECT_EQ(key({1}).exponent, 1);
  EXPECT_TRUE(key({0xff, 0xff, 0xff, 0xff}).is_forgeable);
  EXPECT_EQ(key({0xff, 0xff, 0xff, 0xff}).exponent, -1);
  EXPECT_FALSE(key({3}).is_forgeable);
}

TEST(KeyReadByTool, IsEmptyIfItEndsBeyondTheBlock) {
  const JarSignatureFacts jar =
      SignatureOf(WithKey(Concat({{0}, Modulus()}), {1, 0, 1, 0, 0xff, 0xff, 0xff, 0x7f}));
  EXPECT_FALSE(jar.key.has_value());
}

TEST(KeyReadByTool, IsEmptyForAnEcKey) {
  PackageOptions options;
  options.block.key = "ec-p256";
  const JarSignatureFacts jar = SignatureOf(MakePackage(options));
  EXPECT_FALSE(jar.key.has_value());
  ASSERT_TRUE(jar.certificate.has_value());
  EXPECT_EQ(jar.certificate->key.algorithm, "EC");
}

// The facts have no certificate if the strict DER parser does not find the certificate that the
// tool reads.
TEST(JarSignatureFacts, CertificateIsMissingIfTheBlockIsNotDer) {
  Package package = MakePackage();
  Bytes& block = package.Item("META-INF/CERT.RSA").data;
  const JarSignatureFacts before = SignatureOf(package);
  ASSERT_TRUE(before.certificate.has_value());
  ASSERT_TRUE(before.block.is_whole);
  const Bytes certificate = SignatureBlock().SignerCertificate().Build();
  const auto at = std::search(block.begin(), block.end(), certificate.begin(), certificate.end());
  ASSERT_NE(at, block.end());
  // The element [0] around the certificate begins with A0 82 hh ll. This becomes A0 83 00 hh ll:
  // the length is not minimal, which DER forbids. The lengths of the elements around [0] are then
  // wrong.
  const auto inserted = block.insert(at - 2, 0);
  *(inserted - 1) = 0x83;
  const JarSignatureFacts jar = SignatureOf(package);
  EXPECT_FALSE(jar.block.is_whole);
  EXPECT_FALSE(jar.certificate.has_value());
}

TEST(JarSignatureFacts, SignerThatNamesAnotherCertificateIsSeen) {
  PackageOptions options;
  options.block.serial = der::Integer(99);
  EXPECT_TRUE(SignatureOf(MakePackage(options)).names_other_certificate);
  EXPECT_FALSE(SignatureOf(MakePackage()).names_other_certificate);
  // A block without a readable signer names no certificate. Its empty signer identifier must not be
  // compared with the key identifier of the certificate in the block.
  Certificate certificate;
  certificate.extensions = {Extension("2.5.29.14", der::OctetString({1, 2, 3}))};
  options.block.certificates = certificate.Build();
  options.block.signer_infos = der::Set({});
  const JarSignatureFacts unsigned_block = SignatureOf(MakePackage(options));
  ASSERT_TRUE(unsigned_block.certificate.has_value());
  EXPECT_FALSE(unsigned_block.block.is_whole);
  EXPECT_FALSE(unsigned_block.names_other_certificate);
}

TEST(JarSignatureFacts, BlockIsTheOneThatTheToolLooksFor) {
  PackageOptions options;
  options.base_name = "META-INF/A.B";
  JarSignatureFacts jar = SignatureOf(MakePackage(options));
  EXPECT_EQ(jar.block_name, "META-INF/A.B.RSA");
  EXPECT_TRUE(jar.has_block);
  for (const char* kind : {".EC", ".DSA"}) {
    options.block_extension = kind;
    jar = SignatureOf(MakePackage(options));
    EXPECT_EQ(jar.block_name, std::string("META-INF/A.B") + kind);
    EXPECT_TRUE(jar.has_block);
  }
  options.block_extension = ".XYZ";
  jar = SignatureOf(MakePackage(options));
  EXPECT_EQ(jar.block_name, "META-INF/A.B.RSA");
  EXPECT_FALSE(jar.has_block);
}

TEST(SignatureFile, ClaimsSchemesOnlyInItsFirstSection) {
  const auto claimed = [](const std::string& text) {
    PackageOptions options;
    options.edit_signature_file = [&text](const std::string&) { return text; };
    return SignatureOf(MakePackage(options)).claimed_schemes;
  };
  EXPECT_EQ(claimed("Signature-Version: 1.0\r\nX-Android-APK-Signed: 2, 3\r\n\r\n"), "2, 3");
  EXPECT_EQ(claimed("Signature-Version: 1.0\r\n\r\nX-Android-APK-Signed: 2\r\n\r\n"), "");
  EXPECT_EQ(claimed("no signature file"), "");
}

// Only the first section with a digest of the manifest counts.
TEST(SignatureFile, MayHaveTheManifestsSha1Digest) {
  const auto has_sha1 = [](const std::string& text) {
    PackageOptions options;
    options.edit_signature_file = [&text](const std::string&) { return text; };
    return SignatureOf(MakePackage(options)).has_sha1_of_manifest;
  };
  EXPECT_TRUE(has_sha1("SHA1-Digest-Manifest: x\r\n\r\n"));
  EXPECT_TRUE(has_sha1("A: 1\r\n\r\nSHA1-Digest-Manifest: x\r\n\r\n"));
  EXPECT_FALSE(has_sha1("SHA-256-Digest-Manifest: x\r\n\r\nSHA1-Digest-Manifest: x\r\n\r\n"));
  EXPECT_FALSE(has_sha1("SHA-512-Digest-Manifest: x\r\n\r\n"));
  EXPECT_FALSE(has_sha1("SHA1-Digest-Manifest-Main-Attributes: x\r\n\r\n"));
}

TEST(SignatureFile, StatesADigestOfTheManifest) {
  const auto states = [](const std::string& text) {
    PackageOptions options;
    options.edit_signature_file = [&text](const std::string&) { return text; };
    return SignatureOf(MakePackage(options)).has_manifest_digest;
  };
  EXPECT_TRUE(states("A: 1\r\n\r\nSHA-512-Digest-Manifest: x\r\n\r\n"));
  EXPECT_TRUE(states("SHA1-Digest-Manifest: x\r\n\r\nA: 1\r\n\r\n"));
  EXPECT_FALSE(states("SHA1-Digest-Manifest-Main-Attributes: x\r\n\r\n"));
}
